// The scan of one PDF attachment: the file is read in blocks of kScanBlockSize bytes and
// pushed through the parser and the text and link extraction to an ap::PdfHandler.
#pragma once

#include <cstddef>

#include "engine/common/file_interfaces.h"
#include "engine/pdf/parser.h"
#include "engine/pdf/pdf_handler.h"

namespace pdf {

inline constexpr std::size_t kScanBlockSize = 1000;

// Feeds `file`, from where it stands, to `parser` in blocks of up to kScanBlockSize bytes,
// each filled by repeated reads until it is full or a read gives nothing or fails. The first
// empty block ends the data, and the parser is told so. Read failures end the data quietly.
void FeedFile(ap::ReadableFileI& file, Parser& parser);

// Sends the text and the links of the PDF in `file` to `sink`.
void Scan(ap::ReadableFileI& file, ap::PdfHandler& sink);

}  // namespace pdf
