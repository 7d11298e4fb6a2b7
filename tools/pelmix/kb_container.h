// What the `pelmix kb` tools share: opening a container file through the engine's own
// readers (host file, io adapter, PackedFile) and wording the failures they raise.
#pragma once

#include <exception>
#include <memory>
#include <stdexcept>
#include <string>

#include "engine/kb/packed_file.h"

namespace pelmix::cli {

// The file could not be opened at all; its message names the path.
class KbFileError : public std::runtime_error {
 public:
  using std::runtime_error::runtime_error;
};

// Opens and verifies the container at `path`. Raises KbFileError when the file cannot be
// opened, and whatever the engine raises when it is not a sound container.
std::shared_ptr<ap::PackedFile> OpenContainer(const std::string& path);

// The message of an exception raised while reading a container: the engine's own text for
// ap::Error and standard errors; class, source place and description for framework ones.
std::string DescribeFailure(const std::exception& e);

}  // namespace pelmix::cli
