// The whole decrunch pipeline, nested pipelines included, gives the same calls whether a page
// arrives in one piece, byte by byte or in random chunks.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "tests/engine/html/decrunch_test_support.h"
#include "tests/engine/html/scan_test_support.h"

namespace {

std::string Refresh(const std::string& page) {
  return "<meta http-equiv=\"refresh\" content=\"0; url='data:text/html;base64," +
         decrunch_test::Base64(page) + "'\">";
}

std::vector<std::string> TrickyPages() {
  const std::string inner = "<title>In &eacute;</title><a href=/in>link</a><br>" +
                            Refresh("<a href=/deeper>two levels down</a><div>");
  return {
      // a data-URL page behind a meta refresh, itself holding one
      "<html><head>" + Refresh(inner) + "<meta name=description content='D&amp;d'></head>",
      // HTML inside a script string that itself holds a script, and escapes cut anywhere
      "<script>document.write('<p>Hi<script>x = \"%253Ca href=%2522/s%2522>deep</a><br>\";"
      "<\\/script><a href=\\'/q\\'>\\u0041nchor</a><br>');</script>after<br>",
      // anchors inside selects, options with and without their end tags
      "<select><option>One<a href=/o>A</a><option>Two</option><a href=/p>B<option>Three"
      "</select><select><option>x</select>tail<br>",
      // titles with character references, one cut by the end of the title
      "<title>Bank &amp; Trust &#x20AC;&#233;&nope; &amp</title>;<title>&lt;T&gt;</title><br>",
      // URLs split across script-string hand-overs, with comments and a long text
      "<script>var a = '" + std::string(995, 'a') + "https://split.example/a/b%2Fc';" +
          "var b = \"" + std::string(2000, 'b') + "http://x.test/" + std::string(2100, 'p') +
          "\";</script><!-- note --><p>" + std::string(2345, 't') + "&amp;" +
          std::string(990, 'u') + "&eacute;<br>",
      // forms and inputs
      "<form action=/l><input type=text placeholder='E&amp;mail'><input type=radio value=R>"
      "<input type=hidden value=h><input type=image src=/i%20.png><img src=x alt=y></form>",
  };
}

TEST(DecrunchChunkInvariance, TrickyPages) {
  for (const std::string& page : TrickyPages()) {
    // Every page must say something, or the comparison would prove nothing.
    ASSERT_GT(decrunch_test::Decrunched(page).size(), 3u) << page;
    html_test::ExpectChunkInvariant(page, [](const std::vector<std::string_view>& chunks) {
      return decrunch_test::Decrunched(chunks);
    });
  }
}

}  // namespace
