// Helpers for the tests of the knowledge bases (white domains, organisations, share links,
// categorised hosts, lexemes): entries over owned bytes, entries that fail on purpose, and
// a trace logger that keeps what the engine traces.
#pragma once

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "engine/common/file_interfaces.h"
#include "engine/common/trace.h"

namespace kbdb_test {

// An opened entry over bytes it owns. `fail_after` makes every read fail (return -1) once
// that many bytes have been delivered; `short_by` makes file_size report more than there is;
// `max_read` (when not 0) hands out at most that many bytes a read, as a pipe would.
class BytesEntry final : public ap::ReadableFileI {
 public:
  explicit BytesEntry(std::string bytes) : bytes_(std::move(bytes)) {}
  std::int64_t fail_after = -1;
  std::int64_t short_by = 0;
  std::uint64_t max_read = 0;

  std::int64_t file_seek(std::int64_t position) override {
    if (position < 0 || static_cast<std::uint64_t>(position) >= bytes_.size()) return -1;
    position_ = static_cast<std::size_t>(position);
    return position;
  }
  std::int64_t file_size() override { return static_cast<std::int64_t>(bytes_.size()) + short_by; }
  std::int64_t file_read(void* buffer, std::uint64_t count) override {
    if (fail_after >= 0 && static_cast<std::int64_t>(position_) >= fail_after) return -1;
    if (max_read != 0) count = std::min(count, max_read);
    const std::size_t n =
        static_cast<std::size_t>(std::min<std::uint64_t>(count, bytes_.size() - position_));
    if (n != 0) std::memcpy(buffer, bytes_.data() + position_, n);
    position_ += n;
    return static_cast<std::int64_t>(n);
  }

 private:
  std::string bytes_;
  std::size_t position_ = 0;
};

inline std::shared_ptr<BytesEntry> Entry(std::string bytes) {
  return std::make_shared<BytesEntry>(std::move(bytes));
}

// Keeps every engine trace line while it is installed; puts the previous logger back.
class TraceCapture {
 public:
  struct Line {
    std::string text;
    int severity;
    bool operator==(const Line&) const = default;
  };

  TraceCapture() : previous_(ap::EngineLogger()), logger_(std::make_shared<Logger>()) {
    ap::SetEngineLogger(logger_);
  }
  ~TraceCapture() { ap::SetEngineLogger(previous_); }
  TraceCapture(const TraceCapture&) = delete;
  TraceCapture& operator=(const TraceCapture&) = delete;

  const std::vector<Line>& lines() const { return logger_->lines; }
  std::vector<std::string> texts() const {
    std::vector<std::string> texts;
    for (const Line& line : logger_->lines) texts.push_back(line.text);
    return texts;
  }

 private:
  struct Logger final : ap::TraceLoggerI {
    std::vector<Line> lines;
    void Log(const std::string& text, int severity) override { lines.push_back({text, severity}); }
    bool IsEnabled(int) override { return true; }
  };
  std::shared_ptr<ap::TraceLoggerI> previous_;
  std::shared_ptr<Logger> logger_;
};

}  // namespace kbdb_test
