#include "engine/kb/engine_config.h"

#include <gtest/gtest.h>

#include <bit>
#include <cmath>

#include "engine/common/error.h"
#include "tests/support/kb_test_support.h"

namespace {

using ap::EngineConfig;
using ap::ParseCfgString;

using pelmix::testing::ErrorOf;

std::pair<std::string, std::string> Parsed(std::string_view line) {
  const ap::CfgString cfg = ParseCfgString(line);
  // The parts are views into the line itself.
  EXPECT_TRUE(cfg.key.empty() || (cfg.key.data() >= line.data() &&
                                  cfg.key.data() + cfg.key.size() <= line.data() + line.size()));
  return {std::string(cfg.key), std::string(cfg.value)};
}

using Pair = std::pair<std::string, std::string>;

TEST(CfgString, KeyAndValue) {
  const std::pair<std::string_view, Pair> cases[] = {
      {"key=value;", {"key", "value"}},
      {"key \t = \t value;rest", {"key", "value"}},
      {" key=1;", {" key", "1"}},  // leading blanks belong to the key
      {"key=1 ;", {"key", "1 "}},  // blanks before ';' belong to the value
      {"key=a=b;c;", {"key", "a=b"}},
      {"=1;", {"", "1"}},
      {"key=1;\r", {"key", "1"}},
      {"k=\"a b;c\"", {"k", "a b;c"}},
      {"k= \"x\" trailing, no semicolon", {"k", "x"}},
      {R"(k="a\"b")", {"k", R"(a\"b)"}},  // escapes are kept as written
      {R"(k="a\\")", {"k", R"(a\\)"}},
      {"k=\"\"", {"k", ""}},
  };
  for (const auto& [line, parts] : cases) EXPECT_EQ(Parsed(line), parts) << line;
}

TEST(CfgString, Messages) {
  const std::pair<std::string_view, const char*> cases[] = {
      {"", "Wrong cfg string, '=' not found"},
      {"key value;", "Wrong cfg string, '=' not found"},
      {"key= ;", "No value in cfg string"},
      {"key=1", "';' not found in cfg string"},
      {"key=  \t", "';' not found in cfg string"},
      {"key=", "';' not found in cfg string"},
      {"key=\"open;", "Invalid quoted value in cfg"},
      {R"(key="escaped\")", "Invalid quoted value in cfg"},
  };
  for (const auto& [line, message] : cases) {
    EXPECT_EQ(ErrorOf([line = line] { ParseCfgString(line); }), message) << line;
  }
}

EngineConfig Read(std::string_view text) {
  EngineConfig config;
  ap::ReadEngineConfig(text, config);
  return config;
}

TEST(EngineConfig, DefaultsSurviveAFileThatSetsNothing) {
  const EngineConfig config = Read("unknown=5;\nother=\"x\"\n");
  EXPECT_EQ(config.dbstamp, 0u);
  for (const ap::ChannelConfig* channel : {&config.web, &config.mail}) {
    EXPECT_FALSE(channel->loud);
    EXPECT_EQ(channel->loud_probability, 0.0f);
    EXPECT_EQ(std::bit_cast<std::uint32_t>(channel->threshold), 0x3C23D70Au);
    EXPECT_EQ(channel->threshold_loud, 0.0f);
  }
  // The decision step reads threshold_loud right behind threshold.
  EXPECT_EQ(&config.web.threshold + 1, &config.web.threshold_loud);
}

TEST(EngineConfig, EveryKey) {
  const EngineConfig config = Read(
      "dbstamp=20240611;\nweb_loud=1;\nweb_loud_probability=0.25;\nweb_threshold=0.05;\n"
      "web_threshold_loud=0.001;\nmail_loud=01;\nmail_loud_probability=.5;\n"
      "mail_threshold=2e-2;\nmail_threshold_loud=-1;\n");
  EXPECT_EQ(config.dbstamp, 20240611u);
  EXPECT_TRUE(config.web.loud);
  EXPECT_EQ(config.web.loud_probability, 0.25f);
  EXPECT_EQ(config.web.threshold, 0.05f);
  EXPECT_EQ(config.web.threshold_loud, 0.001f);
  EXPECT_TRUE(config.mail.loud);
  EXPECT_EQ(config.mail.loud_probability, 0.5f);
  EXPECT_EQ(config.mail.threshold, 0.02f);
  EXPECT_EQ(config.mail.threshold_loud, -1.0f);
}

