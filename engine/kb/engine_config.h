// The engine's tunable numbers, read from the container entry "v3.cfg".
//
// The entry is a list of LF-terminated lines "key=value;". Per line: the key is everything
// before the first "=" with trailing blanks (space, tab) removed; blanks after "=" are
// skipped; a value in double quotes runs to the next unescaped quote (a backslash escapes
// one character, escapes are kept) and needs no ";"; otherwise the value runs to the first
// ";" and blanks before it belong to it. Text after the last LF is not read; unknown keys
// are ignored; a later line overrides an earlier one.
//
// Every fault raises ap::Error and the whole read is discarded:
//   "Wrong cfg string, '=' not found"   a line without "=" (an empty line included)
//   "No value in cfg string"            ";" right after "=" and its blanks
//   "';' not found in cfg string"       an unquoted value without ";", or nothing after "="
//   "Invalid quoted value in cfg"       a quoted value without its closing quote
//   the FloatParser's texts             a float value it refuses (a blank before ";" too)
#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>

#include "engine/common/file_interfaces.h"

namespace ap {

// How one channel (web pages or mail) decides and reports. The decision step takes the
// whole block, so it never depends on how the fields are laid out.
struct ChannelConfig {
  bool loud = false;
  float loud_probability = 0.0f;
  float threshold = 0.01f;  // bits 0x3C23D70A
  float threshold_loud = 0.0f;
};

struct EngineConfig {
  std::uint32_t dbstamp = 0;
  ChannelConfig web;
  ChannelConfig mail;
};

inline constexpr char kEngineConfigEntry[] = "v3.cfg";
// The configuration is a few hundred bytes; a larger entry is refused before it is read.
inline constexpr std::uint64_t kMaxEngineConfigSize = 1 << 20;

// One parsed line: views into the line itself.
struct CfgString {
  std::string_view key;
  std::string_view value;
};

// Parses one line (without its LF). An empty value is possible only when quoted ("").
CfgString ParseCfgString(std::string_view line);

// Applies the lines of `text` to `config`. On a fault `config` is left as it was.
void ReadEngineConfig(std::string_view text, EngineConfig& config);

// Opens "v3.cfg" in `container` and reads it into `config`. A missing entry, and an entry
// larger than kMaxEngineConfigSize, raise ap::Error; an empty entry changes nothing.
void LoadEngineConfig(FileSystemI& container, EngineConfig& config);

}  // namespace ap
