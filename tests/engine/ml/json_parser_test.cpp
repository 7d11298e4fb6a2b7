#include <gtest/gtest.h>

#include <cmath>
#include <stdexcept>
#include <string>

#include "engine/ml/json_value.h"
#include "tests/support/error_of.h"

namespace ml {
namespace {

std::string ParseError(const std::string& text) {
  return pelmix::testing::ErrorOf<std::runtime_error>([&] { ParseJson(text); });
}

bool Accepts(const std::string& text) { return ParseError(text) == "no error"; }

const JsonValue& Only(const JsonValue& array) {
  const auto& items = boost::get<JsonArray>(array);
  EXPECT_EQ(items.size(), 1u);
  return items.at(0);
}

std::string StringOf(const std::string& quoted) {
  return boost::get<std::string>(Only(ParseJson("[" + quoted + "]")));
}

TEST(FlowJson, WhiteSpaceOnlyWhereTheGrammarAllowsIt) {
  for (const char* text :
       {"{}", "{ }", "[ \t\n\v\f\r]", "{ \"a\" \t: \n1 ,\r\n\"b\":2}", "[ 1 , 2]"}) {
    EXPECT_TRUE(Accepts(text)) << text;
  }
  for (const char* text :
       {"{\"a\":1 }", "[1 ]", " {}", "{}\n", "{}{}", "[1 2]", "[1,]", "[,1]", "{\"a\"}", "{1:2}"}) {
    EXPECT_FALSE(Accepts(text)) << text;
  }
}

TEST(FlowJson, DocumentIsAnObjectOrAnArray) {
  for (const char* text : {"", "1", "\"a\"", "null", "true", "{", "[[]", "]"}) {
    EXPECT_EQ(ParseError(text), std::string("JSON: parsing error ") + text) << text;
  }
  EXPECT_EQ(KindOf(ParseJson("[]")), JsonKind::kArray);
  EXPECT_EQ(KindOf(ParseJson("{}")), JsonKind::kObject);
}

TEST(FlowJson, NeighboursWithoutSeparatorAreTwoEntries) {
  const auto array = boost::get<JsonArray>(ParseJson("[\"a\"\"b\"[]{}]"));
  ASSERT_EQ(array.size(), 4u);
  EXPECT_EQ(boost::get<std::string>(array[1]), "b");
  EXPECT_EQ(KindOf(array[2]), JsonKind::kArray);
  EXPECT_EQ(KindOf(array[3]), JsonKind::kObject);

  const auto object = boost::get<JsonObject>(ParseJson("{\"a\":1\"b\":2}"));
  ASSERT_EQ(object.size(), 2u);
  EXPECT_EQ(boost::get<std::int64_t>(object.at("b")), 2);
}

TEST(FlowJson, StringEscapes) {
  const std::pair<std::string, std::string> cases[] = {
      {R"("a\nb")", "a\nb"},
      {R"("\b\f\n\r\t")", "\b\f\n\r\t"},
      {R"("\"\\\/")", "\"\\/"},
      {R"("\q\u0041")", "qu0041"},  // no \u escape
      {R"("\x41")", "A"},
      {R"("\x141")", "A"},  // low 8 bits of 0x141
      {R"("\x6a\x6A!")", "jj!"},
      {R"("\x")", "x"},  // no digits: the x stands for itself
      {R"("\xg")", "xg"},
      {R"("\x00")", std::string(1, '\0')},
      {"\"line\nend \xff\xfe\"", "line\nend \xff\xfe"},  // raw bytes kept
  };
  for (const auto& [quoted, value] : cases) EXPECT_EQ(StringOf(quoted), value) << quoted;
  EXPECT_FALSE(Accepts(R"(["abc\"])"));
  EXPECT_FALSE(Accepts("[\"abc]"));
}

TEST(FlowJson, IntegersAreWholeNumbersThatFit32Bits) {
  const auto array = boost::get<JsonArray>(
      ParseJson("[-7,+5,0,007,2147483647,-2147483648,2147483648,-2147483649]"));
  const std::int64_t whole[] = {-7, 5, 0, 7, 2147483647, -2147483648LL};
  ASSERT_EQ(array.size(), 8u);
  for (std::size_t i = 0; i < std::size(whole); ++i) {
    EXPECT_EQ(boost::get<std::int64_t>(array[i]), whole[i]) << i;
  }
  EXPECT_EQ(boost::get<double>(array[6]), 2147483648.0);
  EXPECT_EQ(boost::get<double>(array[7]), -2147483649.0);
}

TEST(FlowJson, FractionsExponentsAndNamedValuesAreDoubles) {
  const auto array = boost::get<JsonArray>(ParseJson("[.25,0.25,1e3,5.,-.5,1E-2,2e+1,5.e1,-0.0]"));
  const double expected[] = {0.25, 0.25, 1000.0, 5.0, -0.5, 0.01, 20.0, 50.0, -0.0};
  ASSERT_EQ(array.size(), std::size(expected));
  for (std::size_t i = 0; i < array.size(); ++i) {
    EXPECT_EQ(boost::get<double>(array[i]), expected[i]) << i;
  }
  EXPECT_TRUE(std::signbit(boost::get<double>(array[8])));

  // As member values too, and a lone fraction in an array.
  const auto object = boost::get<JsonObject>(ParseJson("{\"a\":.25,\"b\":1e3}"));
  EXPECT_EQ(boost::get<double>(object.at("a")), 0.25);
  EXPECT_EQ(boost::get<double>(object.at("b")), 1000.0);
  EXPECT_EQ(boost::get<double>(Only(ParseJson("[0.25]"))), 0.25);

  const auto named = boost::get<JsonArray>(ParseJson("[inf,-Infinity,NaN,+INF,nan]"));
  ASSERT_EQ(named.size(), 5u);
  EXPECT_EQ(boost::get<double>(named[0]), INFINITY);
  EXPECT_EQ(boost::get<double>(named[1]), -INFINITY);
  EXPECT_TRUE(std::isnan(boost::get<double>(named[2])));
  EXPECT_EQ(boost::get<double>(named[3]), INFINITY);
  EXPECT_TRUE(std::isnan(boost::get<double>(named[4])));

  for (const char* bad : {"[5e]", "[-]", "[.]", "[0x10]", "[1e]", "[infinit]", "[- 1]"}) {
    EXPECT_FALSE(Accepts(bad)) << bad;
  }
}

TEST(FlowJson, Literals) {
  const auto array = boost::get<JsonArray>(ParseJson("[null,true,false]"));
  ASSERT_EQ(array.size(), 3u);
  EXPECT_EQ(KindOf(array[0]), JsonKind::kNull);
  EXPECT_TRUE(boost::get<bool>(array[1]));
  EXPECT_FALSE(boost::get<bool>(array[2]));
  for (const char* bad : {"[nul]", "[True]", "[NULL]", "[tru]"}) {
    EXPECT_FALSE(Accepts(bad)) << bad;
  }
}

TEST(FlowJson, NestedTreeKeepsItsShape) {
  const JsonValue tree = ParseJson(R"({"z":{"b":[1,{"c":[2,[]]},"s"],"a":null},"d":3})");
  const auto& root = boost::get<JsonObject>(tree);
  ASSERT_EQ(root.size(), 2u);
  EXPECT_EQ(boost::get<std::int64_t>(root.at("d")), 3);
  const auto& z = boost::get<JsonObject>(root.at("z"));
  EXPECT_EQ(z.begin()->first, "a");  // keys in byte order
  const auto& b = boost::get<JsonArray>(z.at("b"));
  ASSERT_EQ(b.size(), 3u);
  EXPECT_EQ(boost::get<std::string>(b[2]), "s");
  const auto& c = boost::get<JsonArray>(boost::get<JsonObject>(b[1]).at("c"));
  ASSERT_EQ(c.size(), 2u);
  EXPECT_EQ(boost::get<std::int64_t>(c[0]), 2);
  EXPECT_TRUE(boost::get<JsonArray>(c[1]).empty());
}

TEST(FlowJson, RepeatedKeys) {
  // Scalars: the later value wins; a container may replace a scalar.
  auto object = boost::get<JsonObject>(ParseJson(R"({"a":1,"b":2,"a":"x"})"));
  EXPECT_EQ(boost::get<std::string>(object.at("a")), "x");
  object = boost::get<JsonObject>(ParseJson(R"({"a":1,"a":[2],"b":3})"));
  EXPECT_EQ(boost::get<JsonArray>(object.at("a")).size(), 1u);
  EXPECT_EQ(boost::get<std::int64_t>(object.at("b")), 3);

  // An earlier container would be filled again and the rest of the document misplaced.
  for (const std::string text :
       {R"({"a":[1],"a":2,"b":3})", R"({"a":{},"a":{"x":1}})", R"([{"a":[],"a":[]}])"}) {
    EXPECT_EQ(ParseError(text), "JSON: parsing error " + text);
  }
}

TEST(FlowJson, NestingIsBounded) {
  const auto nested = [](std::size_t depth) {
    return std::string(depth, '[') + std::string(depth, ']');
  };
  EXPECT_TRUE(Accepts(nested(kMaxJsonDepth)));
  EXPECT_EQ(ParseError(nested(kMaxJsonDepth + 1)), "JSON: nesting deeper than 64 levels");
  EXPECT_EQ(ParseError(std::string(10 << 20, '[')), "JSON: nesting deeper than 64 levels");
  std::string objects;
  for (int i = 0; i < 200000; ++i) objects += "{\"a\":";
  EXPECT_EQ(ParseError(objects), "JSON: nesting deeper than 64 levels");
}

TEST(FlowJson, ComposerRefusesEventsTheGrammarCannotSend) {
  Composer ended;
  ended.ArrayStart();
  ended.ContainerEnd();
  EXPECT_EQ(pelmix::testing::ErrorOf<std::runtime_error>([&] { ended.Integer(1); }),
            "json parsing error, trying to set value on empty stack");
  EXPECT_THROW(ended.ContainerEnd(), std::runtime_error);

  Composer object;
  object.ObjectStart();
  EXPECT_EQ(pelmix::testing::ErrorOf<std::runtime_error>([&] { object.Double(1.5); }),
            "json parse error, only string supported to append into hash");
}

TEST(FlowJson, WrongKindIsBadGet) {
  const JsonValue value = ParseJson("[1]");
  try {
    boost::get<JsonObject>(value);
    FAIL();
  } catch (const boost::bad_get& e) {
    EXPECT_STREQ(e.what(), "boost::bad_get: failed value get using boost::get");
  }
}

}  // namespace
}  // namespace ml
