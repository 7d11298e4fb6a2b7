// The categorised hosts writer: the source grammar and round trips through the reader.
#include "tools/kbtools/hpdb_writer.h"

#include <gtest/gtest.h>

#include "engine/kb/categorized_hosts.h"
#include "engine/kb/readable_buffer.h"
#include "tools/kbtools/source_text.h"

namespace {

using pelmix::kbtools::CompileCategorisedHosts;

std::string ErrorOf(const std::string& text) {
  try {
    CompileCategorisedHosts(text, "categorised_hosts.txt");
  } catch (const pelmix::kbtools::SourceError& e) {
    return e.what();
  }
  return "no error";
}

TEST(HpdbWriter, RoundTrip) {
  const std::string bytes = CompileCategorisedHosts(
      "# phishing kit\n"
      "Phish.Example 3 0x5   # mask in hex\n"
      "phish.example/Login/ 4\n"
      "phish.example/account 5\n"
      "\n"
      "malware.example 7 18446744073709551615\r\n"
      "plain.example 0\n"
      "phish.example/a/ 6\n"
      "phish.example/a/b 6\n",
      "categorised_hosts.txt");
  const hpdb::HashedCatHostsPathes db(std::make_shared<util::ReadableBuffer>(
      bytes.data(), static_cast<std::uint32_t>(bytes.size())));
  const auto ask = [&](const std::string& host, const std::string& path) {
    std::uint16_t category = 0;
    std::uint64_t mask = 0;
    bool no_paths = false;
    if (!db.lookup(host, path, category, mask, no_paths)) return std::string("absent");
    return std::to_string(category) + " " + std::to_string(mask) + (no_paths ? " no_paths" : "");
  };
  EXPECT_EQ(ask("phish.example", "/login/form"), "4 5");
  EXPECT_EQ(ask("phish.example", "/account"), "5 5");
  EXPECT_EQ(ask("phish.example", "/accounts"), "3 5");
  EXPECT_EQ(ask("PHISH.example", "/A/B"), "6 5");
  EXPECT_EQ(ask("malware.example", "/"), "7 18446744073709551615 no_paths");
  EXPECT_EQ(ask("plain.example", "/"), "0 0 no_paths");
  EXPECT_EQ(ask("www.phish.example", "/"), "absent");
  EXPECT_EQ(CompileCategorisedHosts("# nothing\n", "x"), "");
}

TEST(HpdbWriter, ErrorsNameTheLine) {
  const std::pair<std::string, std::string> cases[] = {
      {"a.com\n", "categorised_hosts.txt:1: expected HOST CATEGORY [MASK] or HOST/PATH CATEGORY"},
      {"a.com 65536\n", "categorised_hosts.txt:1: category must be 0 to 65535, got 65536"},
      {"a.com x\n", "categorised_hosts.txt:1: category must be 0 to 65535, got x"},
      {"a.com 1 0x\n", "categorised_hosts.txt:1: mask must be a 64-bit number, got 0x"},
      {"a.com 1 18446744073709551616\n",
       "categorised_hosts.txt:1: mask must be a 64-bit number, got 18446744073709551616"},
      {"\na.com/p 1\n",
       "categorised_hosts.txt:2: path for host a.com, which no earlier line names"},
      {"a.com 1\na.com/p 1 5\n", "categorised_hosts.txt:2: a path line takes no mask"},
      {"a.com 1\nA.COM 2\n", "categorised_hosts.txt:2: host a.com is listed twice"},
      {"/p 1\n", "categorised_hosts.txt:1: path for host , which no earlier line names"},
      {"a.com 1\na.com/x/ 2\na.com/x/y 3\n",
       "categorised_hosts.txt:3: a.com/x/y would be found with category 2: an earlier path of "
       "its host covers it"},
  };
  for (const auto& [text, error] : cases) EXPECT_EQ(ErrorOf(text), error) << text;
  EXPECT_EQ(ErrorOf("a.com 1\na.com/x/ 2\na.com/x/y 2\n"), "no error");
}

}  // namespace
