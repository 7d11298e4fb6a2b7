#include "tools/pelmix/json_lines.h"

namespace pelmix::cli {

void AppendJsonBytes(std::string& out, std::string_view bytes) {
  static constexpr char kHex[] = "0123456789abcdef";
  out += '"';
  for (const char c : bytes) {
    const auto b = static_cast<unsigned char>(c);
    if (b == '"' || b == '\\') {
      out += '\\';
      out += c;
    } else if (b >= 0x20 && b < 0x7F) {
      out += c;
    } else {
      const char escape[6] = {'\\', 'u', '0', '0', kHex[b >> 4], kHex[b & 0xF]};
      out.append(escape, sizeof escape);
    }
  }
  out += '"';
}

void JsonLine::Key(std::string_view key) {
  if (text_.size() > 1) text_ += ',';
  AppendJsonBytes(text_, key);
  text_ += ':';
}

JsonLine& JsonLine::Bytes(std::string_view key, std::string_view value) {
  Key(key);
  AppendJsonBytes(text_, value);
  return *this;
}

JsonLine& JsonLine::Int(std::string_view key, std::int64_t value) {
  Key(key);
  text_ += std::to_string(value);
  return *this;
}

JsonLine& JsonLine::Raw(std::string_view key, std::string_view json) {
  Key(key);
  text_ += json;
  return *this;
}

JsonLine& JsonLine::Bool(std::string_view key, bool value) {
  Key(key);
  text_.append(value ? std::string_view("true") : std::string_view("false"));
  return *this;
}

JsonLine& JsonLine::Strings(std::string_view key, const std::vector<std::string_view>& values) {
  Key(key);
  text_ += '[';
  for (std::size_t i = 0; i < values.size(); ++i) {
    if (i > 0) text_ += ',';
    AppendJsonBytes(text_, values[i]);
  }
  text_ += ']';
  return *this;
}

void JsonLine::Write(std::ostream& out) {
  text_.push_back('}');
  text_.push_back('\n');
  out << text_;
  text_.clear();
  text_.push_back('{');
}

}  // namespace pelmix::cli
