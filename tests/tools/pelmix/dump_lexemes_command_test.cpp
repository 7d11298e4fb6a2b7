// pelmix dump lexemes: the lexicon lines the engine's word finders match, as the trainer
// reads them.
#include <gtest/gtest.h>

#include <filesystem>

#include "tests/tools/pelmix/cli_runner.h"

namespace {

using pelmix::testing::RunCli;

class DumpLexemes : public pelmix::testing::CliTest {
 protected:
  // The example knowledge base with this lexicon, packed.
  std::string Kb(const std::string& lexdb) {
    const std::string src = Path("kb");
    std::filesystem::copy(PELMIX_SOURCE_DIR "/examples/kb", src,
                          std::filesystem::copy_options::recursive);
    Write("kb/lexdb.txt", lexdb);
    const std::string out = Path("test.kb");
    const auto built = RunCli("kb build " + src + " " + out);
    EXPECT_EQ(built.status, 0) << built.err;
    return out;
  }
};

// Phrases out of their sorted order, one the loader drops (gap 0), a word that is both a
// phrase head and a lexeme, a weight of 0 (not weighed by the extractor, still matched).
constexpr char kLexicon[] =
    "#8 3 4 3 64\n"
    "verify(2)account 40 0 1\n"  // 2
    "log(1)in(3)password 35 0 8\n"
    "sign(0)up 20 0 0\n"  // 4: dropped
    "sign(1)in 20 0 0\n"  // 5
    "paypal 50 101 0\n"   // 6
    "password 30 0 1\n"   // 7
    "verify 7 0 0\n"      // 8
    "konto 0 0 0\n";      // 9

TEST_F(DumpLexemes, PageLinesAndCounts) {
  const std::string kb = Kb(kLexicon);
  // Page text reaches the extractor when a block tag flushes it (hence the last <br>).
  const std::string page = Write("page.html",
                                 "<html><head><title>Konto</title></head><body>"
                                 "<div>Please verify your account at PayPal.</div>"
                                 "<div>Sign in with your password.</div><div>Verify</div><br>"
                                 "</body></html>");
  const auto run = RunCli("dump lexemes --kb " + kb + " " + page);
  ASSERT_EQ(run.status, 0) << run.err;
  EXPECT_EQ(run.out,
            "{\"file\":\"" + page + "\",\"lines\":[2,5,6,7,8,9],\"counts\":[1,1,1,1,2,1]}\n");
}

TEST_F(DumpLexemes, MailSubjectAndBodyAndMboxTogether) {
  const std::string kb = Kb(kLexicon);
  const std::string one = Write("one.eml",
                                "From: a@example.net\nSubject: Verify\n"
                                "Content-Type: text/plain\n\nSign in with your password\n");
  const std::string two = Write("two.mbox",
                                "From a@example.net Mon Dec  7 00:00:00 2026\n"
                                "Subject: konto\n\nPayPal\n"
                                "From b@example.net Mon Dec  7 00:00:00 2026\n"
                                "Subject: PayPal\n\nhello\n");
  const auto run = RunCli("dump lexemes --kb " + kb + " --mail " + one + " " + two);
  ASSERT_EQ(run.status, 0) << run.err;
  EXPECT_EQ(run.out, "{\"file\":\"" + one +
                         "\",\"lines\":[5,7,8],\"counts\":[1,1,1]}\n"
                         "{\"file\":\"" +
                         two + "\",\"lines\":[6,9],\"counts\":[2,1]}\n");
}

TEST_F(DumpLexemes, FaultsAndCommandLine) {
  const std::string kb = Kb(kLexicon);
  const auto missing = RunCli("dump lexemes --kb " + kb + " " + Path("absent.html"));
  EXPECT_EQ(missing.status, 1);
  EXPECT_NE(missing.out.find("\"error\":"), std::string::npos);
  EXPECT_EQ(RunCli("dump lexemes --kb " + kb).status, 64);
  EXPECT_EQ(RunCli("dump lexemes --bogus x").status, 64);
  EXPECT_EQ(RunCli("dump lexemes --kb " + Path("none.kb") + " " + Path("absent.html")).status, 2);
}

}  // namespace
