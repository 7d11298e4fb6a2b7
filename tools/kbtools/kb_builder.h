// Builds a knowledge-base container from a source directory: the text sources of the
// binary bases are compiled, every other regular file is packed as it is.
//
//   white_domains.txt       -> "wdb"   (CompileWhiteDomains)
//   categorised_hosts.txt   -> "sb.db" (CompileCategorisedHosts)
//   any other regular file  -> an entry named by its path relative to the directory, with
//                              "/" separators ("orgs", "lexdb.txt", "v3.cfg", models ...)
//   *.md                    -> nothing: the sources' own documentation (README.md, CREDITS.md)
// Only the two sources at the top of the directory are compiled. The engine cannot open an
// entry of 0 bytes, so an empty "share_links.txt", "lexdb.txt" or "orgs" is packed as a
// single line feed: the base then loads empty instead of failing the whole load.
//
// The packed text bases are read back with the engine's readers ("orgs", "lexdb.txt",
// "share_links.txt", "v3.cfg"), so that a base the engine would refuse is refused here.
// Every fault raises std::runtime_error naming the file (and, for sources, the line).
#pragma once

#include <filesystem>
#include <string>

#include "tools/kbtools/container_writer.h"

namespace pelmix::kbtools {

// The bytes of a file; raises std::runtime_error naming the file when it cannot be read.
std::string ReadWholeFile(const std::filesystem::path& path);

inline constexpr char kWhiteDomainsSource[] = "white_domains.txt";
inline constexpr char kCategorisedHostsSource[] = "categorised_hosts.txt";
inline constexpr char kDocumentationExtension[] = ".md";

// Fills `writer` from `dir`. A file equivalent to `skip` (the container being written, when
// it lies inside the directory) is left out.
void BuildKnowledgeBase(const std::filesystem::path& dir, const std::filesystem::path& skip,
                        ContainerWriter& writer);

}  // namespace pelmix::kbtools
