// In-memory files for the model tests: a file system of named strings whose files can hand
// out their bytes in small pieces, to show that readers do not depend on how reads split.
#pragma once

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <map>
#include <memory>
#include <random>
#include <string>
#include <utility>

#include "engine/common/file_interfaces.h"

namespace pelmix::testing {

class PieceFile final : public ap::ReadableFileI {
 public:
  // `piece` bounds every read: 0 reads whatever is asked, a positive value at most that many
  // bytes, a negative value a random 1 .. -piece bytes (seeded, so runs repeat).
  explicit PieceFile(std::string bytes, int piece = 0, unsigned seed = 1)
      : bytes_(std::move(bytes)), piece_(piece), random_(seed) {}

  std::int64_t file_seek(std::int64_t position) override {
    if (position < 0 || position >= static_cast<std::int64_t>(bytes_.size())) return -1;
    position_ = static_cast<std::size_t>(position);
    return position;
  }
  std::int64_t file_size() override { return static_cast<std::int64_t>(bytes_.size()); }
  std::int64_t file_read(void* buffer, std::uint64_t count) override {
    std::uint64_t n = std::min<std::uint64_t>(count, bytes_.size() - position_);
    if (piece_ > 0) n = std::min<std::uint64_t>(n, static_cast<std::uint64_t>(piece_));
    if (piece_ < 0 && n > 0) {
      std::uniform_int_distribution<std::uint64_t> size(1, static_cast<std::uint64_t>(-piece_));
      n = std::min(n, size(random_));
    }
    std::memcpy(buffer, bytes_.data() + position_, n);
    position_ += n;
    return static_cast<std::int64_t>(n);
  }

 private:
  std::string bytes_;
  std::size_t position_ = 0;
  int piece_;
  std::mt19937 random_;
};

class PieceFileSystem final : public ap::FileSystemI {
 public:
  PieceFileSystem() = default;
  explicit PieceFileSystem(std::map<std::string, std::string> files, int piece = 0)
      : files_(std::move(files)), piece_(piece) {}

  void Add(const std::string& name, std::string bytes) { files_[name] = std::move(bytes); }

  std::shared_ptr<ap::ReadableFileI> open(const std::string& name) override {
    ++opens;
    const auto it = files_.find(name);
    if (it == files_.end()) return nullptr;
    return std::make_shared<PieceFile>(it->second, piece_);
  }
  void enumerate(
      const std::function<void(const std::string& name, std::uint64_t size)>& callback) override {
    for (const auto& [name, bytes] : files_) callback(name, bytes.size());
  }

  int opens = 0;

 private:
  std::map<std::string, std::string> files_;
  int piece_ = 0;
};

inline std::shared_ptr<ap::ReadableFileI> MemoryEntry(std::string bytes, int piece = 0) {
  return std::make_shared<PieceFile>(std::move(bytes), piece);
}

}  // namespace pelmix::testing
