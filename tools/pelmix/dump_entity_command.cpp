// pelmix dump entity NAME: what a character reference (the bytes between '&' and ';')
// decodes to.
#include <algorithm>
#include <iostream>
#include <string>
#include <string_view>

#include "engine/html/entities.h"
#include "tools/pelmix/command.h"
#include "tools/pelmix/json_lines.h"

namespace pelmix::cli {
namespace {

int RunDumpEntity(const std::vector<std::string>& args, const GlobalOptions&) {
  if (args.size() != 1) return UsageError("dump entity needs exactly one NAME");
  std::string buffer = args[0];
  std::size_t count = buffer.size();
  buffer.resize(std::max(count, html::kMaxDecodedReferenceBytes));
  if (html::decodeReference(buffer.data(), count)) {
    JsonLine()
        .Bool("ok", true)
        .Bytes("data", std::string_view(buffer.data(), count))
        .Write(std::cout);
  } else {
    JsonLine().Bool("ok", false).Write(std::cout);
  }
  return kExitOk;
}

}  // namespace

PELMIX_COMMAND({"dump entity", "NAME",
                "decode the character reference &NAME; (NAME as in &amp; or &#233;)",
                RunDumpEntity})

}  // namespace pelmix::cli
