#include "tools/kbtools/wdb_writer.h"

#include <algorithm>
#include <stdexcept>

#include "engine/kb/huffman_spooky.h"
#include "engine/kb/white_domains.h"
#include "tools/kbtools/source_text.h"

namespace pelmix::kbtools {
namespace {

constexpr std::size_t kMaxListSize = 0xFFFF;

void PutBe(std::string& out, std::uint32_t value, int width) {
  for (int i = width - 1; i >= 0; --i) out += static_cast<char>((value >> (8 * i)) & 0xFF);
}

std::size_t Labels(std::string_view text) {
  return static_cast<std::size_t>(std::count(text.begin(), text.end(), '.')) + 1;
}

}  // namespace

std::size_t WdbWriter::ListSize(const Name& name) {
  std::size_t size = 0;
  for (const auto& [org, suffixes] : name.orgs) size += 4 + 3 * suffixes.size();
  return size;
}

void WdbWriter::Add(std::uint16_t org, std::string_view name_text, std::string_view suffix_text,
                    bool exact) {
  if (org == 0) throw std::invalid_argument("organisation 0 means \"not listed\"");
  const std::string name = LowerAscii(name_text);
  const std::string suffix = LowerAscii(suffix_text);
  if (name.empty()) throw std::invalid_argument("empty name");
  if (suffix.empty()) throw std::invalid_argument("empty suffix");
  if (!wd::SuffixPasses(suffix) || Labels(suffix) > wd::kMaxSuffixLabels) {
    throw std::invalid_argument("suffix " + suffix + " is never looked up");
  }
  std::uint8_t packed[wd::kMaxCodedLength];
  if (wd::HuffmanSpooky::Pack(name, packed) < 0) {
    throw std::invalid_argument("name " + name +
                                " has a character outside a-z 0-9 - . or is too long to code");
  }
  const wd::CodedName coded = wd::HuffmanSpooky::Code(name);
  if (coded.code == 0) throw std::invalid_argument("name " + name + " has the key 0");

  // Every check comes before the first change, so a refused listing leaves no trace.
  const std::pair<std::size_t, std::uint32_t> key{coded.length, coded.code};
  const auto found = names_.find(key);
  const std::uint16_t checksum = wd::SuffixChecksum(suffix);
  const std::uint8_t flag = exact ? 1 : 0;
  std::size_t list_size = 4 + 3;
  if (found != names_.end()) {
    const Name& entry = found->second;
    if (entry.text != name) {
      throw std::invalid_argument("name " + name + " has the same key as " + entry.text);
    }
    list_size = ListSize(entry);
    const auto org_it = entry.orgs.find(org);
    if (org_it == entry.orgs.end()) {
      list_size += 4 + 3;
    } else if (const auto it = org_it->second.find(checksum); it != org_it->second.end()) {
      if (it->second.flag == flag) return;  // the same item: nothing to add
      if (it->second.text == suffix) {
        throw std::invalid_argument(name + "." + suffix + " is listed with and without exact");
      }
      throw std::invalid_argument("suffix " + suffix + " has the checksum of " + it->second.text +
                                  " under the same name, with another flag");
    } else {
      list_size += 3;
    }
  }
  if (list_size > kMaxListSize) {
    throw std::invalid_argument("name " + name + " lists too many suffixes");
  }
  Name& entry = names_[key];
  entry.text = name;
  entry.orgs[org].emplace(checksum, Suffix{flag, suffix});
}

std::string WdbWriter::Build() const {
  const std::size_t largest = names_.empty() ? 0 : names_.rbegin()->first.first;
  std::string out(1 + 4 * largest, '\0');
  out[0] = static_cast<char>(largest);
  auto it = names_.begin();
  for (std::size_t k = 1; k <= largest; ++k) {
    if (out.size() > wd::kMaxImageSize) throw std::length_error("wdb would be too large");
    const auto offset = static_cast<std::uint32_t>(out.size());
    for (int i = 0; i < 4; ++i) {
      out[1 + 4 * (k - 1) + i] = static_cast<char>((offset >> (8 * (3 - i))) & 0xFF);
    }
    for (; it != names_.end() && it->first.first == k; ++it) {
      const Name& name = it->second;
      PutBe(out, it->first.second, 4);
      PutBe(out, static_cast<std::uint32_t>(ListSize(name)), 2);
      for (const auto& [org, suffixes] : name.orgs) {
        PutBe(out, org, 2);
        PutBe(out, static_cast<std::uint32_t>(suffixes.size()), 2);
        for (const auto& [checksum, suffix] : suffixes) {
          PutBe(out, checksum, 2);
          out += static_cast<char>(suffix.flag);
        }
      }
    }
  }
  if (out.size() > wd::kMaxImageSize) throw std::length_error("wdb would be too large");
  return out;
}

}  // namespace pelmix::kbtools
