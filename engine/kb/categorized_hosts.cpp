#include "engine/kb/categorized_hosts.h"

#include <algorithm>
#include <cstring>

#include "engine/common/error.h"
#include "engine/common/trace.h"
#include "engine/kb/md5.h"

namespace hpdb {
namespace {

std::uint64_t Le(const std::uint8_t* p, int width) {
  std::uint64_t value = 0;
  for (int i = width - 1; i >= 0; --i) value = (value << 8) | p[i];
  return value;
}

HashedCatHostsPathes::Key KeyOf(const std::uint8_t* digest) {
  return {Le(digest, 8), Le(digest + 8, 8)};
}

std::string LowerAscii(const std::string& text) {
  std::string lower = text;
  for (char& c : lower) {
    if (c >= 'A' && c <= 'Z') c = static_cast<char>(c - 'A' + 'a');
  }
  return lower;
}

}  // namespace

// The entry's bytes in kLoadBufferSize pieces. file_read gives what the entry itself would
// give for the same request: the bytes asked for, fewer at its end, or the entry's failure
// (a negative count) when nothing was buffered before it.
class HashedCatHostsPathes::BufferedEntry {
 public:
  explicit BufferedEntry(ap::ReadableFileI& entry) : entry_(entry), buffer_(kLoadBufferSize) {}

  std::int64_t file_read(void* out, std::size_t count) {
    auto* to = static_cast<std::uint8_t*>(out);
    std::size_t done = 0;
    while (done < count) {
      if (next_ == end_) {
        const std::int64_t got = entry_.file_read(buffer_.data(), buffer_.size());
        if (got <= 0) return done != 0 ? static_cast<std::int64_t>(done) : got;
        next_ = 0;
        end_ = static_cast<std::size_t>(got);
      }
      const std::size_t take = std::min(count - done, end_ - next_);
      std::memcpy(to + done, buffer_.data() + next_, take);
      next_ += take;
      done += take;
    }
    return static_cast<std::int64_t>(done);
  }

 private:
  ap::ReadableFileI& entry_;
  std::vector<std::uint8_t> buffer_;
  std::size_t next_ = 0;
  std::size_t end_ = 0;
};

namespace {

// Reads exactly `count` bytes; anything else (a zero count asked for included) fails.
void ReadPayload(HashedCatHostsPathes::BufferedEntry& entry, void* buffer, std::size_t count) {
  const std::int64_t got = entry.file_read(buffer, count);
  if (count == 0 || got != static_cast<std::int64_t>(count)) ap::ThrowError("HDBP: Can't read");
}

void Skip(HashedCatHostsPathes::BufferedEntry& entry, std::size_t count) {
  std::uint8_t chunk[kSkipChunk];
  while (count != 0) {
    const std::size_t want = count < kSkipChunk ? count : kSkipChunk;
    const std::int64_t got = entry.file_read(chunk, want);
    if (got <= 0) ap::ThrowError("HPDB: invalid section size");
    count -= static_cast<std::size_t>(got);
  }
}

}  // namespace

HashedCatHostsPathes::HashedCatHostsPathes(std::shared_ptr<ap::ReadableFileI> entry) {
  if (!entry) {
    AP_TRACE(ap::kSeverityWarning) << "HPDB: null source results empty DB!";
    return;
  }
  BufferedEntry buffered(*entry);
  Load(buffered);
  current_ = nullptr;
  AP_TRACE(ap::kSeverityMessage) << "HPDB: " << hosts_.size() << " hosts loaded";
}

void HashedCatHostsPathes::Load(BufferedEntry& entry) {
  for (;;) {
    std::uint8_t type = 0;
    const std::int64_t got = entry.file_read(&type, 1);
    if (got == 0) break;  // the end of the entry
    // A failing read is not the end: the rest of the database would be lost unnoticed.
    if (got < 0) ap::ThrowError("HDBP: Can't read");
    std::uint8_t size_bytes[2];
    if (entry.file_read(size_bytes, 2) != 2) ap::ThrowError("HPDB: Invalid db format");
    const std::size_t size = static_cast<std::size_t>(Le(size_bytes, 2));

    if (type == kHostSection) {
      if (size != kHostPayloadSize) {
        AP_TRACE(ap::kSeverityWarning) << "HPDB: "
                                       << "host"
                                       << " section size mismatch";
        Skip(entry, size);
        continue;
      }
      std::uint8_t payload[kHostPayloadSize];
      ReadPayload(entry, payload, size);
      const auto category = static_cast<std::uint16_t>(Le(payload, 2));
      // A host listed again keeps its mask and paths and takes the new category.
      Host& host = hosts_[KeyOf(payload + 2)];
      host.category = category;
      current_ = &host;
    } else if (type == kMaskSection) {
      if (size != kMaskPayloadSize) {
        AP_TRACE(ap::kSeverityWarning) << "HPDB: "
                                       << "mask"
                                       << " section size mismatch";
        Skip(entry, size);
        continue;
      }
      std::uint8_t payload[kMaskPayloadSize];
      ReadPayload(entry, payload, size);
      if (current_ == nullptr) {
        AP_TRACE(ap::kSeverityWarning) << "HDBP: mask without host";
        continue;
      }
      current_->mask = Le(payload, 8);
    } else if (type == kPathSection) {
      if (size < kPathCategorySize) {
        AP_TRACE(ap::kSeverityWarning) << "HPDB: path section too small";
        Skip(entry, size);
        continue;
      }
      std::uint8_t category[kPathCategorySize];
      ReadPayload(entry, category, kPathCategorySize);
      Path path;
      path.category = static_cast<std::uint16_t>(Le(category, 2));
      path.text.resize(size - kPathCategorySize);
      ReadPayload(entry, path.text.data(), path.text.size());
      if (current_ == nullptr) {
        AP_TRACE(ap::kSeverityWarning) << "HDBP: path without host";
        continue;
      }
      current_->paths.push_back(std::move(path));
    } else {
      Skip(entry, size);
    }
  }
}

bool HashedCatHostsPathes::lookup(const std::string& host, const std::string& path,
                                  std::uint16_t& category, std::uint64_t& mask,
                                  bool& no_paths) const {
  const std::string lower_host = LowerAscii(host);
  const ap::Md5Digest digest = ap::Md5Of(lower_host);
  const auto it = hosts_.find(KeyOf(digest.data()));
  if (it == hosts_.end()) return false;
  const Host& record = it->second;
  category = record.category;
  mask = record.mask;
  no_paths = record.paths.empty();
  const std::string lower_path = LowerAscii(path);
  for (const Path& prefix : record.paths) {
    if (lower_path.compare(0, prefix.text.size(), prefix.text) != 0) continue;
    if (prefix.text.size() > lower_path.size()) continue;
    if (prefix.text.size() == lower_path.size() || prefix.text.back() == '/') {
      category = prefix.category;
      break;
    }
  }
  return true;
}

std::shared_ptr<HashedCatHostsPathes> LoadHashedCatHostsPathes(ap::FileSystemI& container) {
  return std::make_shared<HashedCatHostsPathes>(container.open(kCategorisedHostsEntry));
}

}  // namespace hpdb
