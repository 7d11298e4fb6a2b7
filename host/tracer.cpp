#include "host/tracer.h"

#include <algorithm>
#include <cstring>
#include <utility>

#include "framework/uvo/result.h"

namespace pelmix::host {
namespace {

thread_local Tracer::ThreadCapture* currentCapture = nullptr;

}  // namespace

Tracer::ThreadCapture::ThreadCapture(int level) : level_(level), previous_(currentCapture) {
  currentCapture = this;
}

Tracer::ThreadCapture::~ThreadCapture() { currentCapture = previous_; }

std::vector<TraceLine> Tracer::ThreadCapture::Take() { return std::exchange(lines_, {}); }

uvo::Ptr<Tracer> Tracer::Create(int level) { return uvo::Ptr<Tracer>::Adopt(new Tracer(level)); }

uvo::result_t Tracer::CreateRecord(int level, char** buffer, std::uint32_t size) {
  if (buffer == nullptr) return uvo::kErrInvalidArgument;
  std::lock_guard<std::mutex> lock(mutex_);
  if (level == uvo::ITracer::kRegrowLevel) {
    auto it = open_.find(*buffer);
    if (it == open_.end()) return uvo::kErrInvalidArgument;
    if (refuseRegrow_) return uvo::kErrOutOfMemory;
    Record grown{it->second.level, std::make_unique<char[]>(size), size};
    std::memcpy(grown.data.get(), it->second.data.get(), std::min(size, it->second.size));
    open_.erase(it);
    char* key = grown.data.get();
    open_.emplace(key, std::move(grown));
    *buffer = key;
    regrows_.push_back(size);
    return uvo::kOk;
  }
  const int seen = currentCapture != nullptr ? std::max(level_, currentCapture->level_) : level_;
  if (refuseRecords_ || level > seen) return uvo::kFalse;
  Record record{level, std::make_unique<char[]>(size), size};
  char* key = record.data.get();
  open_.emplace(key, std::move(record));
  *buffer = key;
  return uvo::kOk;
}

uvo::result_t Tracer::CommitRecord(char* buffer, std::uint32_t length) {
  std::lock_guard<std::mutex> lock(mutex_);
  auto it = open_.find(buffer);
  if (it == open_.end() || length > it->second.size) return uvo::kErrInvalidArgument;
  TraceLine line{it->second.level, std::string(buffer, length)};
  open_.erase(it);
  if (echo_ != nullptr && line.level <= level_) (*echo_) << line.text << '\n' << std::flush;
  if (currentCapture != nullptr) {
    currentCapture->lines_.push_back(std::move(line));
  } else {
    lines_.push_back(std::move(line));
  }
  return uvo::kOk;
}

uvo::result_t Tracer::SetTraceLevel(int level) {
  std::lock_guard<std::mutex> lock(mutex_);
  level_ = level;
  return uvo::kOk;
}

uvo::result_t Tracer::Flush() {
  std::lock_guard<std::mutex> lock(mutex_);
  if (echo_ != nullptr) echo_->flush();
  return uvo::kOk;
}

uvo::result_t Tracer::GetCommittedCount(std::uint64_t* count) {
  if (count == nullptr) return uvo::kErrInvalidArgument;
  std::lock_guard<std::mutex> lock(mutex_);
  *count = lines_.size();
  return uvo::kOk;
}

uvo::result_t Tracer::GetTraceLevel(int* level) {
  if (level == nullptr) return uvo::kErrInvalidArgument;
  std::lock_guard<std::mutex> lock(mutex_);
  *level = currentCapture != nullptr ? std::max(level_, currentCapture->level_) : level_;
  return uvo::kOk;
}

uvo::result_t Tracer::QueryInterface(uvo::iid_t iid, void** out) {
  if (iid == uvo::ITraceLevelSource::kIid && !offerLevelSource_) {
    if (out != nullptr) *out = nullptr;
    return uvo::kErrNoInterface;
  }
  return ObjectImpl::QueryInterface(iid, out);
}

std::vector<TraceLine> Tracer::Lines() const {
  std::lock_guard<std::mutex> lock(mutex_);
  return lines_;
}

std::vector<std::string> Tracer::Texts() const {
  std::lock_guard<std::mutex> lock(mutex_);
  std::vector<std::string> texts;
  texts.reserve(lines_.size());
  for (const auto& line : lines_) texts.push_back(line.text);
  return texts;
}

void Tracer::Clear() {
  std::lock_guard<std::mutex> lock(mutex_);
  lines_.clear();
}

std::vector<std::uint32_t> Tracer::RegrowSizes() const {
  std::lock_guard<std::mutex> lock(mutex_);
  return regrows_;
}

std::size_t Tracer::OpenRecords() const {
  std::lock_guard<std::mutex> lock(mutex_);
  return open_.size();
}

}  // namespace pelmix::host
