#include <gtest/gtest.h>

#include <cstdio>
#include <fstream>

#include "tests/engine/pdf/pdf_test_support.h"
#include "tests/tools/pelmix/cli_runner.h"

namespace {

using pelmix::testing::CliRun;
using pelmix::testing::RunCli;

TEST(DumpPdfCommand, TextLinksAndRawEvents) {
  const std::string path = testing::TempDir() + "dump_pdf_command_test.pdf";
  const std::string content = "BT\n(Caf\xE9 \"1\") Tj\nET\n/URI (http://in.example/)";
  {
    std::ofstream file(path, std::ios::binary);
    file << "%PDF-1.4\n"
         << pdf_test::ContentObject(3, content)
         << pdf_test::StreamObject(4, "/Subtype /Image", "\x01\x02")
         << pdf_test::Object(5, "<< /URI (http://dict.example/) >>");
  }
  const CliRun dump = RunCli("dump pdf " + path);
  EXPECT_EQ(dump.status, 0);
  EXPECT_EQ(dump.out,
            "{\"ev\":\"text\",\"data\":\"Caf\\u00e9 \\\"1\\\"\"}\n"
            "{\"ev\":\"link\",\"data\":\"http://in.example/\"}\n"
            "{\"ev\":\"link\",\"data\":\"http://dict.example/\"}\n");
  const CliRun raw = RunCli("dump pdf --raw - < " + path);
  EXPECT_EQ(raw.status, 0);
  const std::string packedLength = std::to_string(pdf_test::Deflate(content).size() + 2);
  EXPECT_EQ(raw.out,
            "{\"ev\":\"object\",\"num\":3,\"gen\":0}\n{\"ev\":\"stream\",\"image\":false}\n"
            "{\"ev\":\"stream_end\",\"bytes\":" +
                packedLength +
                "}\n"
                "{\"ev\":\"object_end\"}\n{\"ev\":\"object\",\"num\":4,\"gen\":0}\n"
                "{\"ev\":\"stream\",\"image\":true}\n{\"ev\":\"stream_end\",\"bytes\":4}\n"
                "{\"ev\":\"object_end\"}\n{\"ev\":\"object\",\"num\":5,\"gen\":0}\n"
                "{\"ev\":\"link\",\"data\":\"http://dict.example/\"}\n"
                "{\"ev\":\"object_end\"}\n");
  EXPECT_EQ(RunCli("dump pdf --bogus " + path).status, 64);
  EXPECT_EQ(RunCli("dump pdf /nonexistent/x.pdf 2>/dev/null").status, 1);
  std::remove(path.c_str());
}

}  // namespace
