// Mail-part streams handed to the mail session, seen by the engine's readers.
//
// ReadableFileStream puts a host stream behind ap::ReadableFileI (the PDF scanner reads
// attachments through it); ImageLoadStream puts one behind ap::logo::ImageDataProviderI.
// Both hold one reference to the host stream for their whole life. Host failures become
// std::runtime_error with the wrapper's own text; positions and sizes that do not fit the
// narrower types of these interfaces raise boost::numeric::positive_overflow ("bad numeric
// conversion: positive overflow") instead of being cut.
#pragma once

#include <cstdint>

#include "engine/common/file_interfaces.h"
#include "framework/uvo/interfaces.h"
#include "framework/uvo/object.h"

namespace cf::services::anti_phishing::heuristic {

class ReadableFileStream final : public ap::ReadableFileI {
 public:
  // A null stream raises std::invalid_argument.
  explicit ReadableFileStream(uvo::IStream* stream);

  // Seeks from the start; the position reached must fit a signed 32-bit number.
  std::int64_t file_seek(std::int64_t position) override;
  // The stream's size, which must be below 2^32.
  std::int64_t file_size() override;
  // A null buffer or a count of 0 reads nothing and returns 0; a count must be below 2^32.
  std::int64_t file_read(void* buffer, std::uint64_t count) override;

 private:
  uvo::Ptr<uvo::IStream> stream_;
};

class ImageLoadStream final : public ap::logo::ImageDataProviderI {
 public:
  // A null stream raises std::invalid_argument.
  explicit ImageLoadStream(uvo::IStream* stream);

  // A null buffer or a count of 0 returns 0; a negative count raises std::runtime_error.
  int read(void* buffer, int count) override;
  // False for a negative position (the host is not asked) or when the host's seek fails.
  bool seek(int position) override;
  // The host's position, which must be below 2^31.
  int tell() override;

 private:
  uvo::Ptr<uvo::IStream> stream_;
};

}  // namespace cf::services::anti_phishing::heuristic
