#include "engine/kb/engine_config.h"

#include <cmath>
#include <limits>
#include <string>

#include "engine/common/error.h"
#include "engine/kb/float_parser.h"

namespace ap {
namespace {

bool IsBlank(char c) { return c == ' ' || c == '\t'; }

// Leading decimal digits, modulo 2^32; 0 when the text does not start with a digit.
std::uint32_t ScanDigits(std::string_view text) {
  std::uint32_t value = 0;
  for (const char c : text) {
    if (c < '0' || c > '9') break;
    value = value * 10 + static_cast<std::uint32_t>(c - '0');
  }
  return value;
}

// Rounds to single precision; magnitudes beyond the float range become infinities (a plain
// conversion of such a double is undefined).
float ToSingle(double value) {
  // FLT_MAX plus half its last step: from here on IEEE rounding gives infinity.
  constexpr double kOverflow = static_cast<double>(std::numeric_limits<float>::max()) + 0x1p103;
  if (std::fabs(value) >= kOverflow) {
    return std::signbit(value) ? -std::numeric_limits<float>::infinity()
                               : std::numeric_limits<float>::infinity();
  }
  return static_cast<float>(value);
}

void Assign(EngineConfig& config, std::string_view key, std::string_view value) {
  struct FloatKey {
    std::string_view key;
    float ChannelConfig::*field;
    ChannelConfig EngineConfig::*channel;
  };
  static constexpr FloatKey kFloatKeys[] = {
      {"web_loud_probability", &ChannelConfig::loud_probability, &EngineConfig::web},
      {"web_threshold", &ChannelConfig::threshold, &EngineConfig::web},
      {"web_threshold_loud", &ChannelConfig::threshold_loud, &EngineConfig::web},
      {"mail_loud_probability", &ChannelConfig::loud_probability, &EngineConfig::mail},
      {"mail_threshold", &ChannelConfig::threshold, &EngineConfig::mail},
      {"mail_threshold_loud", &ChannelConfig::threshold_loud, &EngineConfig::mail},
  };
  if (key == "dbstamp") {
    config.dbstamp = ScanDigits(value);
  } else if (key == "web_loud") {
    config.web.loud = ScanDigits(value) != 0;
  } else if (key == "mail_loud") {
    config.mail.loud = ScanDigits(value) != 0;
  } else {
    for (const FloatKey& entry : kFloatKeys) {
      if (key == entry.key) {
        (config.*entry.channel).*entry.field = ToSingle(FloatParser::Parse(value));
        return;
      }
    }
  }
}

}  // namespace

CfgString ParseCfgString(std::string_view line) {
  const std::size_t equals = line.find('=');
  if (equals == std::string_view::npos) ThrowError("Wrong cfg string, '=' not found");
  std::size_t key_end = equals;
  while (key_end > 0 && IsBlank(line[key_end - 1])) --key_end;

  std::size_t start = equals + 1;
  while (start < line.size() && IsBlank(line[start])) ++start;
  if (start == line.size()) ThrowError("';' not found in cfg string");

  CfgString result{line.substr(0, key_end), {}};
  if (line[start] == '"') {
    const std::size_t open = start + 1;
    for (std::size_t i = open; i < line.size(); ++i) {
      if (line[i] == '\\') {
        ++i;  // the escaped character, whatever it is
      } else if (line[i] == '"') {
        result.value = line.substr(open, i - open);
        return result;
      }
    }
    ThrowError("Invalid quoted value in cfg");
  }
  if (line[start] == ';') ThrowError("No value in cfg string");
  const std::size_t semicolon = line.find(';', start);
  if (semicolon == std::string_view::npos) ThrowError("';' not found in cfg string");
  result.value = line.substr(start, semicolon - start);
  return result;
}

void ReadEngineConfig(std::string_view text, EngineConfig& config) {
  EngineConfig updated = config;
  std::size_t start = 0;
  for (std::size_t lf = text.find('\n'); lf != std::string_view::npos;
       lf = text.find('\n', start)) {
    const CfgString line = ParseCfgString(text.substr(start, lf - start));
    Assign(updated, line.key, line.value);
    start = lf + 1;
  }
  config = updated;
}

void LoadEngineConfig(FileSystemI& container, EngineConfig& config) {
  const auto entry = container.open(kEngineConfigEntry);
  if (!entry) {
    // An entry of 0 bytes opens as nothing too; it holds no lines and changes nothing.
    bool present = false;
    container.enumerate([&present](const std::string& name, std::uint64_t) {
      if (name == kEngineConfigEntry) present = true;
    });
    if (!present) ThrowError("Configuration entry v3.cfg not found");
    return;
  }
  const std::int64_t size = entry->file_size();
  if (size < 0 || static_cast<std::uint64_t>(size) > kMaxEngineConfigSize) {
    ThrowError("Configuration v3.cfg is too large");
  }
  std::string text(static_cast<std::size_t>(size), '\0');
  const std::int64_t got = text.empty() ? 0 : entry->file_read(text.data(), text.size());
  text.resize(got > 0 ? static_cast<std::size_t>(got) : 0);
  ReadEngineConfig(text, config);
}

}  // namespace ap
