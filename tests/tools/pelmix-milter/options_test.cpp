// pelmix-milter's command line: its defaults, each bound, the socket forms.
#include "tools/pelmix-milter/options.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

namespace {

using namespace pelmix::milter;

std::string Parse(std::vector<std::string> args, Options& options) {
  return ParseOptions(args, options);
}

TEST(MilterOptions, DefaultsListenOnLoopbackAndTag) {
  Options o;
  ASSERT_EQ(Parse({}, o), "");
  EXPECT_EQ(o.socket, "inet:8640@127.0.0.1");
  EXPECT_EQ(o.action, Action::kTag);
  EXPECT_EQ(o.onError, OnError::kAccept);
  EXPECT_EQ(o.maxMessage, kDefaultMaxMessage);
}

TEST(MilterOptions, ValuesAndTheirBounds) {
  struct Case {
    std::vector<std::string> args;
    bool ok;
  };
  const std::vector<Case> cases = {
      {{"--action", "reject"}, true},
      {{"--action=quarantine"}, true},
      {{"--action", "discard"}, false},
      {{"--on-error", "tempfail"}, true},
      {{"--on-error", "reject"}, false},
      {{"--max-message", "1"}, true},
      {{"--max-message", "33554432"}, true},
      {{"--max-message", "33554433"}, false},
      {{"--max-message", "0"}, false},
      {{"--max-message", "1k"}, false},
      {{"--timeout", "3600"}, true},
      {{"--timeout", "0"}, false},
      {{"--max-connections", "4096"}, true},
      {{"--max-connections", "4097"}, false},
      {{"--level", "3"}, true},
      {{"--level", "4"}, false},
      {{"--kb", ""}, false},
      {{"--kb"}, false},
      {{"--threads", "2"}, false},
      {{"stray"}, false},
  };
  for (const Case& c : cases) {
    Options o;
    EXPECT_EQ(Parse(c.args, o).empty(), c.ok) << c.args[0];
  }
  Options o;
  ASSERT_EQ(Parse({"--action", "reject", "--max-message", "1024", "--on-error=tempfail"}, o), "");
  EXPECT_EQ(o.action, Action::kReject);
  EXPECT_EQ(o.maxMessage, 1024u);
  EXPECT_EQ(o.onError, OnError::kTempfail);
}

TEST(MilterOptions, SocketForms) {
  for (const char* good : {"inet:8640@127.0.0.1", "inet:1@localhost", "inet6:8640@[::1]",
                           "unix:/run/pelmix/milter.sock", "local:/tmp/s"}) {
    EXPECT_TRUE(ValidSocket(good)) << good;
  }
  // A port without a host would listen on every address.
  for (const char* bad : {"inet:8640", "inet:8640@", "inet:0@127.0.0.1", "inet:65536@h", "inet:x@h",
                          "unix:", "tcp:8640@h", "/tmp/s", ""}) {
    EXPECT_FALSE(ValidSocket(bad)) << bad;
  }
}

}  // namespace
