// Every scanner keeps all its progress in its states: feeding a document whole, byte by byte
// or in random chunks gives the same events.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "engine/html/json_state_machine.h"
#include "tests/engine/html/scan_test_support.h"

namespace {

using html_test::Events;
using html_test::ExpectChunkInvariant;
using html_test::RecordingHandler;

const std::vector<std::string>& TrickyPages() {
  static const std::vector<std::string> pages = {
      // comments, including ones that look closed too early
      "<p>a<!-- x -- y --->b<!---->c<!-->d-->e<!-- <script> -->f<!--- - ->g-->h<",
      // closing literals cut short, in mixed case, and with a blank before '>'
      "<script>a</scr</SCRIPT</script ><</script>t<style>x</sty</STYLE><noscript><b>"
      "</noscrip</noscript>e<script src=a.js/>f</SCRIPT>g<",
      // every quoting form, self-closing forms, line feeds in values
      "<a href=x title='y z' data-x=\"1\n2\" checked w = v/><img src=a.png alt=\"An\" /><br/>"
      "<BR /><input value=a/b/ x='/'/><p a=>b<p =x>",
      // text, script and comment pieces beyond one buffer
      std::string(1500, 't') + "<script>" + std::string(2100, 's') + "</script>" + "<!--" +
          std::string(1030, 'c') + "-->" + std::string(1024, 'u') + "<",
      // an over-long tag name and odd tags
      "<" + std::string(2000, 'n') + " a=1>x</" + std::string(1500, 'm') + " >< b ><><//></br>",
      "<!DOCTYPE html><html><head><title>Sign in</title></head><body onload='go()'>"
      "<form action=\"/login\"><input type=password name=p></form></body></html>",
  };
  return pages;
}

std::vector<RecordingHandler::Policy> Policies() {
  std::vector<RecordingHandler::Policy> policies(6);
  policies[1].defaultMode = html::kAttrStream;
  policies[2].defaultMode = html::kAttrSkip;
  policies[3].reportAttributes = false;
  policies[4].rawText = false;
  policies[5].comments = false;
  policies[5].modes = {{"href", html::kAttrStream}, {"src", html::kAttrSkip}};
  return policies;
}

TEST(ChunkInvariance, Tokenizer) {
  for (const std::string& page : TrickyPages()) {
    for (const RecordingHandler::Policy& policy : Policies()) {
      ExpectChunkInvariant(page, [&](const std::vector<std::string_view>& chunks) {
        return html_test::Tokenize(chunks, policy);
      });
    }
  }
}

TEST(ChunkInvariance, JsonValidator) {
  const std::vector<std::string> docs = {
      " {\"a\\\"\\\\\": [1, -2.5e+10, true, false, null, \"x\\u0041\"], \"b\": {}} ",
      "[1,]",
      "[1 2]",
      "{\"a\":1 \"b\":2}",
      "tru",
      "truex",
      "[[[[[[",
      "\"\\",
      "[-1E-5, 0.5, \"\\\"]\", []] ",
      std::string(3000, '[') + std::string(3000, ']'),
  };
  for (const std::string& doc : docs) {
    ExpectChunkInvariant(doc, [](const std::vector<std::string_view>& chunks) {
      utils::JSONStateMachine<char> json;
      for (std::string_view chunk : chunks) json.feed(chunk.data(), chunk.size());
      return Events{"accepted " + std::to_string(json.accepted()),
                    "depth " + std::to_string(json.depth())};
    });
  }
}

TEST(ChunkInvariance, ScriptScanner) {
  const std::vector<std::string> scripts = {
      "var a = \"x\\u00e9\\u20ACy\\u41z\\\"q\" + b / 2 + '\\n\\t' + /\"[^\"]*\"/g.source;",
      "// 'comment'\n/* \"multi\n line\" **/ s = 'ok'; r = (/\\/'/); d = a / b / 'c';",
      "'" + std::string(2500, 'l') + "' \"unterminated \\u12",
      "x = '\\",
      "x = /never closed",
  };
  for (const std::string& script : scripts) {
    ExpectChunkInvariant(script, [](const std::vector<std::string_view>& chunks) {
      return html_test::ScanScript(chunks);
    });
  }
}

TEST(ChunkInvariance, DataUrlDecoder) {
  const std::vector<std::string> urls = {
      "data:text/html;base64,PGh0bWw+PGJv\r\nZHk+PC9ib2R5\n PjwvaHRtbD4=",
      "'data:text/html;charset=utf-8,%3Cb%3e%20x%zz%4g% %%41%",
      "DATA:x,data:,y",
      "data:" + std::string(3000, 'h') + ";base64,QUJD",
  };
  for (const std::string& url : urls) {
    ExpectChunkInvariant(url, [](const std::vector<std::string_view>& chunks) {
      const html_test::DecodedUrl decoded = html_test::DecodeDataUrl(chunks);
      return Events{decoded.mediaType, decoded.bytes, std::to_string(decoded.errors)};
    });
  }
}

}  // namespace
