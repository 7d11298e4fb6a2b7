// The value tree of the flow files and the builder that the flow-file grammar drives.
// The grammar (json_parser.cpp) knows nothing of the tree: it reports events to a Composer,
// which keeps a stack of the values still awaiting content.
#pragma once

#include <boost/variant.hpp>
#include <cstddef>
#include <cstdint>
#include <map>
#include <string>
#include <vector>

namespace ml {

// Tags in this order: 0 null, 1 string, 2 integer, 3 double, 4 bool, 5 object (ordered by
// key bytes), 6 array. Reading a value as another kind throws boost::bad_get.
using JsonValue =
    boost::make_recursive_variant<boost::blank, std::string, std::int64_t, double, bool,
                                  std::map<std::string, boost::recursive_variant_>,
                                  std::vector<boost::recursive_variant_>>::type;
using JsonObject = std::map<std::string, JsonValue>;
using JsonArray = std::vector<JsonValue>;

enum class JsonKind { kNull, kString, kInteger, kDouble, kBool, kObject, kArray };
inline JsonKind KindOf(const JsonValue& value) { return static_cast<JsonKind>(value.which()); }

// Containers open at once. Deeper documents are refused before the recursive grammar can
// exhaust the stack; real flow files nest four levels.
inline constexpr std::size_t kMaxJsonDepth = 64;

// Parses a whole flow-file text. A text that does not match the grammar throws
// std::runtime_error "JSON: parsing error " followed by the whole text; nesting beyond
// kMaxJsonDepth throws std::runtime_error "JSON: nesting deeper than 64 levels".
JsonValue ParseJson(const std::string& text);

// Builds the tree from the grammar's events, in document order.
class Composer {
 public:
  // Thrown when an event would corrupt the tree (a repeated key whose earlier value is a
  // container); the parser turns it into its parsing error.
  struct Rejected {};

  Composer();
  Composer(const Composer&) = delete;
  Composer& operator=(const Composer&) = delete;

  void ObjectStart();
  void ArrayStart();
  void ContainerEnd();
  void StringStart();
  void StringChar(char c);
  void StringEscaped(char c);  // the character after a backslash
  void StringEnd();
  void Integer(std::int64_t value);
  void Double(double value);
  void Null();
  void Bool(bool value);

  JsonValue TakeRoot();

 private:
  void Deliver(JsonValue value);
  JsonValue& Top();
  void OpenContainer(JsonValue empty);

  JsonValue root_;
  std::vector<JsonValue*> stack_;
  std::string text_;
  std::size_t open_ = 0;  // containers started and not yet ended
};

}  // namespace ml
