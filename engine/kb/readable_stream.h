// Standard input streams over the engine's readable files: the line- and token-oriented
// knowledge-base readers and the model readers read container entries through these.
//
// ReadableDevice_Tmpl is a Boost.Iostreams seekable source over an ap::ReadableWTell; any
// boost::iostreams::stream or stream_buffer can be built on it. EntryTextStream is the
// ready-made std::istream over one opened entry: a 4096-byte read buffer with a 4-byte
// putback area.
//
// Positioning: from the start is file_seek(offset); from the current place is the recorded
// position plus the offset (a move that stays inside the filled buffer only moves within
// it); from the end is file_size() plus the offset. A refused seek fails the stream
// (failbit) and moves nothing.
//
// Faults: EntryTextStream sets badbit in its exception mask, so an error raised while
// reading the entry (an ap::Error, a framework exception from the host file) leaves the
// extraction with its own type and message instead of passing for the end of the entry.
// Putting back more than the putback area holds raises the Boost.Iostreams failure
// "putback buffer full".
#pragma once

#include <boost/iostreams/categories.hpp>
#include <boost/iostreams/positioning.hpp>
#include <boost/iostreams/stream.hpp>
#include <ios>
#include <memory>

#include "engine/common/file_interfaces.h"
#include "engine/kb/readable_wtell.h"

namespace ap {

template <class Ch>
class ReadableDevice_Tmpl {
 public:
  using char_type = Ch;
  struct category : boost::iostreams::input_seekable, boost::iostreams::device_tag {};

  // `file` must not be null (ReadableWTell's own constructor guards the entry).
  explicit ReadableDevice_Tmpl(std::shared_ptr<ReadableWTell> file) : file_(std::move(file)) {}

  // -1 at the end of the file; a failing read raises std::ios_base::failure.
  std::streamsize read(char_type* s, std::streamsize n) {
    if (n <= 0) return 0;
    const std::int64_t got = file_->file_read(s, static_cast<std::uint64_t>(n) * sizeof(char_type));
    if (got < 0) throw std::ios_base::failure("ReadableDevice: read failed");
    if (got == 0) return -1;
    return static_cast<std::streamsize>(got / static_cast<std::int64_t>(sizeof(char_type)));
  }

  std::streampos seek(boost::iostreams::stream_offset off, std::ios_base::seekdir way) {
    const std::int64_t width = sizeof(char_type);
    std::int64_t target;
    if (way == std::ios_base::beg) {
      target = off * width;
    } else if (way == std::ios_base::cur) {
      // A move by nothing is a question about the place (tellg): answer it without asking
      // the file, which refuses to seek to its own end.
      if (off == 0) return std::streampos(file_->tell() / width);
      target = file_->tell() + off * width;
    } else {
      target = file_->file_size() + off * width;
    }
    const std::int64_t reached = file_->file_seek(target);
    if (reached < 0) return std::streampos(std::streamoff(-1));
    return std::streampos(reached / width);
  }

 private:
  std::shared_ptr<ReadableWTell> file_;
};

class EntryTextStream : public boost::iostreams::stream<ReadableDevice_Tmpl<char>> {
 public:
  static constexpr std::streamsize kBufferSize = 4096;
  static constexpr std::streamsize kPutbackSize = 4;

  // A null `entry` raises ap::Error "null readable for tell".
  explicit EntryTextStream(std::shared_ptr<ReadableFileI> entry);
};

}  // namespace ap
