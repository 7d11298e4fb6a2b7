// The dump commands, run as the built CLI on files and on stdin.
#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <filesystem>
#include <fstream>
#include <string>

namespace {

struct Outcome {
  int exitCode = -1;
  std::string out;
};

Outcome RunCli(const std::string& arguments) {
  const std::string command = std::string(PELMIX_CLI_PATH) + " " + arguments + " 2>/dev/null";
  Outcome outcome;
  std::FILE* pipe = popen(command.c_str(), "r");
  if (pipe == nullptr) return outcome;
  char buffer[4096];
  std::size_t n;
  while ((n = std::fread(buffer, 1, sizeof buffer, pipe)) > 0) outcome.out.append(buffer, n);
  const int status = pclose(pipe);
  outcome.exitCode = WIFEXITED(status) ? WEXITSTATUS(status) : -1;
  return outcome;
}

class DumpCommands : public testing::Test {
 protected:
  void SetUp() override {
    dir_ =
        std::filesystem::temp_directory_path() / ("pelmix-dump-test-" + std::to_string(getpid()));
    std::filesystem::create_directories(dir_);
  }
  void TearDown() override { std::filesystem::remove_all(dir_); }

  std::string File(const std::string& name, const std::string& content) {
    const std::filesystem::path path = dir_ / name;
    std::ofstream(path, std::ios::binary) << content;
    return path.string();
  }

  std::filesystem::path dir_;
};

TEST_F(DumpCommands, TokensOnAFileWithEveryEventKind) {
  const std::string page = "x<P Class=\"a\\\"b\">\xE9<!-- c --><script>s(1)</script><br/></p><";
  const std::string path = File("page.html", page);
  const Outcome outcome = RunCli("dump tokens " + path);
  EXPECT_EQ(outcome.exitCode, 0);
  EXPECT_EQ(outcome.out,
            "{\"ev\":\"text\",\"data\":\"x\"}\n"
            "{\"ev\":\"open\",\"name\":\"p\"}\n"
            "{\"ev\":\"attr\",\"name\":\"class\"}\n"
            "{\"ev\":\"value\",\"data\":\"a\\\\\"}\n"
            "{\"ev\":\"attr\",\"name\":\"b\\\"\"}\n"
            "{\"ev\":\"tagend\"}\n"
            "{\"ev\":\"text\",\"data\":\"\\u00e9\"}\n"
            "{\"ev\":\"comment\",\"data\":\" c --\"}\n"
            "{\"ev\":\"comment_end\"}\n"
            "{\"ev\":\"open\",\"name\":\"script\"}\n"
            "{\"ev\":\"tagend\"}\n"
            "{\"ev\":\"script\",\"data\":\"s(1)\"}\n"
            "{\"ev\":\"close\",\"name\":\"script\"}\n"
            "{\"ev\":\"open\",\"name\":\"br\"}\n"
            "{\"ev\":\"tagend\"}\n"
            "{\"ev\":\"close\",\"name\":\"br\"}\n"
            "{\"ev\":\"close\",\"name\":\"p\"}\n");
  // The same events from stdin and whatever the chunk size.
  EXPECT_EQ(RunCli("dump tokens --chunk 1 - < " + path).out, outcome.out);
  EXPECT_EQ(RunCli("dump tokens --chunk 7 " + path).out, outcome.out);
}

TEST_F(DumpCommands, StringsJsonDataUrlAndEntity) {
  EXPECT_EQ(RunCli("dump strings " + File("s.js", "a = 'x\\ty' + b / 2; c = \"open")).out,
            "{\"ev\":\"text\",\"data\":\"x\"}\n"
            "{\"ev\":\"text\",\"data\":\"\\u0009\"}\n"
            "{\"ev\":\"text\",\"data\":\"y'\"}\n"
            "{\"ev\":\"text\",\"data\":\"open\"}\n");
  EXPECT_EQ(RunCli("dump json " + File("ok.json", "{\"a\": [1, true]}\n")).out,
            "{\"accepted\":true}\n");
  EXPECT_EQ(RunCli("dump json --chunk 2 " + File("bad.json", "[1 2]")).out,
            "{\"accepted\":false}\n");
  EXPECT_EQ(RunCli("dump dataurl - < " + File("u.txt", "'data:text/html;base64,PGI+aGk8L2I+'")).out,
            "{\"media_type\":\"text/html\",\"data\":\"<b>hi</b>\"}\n");
  EXPECT_EQ(RunCli("dump entity lt").out, "{\"ok\":true,\"data\":\"<\"}\n");
  EXPECT_EQ(RunCli("dump entity Lt").out, "{\"ok\":false}\n");
  EXPECT_EQ(RunCli("dump entity '#233'").out, "{\"ok\":true,\"data\":\"\\u00c3\\u00a9\"}\n");
}

TEST_F(DumpCommands, BadArgumentsAndInputs) {
  EXPECT_EQ(RunCli("dump tokens").exitCode, 64);
  EXPECT_EQ(RunCli("dump tokens a b").exitCode, 64);
  EXPECT_EQ(RunCli("dump json --chunk 0 -").exitCode, 64);
  EXPECT_EQ(RunCli("dump entity").exitCode, 64);
  EXPECT_EQ(RunCli("dump strings " + (dir_ / "missing.js").string()).exitCode, 1);
}

}  // namespace
