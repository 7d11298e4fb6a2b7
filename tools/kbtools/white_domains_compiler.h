// Compiles the text source white_domains.txt into the white-domain set "wdb".
//
// Lines "ORG_ID DOMAIN [exact]"; "#" starts a comment, blank lines are skipped. ORG_ID is
// 1 .. 65535. DOMAIN (a trailing "." dropped, letters lower-cased, only a-z 0-9 - . in
// labels that are not empty) is split with the Public Suffix List into its name and its
// public suffix: paypal.co.uk is the name paypal under co.uk. A suffix that the reader
// would never look up (it fails the suffix filter or has more than three labels) gives way
// to the longest shorter one that it would. "exact": the domain is white, its subdomains
// are not.
//
// The result is checked with the engine's reader: every listed domain must come back white
// and owned by its organisation. Every fault raises SourceError naming the file and line.
#pragma once

#include <string>
#include <string_view>

namespace pelmix::kbtools {

class PublicSuffixList;

// The name and the suffix that a domain is listed with.
struct SplitDomain {
  std::string name;
  std::string suffix;
};

// Splits a normalised domain; raises std::invalid_argument when it has no name part.
SplitDomain SplitWhiteDomain(const PublicSuffixList& list, const std::string& domain);

// The bytes of "wdb" for the source `text`; `file` names the source in errors.
std::string CompileWhiteDomains(std::string_view text, const std::string& file);

}  // namespace pelmix::kbtools
