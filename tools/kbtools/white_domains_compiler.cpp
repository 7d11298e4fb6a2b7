#include "tools/kbtools/white_domains_compiler.h"

#include <algorithm>
#include <cstdint>
#include <stdexcept>
#include <vector>

#include "engine/kb/huffman_spooky.h"
#include "engine/kb/white_domains.h"
#include "tools/kbtools/public_suffix.h"
#include "tools/kbtools/source_text.h"
#include "tools/kbtools/wdb_writer.h"

namespace pelmix::kbtools {
namespace {

std::size_t Labels(std::string_view text) {
  return static_cast<std::size_t>(std::count(text.begin(), text.end(), '.')) + 1;
}

// A trailing "." dropped, letters lower-cased; raises for what the reader cannot code.
std::string NormalizeDomain(std::string_view field) {
  std::string domain = LowerAscii(field);
  if (!domain.empty() && domain.back() == '.') domain.pop_back();
  if (domain.empty()) throw std::invalid_argument("empty domain");
  for (const char c : domain) {
    if (wd::HuffmanSpooky::Symbol(c) < 0) {
      throw std::invalid_argument("domain " + domain + " has a character outside a-z 0-9 - .");
    }
  }
  if (domain.front() == '.' || domain.find("..") != std::string::npos) {
    throw std::invalid_argument("domain " + domain + " has an empty label");
  }
  return domain;
}

struct Listed {
  std::size_t line;
  std::string domain;
  std::uint16_t org;
};

}  // namespace

SplitDomain SplitWhiteDomain(const PublicSuffixList& list, const std::string& domain) {
  std::string suffix = list.SuffixOf(domain);
  if (suffix.empty() || suffix.size() >= domain.size()) {
    throw std::invalid_argument("domain " + domain + " is a public suffix");
  }
  while (!wd::SuffixPasses(suffix) || Labels(suffix) > wd::kMaxSuffixLabels) {
    const std::size_t dot = suffix.find('.');
    if (dot == std::string::npos) {
      throw std::invalid_argument("domain " + domain + " has no suffix the reader looks up");
    }
    suffix.erase(0, dot + 1);
  }
  return SplitDomain{domain.substr(0, domain.size() - suffix.size() - 1), suffix};
}

std::string CompileWhiteDomains(std::string_view text, const std::string& file) {
  const PublicSuffixList list;
  WdbWriter writer;
  std::vector<Listed> listed;
  for (const SourceLine& line : ReadSourceLines(text)) {
    if (line.fields.size() < 2 || line.fields.size() > 3) {
      throw SourceError(file, line.number, "expected ORG_ID DOMAIN [exact]");
    }
    const auto org = ParseNumber(line.fields[0], 0xFFFF);
    if (!org || *org == 0) {
      throw SourceError(file, line.number,
                        "organisation id must be 1 to 65535, got " + std::string(line.fields[0]));
    }
    if (line.fields.size() == 3 && line.fields[2] != "exact") {
      throw SourceError(file, line.number,
                        "third field must be \"exact\", got " + std::string(line.fields[2]));
    }
    try {
      const std::string domain = NormalizeDomain(line.fields[1]);
      const SplitDomain split = SplitWhiteDomain(list, domain);
      writer.Add(static_cast<std::uint16_t>(*org), split.name, split.suffix,
                 line.fields.size() == 3);
      listed.push_back(Listed{line.number, domain, static_cast<std::uint16_t>(*org)});
    } catch (const std::invalid_argument& e) {
      throw SourceError(file, line.number, e.what());
    }
  }

  std::string bytes = writer.Build();
  const wd::WhiteDomains reader(std::vector<std::uint8_t>(bytes.begin(), bytes.end()));
  for (const Listed& domain : listed) {
    const wd::DomainResult found = reader.Lookup(domain.domain);
    if (found.key == domain.org && found.partial_flag == 0 && found.other_suffix_flag == 0) {
      continue;
    }
    throw SourceError(file, domain.line,
                      domain.domain + " would not be found white for organisation " +
                          std::to_string(domain.org) + ": key=" + std::to_string(found.key) +
                          " partial=" + std::to_string(found.partial_flag) +
                          " other_suffix=" + std::to_string(found.other_suffix_flag));
  }
  return bytes;
}

}  // namespace pelmix::kbtools
