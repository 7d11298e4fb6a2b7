// JSON Lines output of the dump tools. Byte strings are written so that the bytes can be
// recovered exactly: printable ASCII other than '"' and '\' stands for itself, those two are
// escaped as \" and \\, and every other byte b is one \u00XX escape.
#pragma once

#include <cstdint>
#include <ostream>
#include <string>
#include <string_view>
#include <vector>

namespace pelmix::cli {

// Appends `bytes` as a quoted JSON string.
void AppendJsonBytes(std::string& out, std::string_view bytes);

// Builds one JSON object line: JsonLine().Str("ev", "text").Bytes("data", d).Write(out).
class JsonLine {
 public:
  JsonLine& Bytes(std::string_view key, std::string_view value);  // escaped byte string
  JsonLine& Int(std::string_view key, std::int64_t value);
  JsonLine& Bool(std::string_view key, bool value);
  JsonLine& Strings(std::string_view key, const std::vector<std::string_view>& values);  // array
  // `json` written as it is: a number, an array, null ...
  JsonLine& Raw(std::string_view key, std::string_view json);
  // Writes the object and a line feed.
  void Write(std::ostream& out);

 private:
  void Key(std::string_view key);
  std::string text_ = "{";
};

}  // namespace pelmix::cli
