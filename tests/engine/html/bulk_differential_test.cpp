// The bulk paths against the byte-at-a-time machine: with bulk scanning turned off every
// byte goes through process(), which is the reference. Random pages made of the bytes and
// constructs that end or extend a run, fed whole and in random chunks, must give exactly the
// reference's events in every scanner and in the whole pipeline.
#include <gtest/gtest.h>

#include <random>
#include <string>
#include <vector>

#include "engine/html/json_state_machine.h"
#include "engine/html/state_machine.h"
#include "tests/engine/html/decrunch_test_support.h"
#include "tests/engine/html/scan_test_support.h"

namespace {

using html_test::Events;

// Turns the bulk paths off for its lifetime.
class Bytewise {
 public:
  Bytewise() { util::setBulkScanning(false); }
  ~Bytewise() { util::setBulkScanning(true); }
};

std::string RunOf(std::mt19937& random, char c, std::size_t max) {
  return std::string(1 + random() % max, c);
}

// Pieces that matter to some run: its ends ('<', '>', quotes, '&', '%', '\\', '/', line
// feeds, blanks), the constructs that start runs (tags with collected, streamed and skipped
// values, comments, raw text, script strings, refreshes), and long runs around the text
// buffer sizes.
std::string RandomPage(std::mt19937& random) {
  static const std::vector<std::string> pieces = {
      "<",
      ">",
      "/",
      "</",
      "=",
      "\"",
      "'",
      " ",
      "\n",
      "\t",
      "&",
      "&amp;",
      "&#x41;",
      "&nope;",
      "%",
      "%3C",
      "%4",
      "\\",
      "\\u0041",
      "\\u12",
      "\\'",
      "\\\"",
      "-",
      "--",
      "-->",
      "<!--",
      // Tag names: read in bulk up to their end, or to a '-' that makes them a comment.
      "!",
      "<!-",
      "<DiV",
      "</DiV  >",
      "<my-long-element-name x=1>",
      "</My-Long-Element-Name>",
      "*",
      "/*",
      "*/",
      "//",
      "(",
      "=",
      ";",
      ",",
      "x",
      "A",
      "\x80",
      "\xff",
      std::string(1, '\0'),
      "<p>",
      "<br>",
      "<br/>",
      "<div a=b>",
      "<a href=\"/x%41\">",
      "<a href='y'>",
      "<a href=z/>",
      "</a>",
      "<img alt=\"Alt &amp; text\" src=i.png>",
      "<img alt=un/quoted src=/s>",
      "<input type=submit value=Go>",
      "<input type=image src=/i>",
      "<title>",
      "</title>",
      "<select><option>",
      "<option>",
      "</select>",
      "<script>",
      "</script>",
      "</SCRIPT>",
      "<script src=/s.js>",
      "<style>",
      "</style>",
      "<noscript>",
      "</noscript>",
      "<meta ",
      "<meta name=description content=\"",
      "<meta http-equiv=refresh content=\"",
      "<meta content='0; URL = ",
      "0;url=",
      "data:",
      "data:text/html,",
      "data:text/html;base64,",
      "PGEgaHJlZj0vYj5C",
      "PC9hPjxicj4=",
      "http://",
      "https://u.test/p?q=1",
      "'<a href=/j>J",
      "\"<p>in script",
      "document.write(",
      "a / b",
      "x = /re'/;",
      "{\"k\": [1, 2.5e-3, true]}",
  };
  std::string page;
  const std::size_t n = random() % 120;
  for (std::size_t i = 0; i < n; ++i) {
    switch (random() % 12) {
      case 0:
        page += RunOf(random, 't', 2100);
        break;
      case 1:
        page += RunOf(random, random() % 2 ? '&' : '-', 40);
        break;
      default:
        page += pieces[random() % pieces.size()];
        break;
    }
  }
  return page;
}

template <typename Scan>
void ExpectSameAsBytewise(const std::string& doc, std::uint32_t seed, Scan scan) {
  Events reference;
  {
    Bytewise bytewise;
    reference = scan(std::vector<std::string_view>{doc});
  }
  ASSERT_EQ(scan(std::vector<std::string_view>{doc}), reference) << "whole, seed " << seed;
  ASSERT_EQ(scan(html_test::RandomChunks(doc, seed)), reference) << "chunks, seed " << seed;
}

TEST(BulkDifferential, TokenizerUnderEveryPolicy) {
  std::mt19937 random(17);
  std::vector<html_test::RecordingHandler::Policy> policies(5);
  policies[1].defaultMode = html::kAttrStream;
  policies[2].defaultMode = html::kAttrSkip;
  policies[3].reportAttributes = false;
  policies[4].rawText = false;
  policies[4].comments = false;
  for (std::uint32_t round = 0; round < 300; ++round) {
    const std::string page = RandomPage(random);
    const auto& policy = policies[round % policies.size()];
    ExpectSameAsBytewise(page, round, [&](const std::vector<std::string_view>& chunks) {
      return html_test::Tokenize(chunks, policy);
    });
  }
}

TEST(BulkDifferential, ScriptScannerJsonAndDataUrl) {
  std::mt19937 random(1717);
  for (std::uint32_t round = 0; round < 300; ++round) {
    const std::string doc = RandomPage(random);
    ExpectSameAsBytewise(doc, round, [](const std::vector<std::string_view>& chunks) {
      return html_test::ScanScript(chunks);
    });
    ExpectSameAsBytewise(doc, round, [](const std::vector<std::string_view>& chunks) {
      utils::JSONStateMachine<char> json;
      for (std::string_view chunk : chunks) json.feed(chunk.data(), chunk.size());
      return Events{std::to_string(json.accepted()), std::to_string(json.nesting())};
    });
    ExpectSameAsBytewise(doc, round, [](const std::vector<std::string_view>& chunks) {
      html_test::ByteRecorder bytes;
      utils::DataUrlMachine decoder(bytes);
      std::size_t rejected = 0;
      for (std::string_view chunk : chunks) rejected += decoder.offer(chunk.data(), chunk.size());
      return Events{decoder.mediaType(), bytes.bytes, std::to_string(rejected)};
    });
  }
}

// Valid JSON keeps the validator in its string and number states for long runs.
TEST(BulkDifferential, JsonDocuments) {
  std::mt19937 random(7);
  for (std::uint32_t round = 0; round < 100; ++round) {
    std::string doc = "[";
    for (int i = random() % 50; i > 0; --i) {
      doc += random() % 2 ? "\"" + RunOf(random, 's', 3000) + "\\\"\\\\" + "\", " : "12.5e3, ";
    }
    doc += random() % 2 ? "{\"k\": null}]" : "<p>";
    ExpectSameAsBytewise(doc, round, [](const std::vector<std::string_view>& chunks) {
      utils::JSONStateMachine<char> json;
      for (std::string_view chunk : chunks) json.feed(chunk.data(), chunk.size());
      return Events{std::to_string(json.accepted())};
    });
  }
}

TEST(BulkDifferential, WholePipeline) {
  std::mt19937 random(4242);
  for (std::uint32_t round = 0; round < 300; ++round) {
    const std::string page = RandomPage(random);
    ExpectSameAsBytewise(page, round, [](const std::vector<std::string_view>& chunks) {
      return decrunch_test::Decrunched(chunks);
    });
  }
}

// The rejected bytes before a data URL are counted in bulk as they were one by one, so the
// decoder still gives up after the same number of them.
TEST(BulkDifferential, MetaRefreshTargetsAroundTheRejectionLimit) {
  const std::string inner = "<a href=/bottom>x</a><br>";
  for (const std::size_t junk : {std::size_t{0}, std::size_t{1}, std::size_t{1022},
                                 std::size_t{1023}, std::size_t{1024}, std::size_t{5000}}) {
    for (const std::string& junkByte : {std::string("j"), std::string("d"), std::string("da")}) {
      std::string target;
      while (target.size() < junk) target += junkByte;
      target.resize(junk);
      const std::string page = "<meta content=\"0;url=" + target + "data:text/html;base64," +
                               decrunch_test::Base64(inner) + "\"><br>";
      ExpectSameAsBytewise(page, static_cast<std::uint32_t>(junk),
                           [](const std::vector<std::string_view>& chunks) {
                             return decrunch_test::Decrunched(chunks);
                           });
    }
  }
}

}  // namespace
