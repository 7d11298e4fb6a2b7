// Writes the white-domain set "wdb": the one writer of the format that wd::WhiteDomains
// reads. It is given names already split from their public suffixes; the text source
// white_domains.txt is compiled by CompileWhiteDomains (white_domains_compiler.h).
//
// Output: M, the bucket offset table, then buckets 1 .. M; in a bucket the names in key
// order, in a name the organisations in id order, in an organisation the suffixes in
// checksum order. The same listings always give the same bytes.
#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <string_view>
#include <utility>

namespace pelmix::kbtools {

class WdbWriter {
 public:
  // Lists `name` (lower-cased here) under `suffix` for organisation `org`; `exact` makes the
  // domain white only when written without extra labels. A repeated listing is kept once.
  // Raises std::invalid_argument, with the reason, for what the reader could never find or
  // the format cannot hold: organisation 0; an empty name or suffix; a name with a
  // character outside the code or coded longer than 255 bytes; a name whose key is 0 or
  // equals another name's key; a suffix that fails the reader's suffix filter or has more
  // than three labels; the same domain listed with and without `exact`; two suffixes of a
  // name and organisation with the same checksum but different flags; a name whose
  // organisation list outgrows its 16-bit length.
  void Add(std::uint16_t org, std::string_view name, std::string_view suffix, bool exact);

  std::size_t name_count() const { return names_.size(); }

  // The file's bytes. Raises std::length_error when they would exceed the reader's limit.
  std::string Build() const;

 private:
  struct Suffix {
    std::uint8_t flag = 0;
    std::string text;  // the first suffix listed with this checksum
  };
  struct Name {
    std::string text;
    std::map<std::uint16_t, std::map<std::uint16_t, Suffix>> orgs;  // org -> checksum -> item
  };
  static std::size_t ListSize(const Name& name);

  // Keyed by coded length and key: the bucket order.
  std::map<std::pair<std::size_t, std::uint32_t>, Name> names_;
};

}  // namespace pelmix::kbtools
