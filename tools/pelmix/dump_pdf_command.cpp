// pelmix dump pdf: the text and the links the mail checker receives from a PDF attachment,
// or with --raw the PDF parser's own events, as JSON Lines. The file is read through the same
// scan entry the mail checker uses, straight from the file or stdin, without loading it whole.
#include <sys/stat.h>

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <iostream>

#include "engine/common/file_interfaces.h"
#include "engine/pdf/parser.h"
#include "engine/pdf/pdf_handler.h"
#include "engine/pdf/scan.h"
#include "tools/pelmix/command.h"
#include "tools/pelmix/json_lines.h"

namespace pelmix::cli {
namespace {

// A readable file over a stdio stream; remembers whether a read failed.
class StdioFile : public ap::ReadableFileI {
 public:
  explicit StdioFile(std::FILE* file) : file_(file) {}

  std::int64_t file_seek(std::int64_t position) override {
    if (std::fseek(file_, static_cast<long>(position), SEEK_SET) != 0) return -1;
    return std::ftell(file_);
  }
  std::int64_t file_size() override {
    struct stat info {};
    if (fstat(fileno(file_), &info) != 0 || !S_ISREG(info.st_mode)) return -1;
    return info.st_size;
  }
  std::int64_t file_read(void* buffer, std::uint64_t count) override {
    const std::size_t n = std::fread(buffer, 1, count, file_);
    if (n == 0 && std::ferror(file_)) {
      failed_ = true;
      return -1;
    }
    return static_cast<std::int64_t>(n);
  }
  bool failed() const { return failed_ || std::ferror(file_); }

 private:
  std::FILE* file_;
  bool failed_ = false;
};

class TextAndLinks : public ap::PdfHandler {
 public:
  void text(const std::string& s) override {
    JsonLine().Bytes("ev", "text").Bytes("data", s).Write(std::cout);
  }
  void link(const std::string& u) override {
    JsonLine().Bytes("ev", "link").Bytes("data", u).Write(std::cout);
  }
};

class RawEvents : public pdf::Parser::Handler {
 public:
  void objectBegin(std::uint32_t number, std::uint32_t generation) override {
    JsonLine().Bytes("ev", "object").Int("num", number).Int("gen", generation).Write(std::cout);
  }
  void objectEnd() override { JsonLine().Bytes("ev", "object_end").Write(std::cout); }
  void streamBegin(bool image) override {
    streamBytes_ = 0;
    JsonLine().Bytes("ev", "stream").Bool("image", image).Write(std::cout);
  }
  void streamEnd() override {
    JsonLine().Bytes("ev", "stream_end").Int("bytes", streamBytes_).Write(std::cout);
  }
  void streamByte(char) override { ++streamBytes_; }
  void link(const std::string& target) override {
    JsonLine().Bytes("ev", "link").Bytes("data", target).Write(std::cout);
  }

 private:
  std::int64_t streamBytes_ = 0;
};

int RunDumpPdf(const std::vector<std::string>& args, const GlobalOptions&) {
  bool raw = false;
  std::string path;
  for (const std::string& arg : args) {
    if (arg == "--raw") {
      raw = true;
    } else if (arg.size() > 1 && arg[0] == '-') {
      return UsageError("dump pdf: unknown option " + arg);
    } else if (!path.empty()) {
      return UsageError("dump pdf takes one input file");
    } else {
      path = arg;
    }
  }
  if (path.empty()) return UsageError("dump pdf needs an input file (or - for stdin)");

  const bool useStdin = path == "-";
  std::FILE* stream = useStdin ? stdin : std::fopen(path.c_str(), "rb");
  if (stream == nullptr) {
    std::cerr << "pelmix: " << path << ": " << std::strerror(errno) << "\n";
    return kExitFailure;
  }
  StdioFile file(stream);
  if (raw) {
    RawEvents events;
    pdf::Parser parser(events);
    pdf::FeedFile(file, parser);
  } else {
    TextAndLinks sink;
    pdf::Scan(file, sink);
  }
  std::cout.flush();
  const bool failed = file.failed();
  if (!useStdin) std::fclose(stream);
  if (failed) {
    std::cerr << "pelmix: " << path << ": read error\n";
    return kExitFailure;
  }
  return kExitOk;
}

}  // namespace

PELMIX_COMMAND({"dump pdf", "[--raw] FILE|-",
                "print the text and links of a PDF (--raw: the parser's events) as JSON Lines",
                RunDumpPdf})

}  // namespace pelmix::cli
