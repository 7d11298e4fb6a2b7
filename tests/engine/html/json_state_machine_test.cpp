#include "engine/html/json_state_machine.h"

#include <gtest/gtest.h>

#include <string>

namespace {

bool Accepted(const std::string& doc) {
  utils::JSONStateMachine<char> json;
  json.feed(doc.data(), doc.size());
  return json.accepted();
}

TEST(JsonValidator, AcceptsJsonAndItsLenientForms) {
  for (const char* doc : {
           "",
           " \t\r\n ",
           "1",
           "-",
           "-12.5e+3",
           "1E5",
           "\"a\\\"b\"",
           "true",
           "false",
           "null",
           "{}",
           "[]",
           " { \"a\" : [1, 2.0, {\"b\": null}], \"c\": \"d\" } ",
           "[1,]",        // trailing ','
           "{\"a\":1,}",  // trailing ',' in an object
           "[1-2]",
           "[1\"x\"]",
           "[truefalse]",  // values right after a number or literal
           "{\"a\":1",     // cut off
           "[\"unterminated",
           "tr",
           "nul",
           "\x01\x1F 1 \x20",  // every byte below 33 is a blank
       }) {
    EXPECT_TRUE(Accepted(doc)) << doc;
  }
}

TEST(JsonValidator, RejectsWhatCannotBeOneValue) {
  for (const char* doc : {
           "1 2",
           "[1 2]",
           "[\"a\"1]",
           "[,1]",
           "[1,,2]",
           "{1:2}",
           "{\"a\" 1}",
           "{\"a\":1 \"b\":2}",
           "tru e",
           "nulx",
           "<html>",
           "x",
           "{\"a\":}",
           "\xC2\xA0"
           "1",
           "[] []",
       }) {
    EXPECT_FALSE(Accepted(doc)) << doc;
  }
}

TEST(JsonValidator, BytesAboveAsciiAreNeverBlanks) {
  EXPECT_FALSE(Accepted("1\xA0"));
  EXPECT_FALSE(Accepted("\x85[]"));
  EXPECT_TRUE(Accepted("\"\xA0\xFF\""));
}

TEST(JsonValidator, NestingBeyondTheLimitIsNotJson) {
  const std::size_t limit = utils::kMaxJsonNesting;
  EXPECT_TRUE(Accepted(std::string(limit, '[') + std::string(limit, ']')));
  EXPECT_FALSE(Accepted(std::string(limit + 1, '[') + std::string(limit + 1, ']')));
  std::string objects;
  for (std::size_t i = 0; i < limit; ++i) objects += "{\"k\":";
  EXPECT_TRUE(Accepted(objects + "1" + std::string(limit, '}')));
  EXPECT_FALSE(Accepted(objects + "[1]" + std::string(limit, '}')));

  utils::JSONStateMachine<char> json;
  const std::string deep(5'000'000, '[');
  json.feed(deep.data(), deep.size());
  EXPECT_FALSE(json.accepted());
  EXPECT_EQ(json.nesting(), limit);
  // InitState, a ValueState and an ArrayState per level, the ValueState that saw one '['
  // too many, and WrongState.
  EXPECT_EQ(json.depth(), 2 * limit + 3);
}

}  // namespace
