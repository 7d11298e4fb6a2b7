#include "tools/pelmix/kb_container.h"

#include "framework/uvo/exception.h"
#include "framework/uvo/text.h"
#include "host/stream.h"
#include "internal/helpers/io_adapters/antiphishing_io_adapter.h"

namespace pelmix::cli {

std::shared_ptr<ap::PackedFile> OpenContainer(const std::string& path) {
  std::string error;
  const auto file = host::FileStream::Open(path, &error);
  if (!file) throw KbFileError(error);
  return std::make_shared<ap::PackedFile>(
      std::make_shared<cf::adapters::AntiphishingIOAdapter>(file.Get()));
}

std::string DescribeFailure(const std::exception& e) {
  if (const auto* framework = dynamic_cast<const uvo::Exception*>(&e)) {
    std::string text = std::string(e.what()) + " at " + framework->File() + ":" +
                       std::to_string(framework->Line());
    const std::string description = uvo::ToUtf8(framework->Description());
    if (!description.empty()) text += ": " + description;
    return text;
  }
  return e.what();
}

}  // namespace pelmix::cli
