#include "engine/pdf/scan.h"

#include <cstdint>

#include "engine/pdf/simplifier.h"

namespace pdf {

void FeedFile(ap::ReadableFileI& file, Parser& parser) {
  char block[kScanBlockSize];
  for (;;) {
    std::size_t filled = 0;
    while (filled < kScanBlockSize) {
      const std::uint64_t wanted = kScanBlockSize - filled;
      const std::int64_t n = file.file_read(block + filled, wanted);
      // A count beyond what was asked for is a broken reader: treat it as a failure.
      if (n <= 0 || static_cast<std::uint64_t>(n) > wanted) break;
      filled += static_cast<std::size_t>(n);
    }
    if (filled == 0) break;
    parser.feed(block, filled);
  }
  parser.finish();
}

void Scan(ap::ReadableFileI& file, ap::PdfHandler& sink) {
  pdf_strs::Simplifier simplifier(sink);
  Parser parser(simplifier);
  FeedFile(file, parser);
}

}  // namespace pdf