TEST(EngineConfig, ValueConversions) {
  const std::pair<std::string_view, std::uint32_t> stamps[] = {
      {" dbstamp=5;\n", 0},            // a blank before the key makes another key
      {"dbstamp=\"12345\"\n", 12345},  // a quoted value is what it quotes
      {"dbstamp=123abc;\n", 123},     {"dbstamp=abc;\n", 0},           {"dbstamp=-5;\n", 0},
      {"dbstamp=4294967297;\n", 1},   {"dbstamp=1;\ndbstamp=2;\n", 2},  // the later line wins
  };
  for (const auto& [text, stamp] : stamps) EXPECT_EQ(Read(text).dbstamp, stamp) << text;
  const std::pair<std::string_view, float> thresholds[] = {
      {"web_threshold = 0.05;\n", 0.05f},
      {"web_threshold\t=\t0.05;\n", 0.05f},
      {"web_threshold=1e39;\n", HUGE_VALF},
      {"web_threshold=-1e300;\n", -HUGE_VALF},
      {"web_threshold=3.4028235e38;\n", 3.4028235e38f},
  };
  for (const auto& [text, value] : thresholds) EXPECT_EQ(Read(text).web.threshold, value) << text;
  EXPECT_TRUE(Read("web_loud=2;\n").web.loud);
  EXPECT_FALSE(Read("web_loud=-1;\n").web.loud);
  EXPECT_FALSE(Read("web_loud=0;\n").web.loud);
  EXPECT_FALSE(Read("mail_loud=yes;\n").mail.loud);
}

TEST(EngineConfig, Lines) {
  EXPECT_EQ(Read("dbstamp=7;\r\nweb_loud=1;\r\n").dbstamp, 7u);
  EXPECT_TRUE(Read("dbstamp=7;\r\nweb_loud=1;\r\n").web.loud);
  EXPECT_EQ(Read("dbstamp=7;\ndbstamp=8;").dbstamp, 7u) << "a last line without LF is not read";
  EXPECT_EQ(Read("dbstamp=8;").dbstamp, 0u);
  EXPECT_EQ(Read("").dbstamp, 0u);
}

TEST(EngineConfig, AnyFaultAbortsTheWholeRead) {
  EngineConfig config;
  config.dbstamp = 99;
  EXPECT_EQ(ErrorOf([&] { ap::ReadEngineConfig("dbstamp=1;\n\nweb_loud=1;\n", config); }),
            "Wrong cfg string, '=' not found");
  EXPECT_EQ(ErrorOf([&] { ap::ReadEngineConfig("dbstamp=1;\nweb_threshold=0.05 ;\n", config); }),
            "FloatParser: wrong fraction symbol");
  EXPECT_EQ(ErrorOf([&] { ap::ReadEngineConfig("dbstamp=1;\nweb_threshold=\"0.05\"x\n", config); }),
            "no error");
  EXPECT_EQ(ErrorOf([&] { ap::ReadEngineConfig("dbstamp=2;\nmail_threshold=;\n", config); }),
            "No value in cfg string");
  EXPECT_EQ(config.dbstamp, 1u) << "only the read that succeeded changed the block";
  EXPECT_EQ(config.web.threshold, 0.05f);
}

using pelmix::testing::PackedOf;

TEST(EngineConfig, LoadsFromTheContainer) {
  EngineConfig config;
  ap::LoadEngineConfig(*PackedOf({{"v3.cfg", "dbstamp=42;\nmail_loud=1;\n"}, {"x", "y"}}), config);
  EXPECT_EQ(config.dbstamp, 42u);
  EXPECT_TRUE(config.mail.loud);

  EngineConfig untouched;
  ap::LoadEngineConfig(*PackedOf({{"v3.cfg", ""}}), untouched);
  EXPECT_EQ(untouched.dbstamp, 0u) << "an empty entry sets nothing";

  EXPECT_EQ(ErrorOf([] {
              EngineConfig c;
              ap::LoadEngineConfig(*PackedOf({{"V3.cfg", "dbstamp=1;\n"}}), c);
            }),
            "Configuration entry v3.cfg not found");
  EXPECT_EQ(ErrorOf([] {
              EngineConfig c;
              std::string big(ap::kMaxEngineConfigSize - 11, 'x');
              ap::LoadEngineConfig(*PackedOf({{"v3.cfg", "dbstamp=1;\n" + big}}), c);
              EXPECT_EQ(c.dbstamp, 1u) << "the limit itself is accepted";
              ap::LoadEngineConfig(*PackedOf({{"v3.cfg", "dbstamp=1;\n" + big + "x"}}), c);
            }),
            "Configuration v3.cfg is too large");
}

}  // namespace
