// The Public Suffix List as libpsl knows it (its built-in list, else the system's file):
// where a domain's registrable name ends and its public suffix begins.
#pragma once

#include <memory>
#include <string>
#include <string_view>

namespace pelmix::kbtools {

// The system's copy of the list, read when libpsl has no list built in.
inline constexpr char kSystemSuffixList[] = "/usr/share/publicsuffix/public_suffix_list.dat";

class PublicSuffixList {
 public:
  // Raises std::runtime_error when no list can be loaded.
  PublicSuffixList();
  ~PublicSuffixList();
  PublicSuffixList(const PublicSuffixList&) = delete;
  PublicSuffixList& operator=(const PublicSuffixList&) = delete;

  // The longest public suffix of a lower-case domain, private rules included (so that
  // brand.github.io splits as brand + github.io). The whole domain when it is a public
  // suffix itself.
  std::string SuffixOf(std::string_view domain) const;

 private:
  struct Context;
  std::unique_ptr<Context> context_;
};

}  // namespace pelmix::kbtools
