#include "tools/kbtools/kb_lint.h"

#include <algorithm>
#include <cstdint>
#include <initializer_list>
#include <map>
#include <optional>
#include <set>
#include <stdexcept>
#include <string_view>

#include "engine/kb/case_fold.h"
#include "engine/kb/white_domains.h"
#include "tools/kbtools/kb_builder.h"
#include "tools/kbtools/source_text.h"
#include "tools/kbtools/white_domains_compiler.h"

namespace pelmix::kbtools {
namespace {

namespace fs = std::filesystem;

constexpr char kOrgsSource[] = "orgs";
constexpr char kLexdbSource[] = "lexdb.txt";
constexpr char kShareLinksSource[] = "share_links.txt";

// Raw lines as the line-oriented engine readers see them: split at LF, a CR before it
// dropped, the last line kept even without its LF.
std::vector<std::string_view> RawLines(std::string_view text) {
  std::vector<std::string_view> lines;
  while (!text.empty()) {
    const std::size_t end = text.find('\n');
    std::string_view line = text.substr(0, end);
    if (!line.empty() && line.back() == '\r') line.remove_suffix(1);
    lines.push_back(line);
    if (end == std::string_view::npos) break;
    text.remove_prefix(end + 1);
  }
  return lines;
}

std::vector<std::string_view> Fields(std::string_view line) {
  std::vector<std::string_view> fields;
  std::size_t i = 0;
  while (i < line.size()) {
    while (i < line.size() && (line[i] == ' ' || line[i] == '\t')) ++i;
    const std::size_t start = i;
    while (i < line.size() && line[i] != ' ' && line[i] != '\t') ++i;
    if (i > start) fields.push_back(line.substr(start, i - start));
  }
  return fields;
}

// Joins text and numbers. (Built by appending: GCC 12 at -O3 warns falsely on a literal
// added to a temporary string.)
std::string Cat(std::initializer_list<std::string_view> parts) {
  std::string text;
  for (std::string_view part : parts) text.append(part);
  return text;
}

std::string Num(std::uint64_t value) { return std::to_string(value); }

// The leading digits of a token, as the lexeme reader takes its numbers (0 when none).
std::uint64_t LeadingNumber(std::string_view token) {
  std::uint64_t value = 0;
  for (char c : token) {
    if (c < '0' || c > '9') break;
    value = std::min<std::uint64_t>(value * 10 + static_cast<unsigned>(c - '0'), UINT32_MAX);
  }
  return value;
}

class Linter {
 public:
  explicit Linter(fs::path dir) : dir_(std::move(dir)) {}

  LintReport Run() {
    LintOrgs();
    LintWhiteDomains();
    LintLexemes();
    LintShareLinks();
    LintCategorisedHosts();
    return std::move(report_);
  }

 private:
  void Problem(const std::string& file, std::size_t line, const std::string& message) {
    if (report_.problems.size() < kMaxLintProblems) {
      report_.problems.push_back(
          Cat({file, line ? ":" : "", line ? Num(line) : "", ": ", message}));
    }
    ++report_.problem_count;
  }

  std::optional<std::string> Read(const char* name) {
    const fs::path path = dir_ / name;
    std::error_code error;
    if (!fs::is_regular_file(path, error)) {
      Problem(name, 0, "missing");
      return std::nullopt;
    }
    return ReadWholeFile(path);
  }

  void LintOrgs() {
    const std::optional<std::string> text = Read(kOrgsSource);
    if (!text) return;
    const std::vector<std::string_view> lines = RawLines(*text);
    std::optional<std::uint64_t> last;
    for (std::size_t i = 0; i < lines.size(); i += 2) {
      const std::size_t number = i + 1;
      const std::vector<std::string_view> fields = Fields(lines[i]);
      const std::optional<std::uint64_t> id =
          fields.empty() ? std::nullopt : ParseNumber(fields[0], 0xFFFFFF);
      const std::optional<std::uint64_t> category =
          fields.size() < 2 ? std::nullopt : ParseNumber(fields[1], UINT32_MAX);
      if (!id || *id == 0) {
        Problem(kOrgsSource, number, "expected an organisation id (1 to 16777215) and a category");
        continue;
      }
      if (last && *id <= *last) {
        Problem(kOrgsSource, number,
                Cat({"id ", Num(*id), " is not above the one before it (", Num(*last),
                     "): the engine stops loading here"}));
      }
      if (!category || *category > 9) {
        Problem(kOrgsSource, number,
                Cat({"the category of ", Num(*id), " is not 0 to 9: the engine reads it as 6"}));
      }
      if (i + 1 >= lines.size()) {
        Problem(kOrgsSource, number, Cat({"organisation ", Num(*id), " has no name line"}));
      } else if (lines[i + 1].empty()) {
        Problem(kOrgsSource, number + 1, Cat({"organisation ", Num(*id), " has no name"}));
      } else if (lines[i + 1].size() > kMaxOrganisationNameBytes) {
        Problem(kOrgsSource, number + 1,
                Cat({"the name of ", Num(*id), " is longer than ", Num(kMaxOrganisationNameBytes),
                     " bytes"}));
      }
      orgs_.insert(*id);
      last = last ? std::max(*last, *id) : *id;
    }
    report_.organisations = orgs_.size();
  }

  void LintWhiteDomains() {
    const std::optional<std::string> text = Read(kWhiteDomainsSource);
    if (!text) return;
    std::map<std::string, std::size_t> seen;
    for (const SourceLine& line : ReadSourceLines(*text)) {
      if (line.fields.size() < 2) continue;  // the compiler names it below
      const std::optional<std::uint64_t> id = ParseNumber(line.fields[0], 0xFFFF);
      if (id && orgs_.count(*id) == 0) {
        Problem(kWhiteDomainsSource, line.number,
                Cat({"organisation ", Num(*id), " is not in orgs"}));
      }
      std::string domain = LowerAscii(line.fields[1]);
      if (!domain.empty() && domain.back() == '.') domain.pop_back();
      const auto [at, fresh] = seen.emplace(domain, line.number);
      if (!fresh) {
        Problem(kWhiteDomainsSource, line.number,
                Cat({"domain ", domain, " is listed twice (first on line ", Num(at->second), ")"}));
      }
      ++report_.white_domains;
    }
    try {
      const std::string image = CompileWhiteDomains(*text, kWhiteDomainsSource);
      white_.emplace(std::vector<std::uint8_t>(image.begin(), image.end()));
    } catch (const std::exception& e) {
      Problem(e.what(), 0, "the white domains do not compile, so white hosts were not checked");
    }
  }

  void LintLexemes() {
    const std::optional<std::string> text = Read(kLexdbSource);
    if (!text) return;
    const std::vector<std::string_view> lines = RawLines(*text);
    std::map<std::string, std::size_t> seen;
    bool inLexemes = false;
    for (std::size_t i = 0; i < lines.size(); ++i) {
      const std::size_t number = i + 1;
      if (i == 0 && !lines[i].empty() && lines[i][0] == '#') continue;  // capacity hints
      const std::string line = lex::NormalizeLine(lines[i]);
      if (line.empty() || line[0] == ' ') {
        if (i + 1 < lines.size()) {
          Problem(kLexdbSource, number, "an empty line or a leading blank ends the lexemes here");
        }
        break;
      }
      const std::size_t blank = line.find(' ');
      if (blank == std::string::npos) {
        Problem(kLexdbSource, number, "a lexeme needs a blank and its numbers");
        continue;
      }
      const std::string word = line.substr(0, blank);
      const bool phrase = word.find('(') != std::string::npos;
      if (phrase && inLexemes) {
        Problem(kLexdbSource, number,
                Cat({"phrase ", word, " comes after the first lexeme: it is read as a lexeme"}));
      }
      inLexemes = inLexemes || !phrase;
      const std::vector<std::string_view> numbers = Fields(std::string_view(line).substr(blank));
      const std::uint64_t org = numbers.size() > 1 ? LeadingNumber(numbers[1]) : 0;
      if (org != 0 && orgs_.count(org) == 0) {
        Problem(kLexdbSource, number,
                Cat({word, " is bound to organisation ", Num(org), ", not in orgs"}));
      }
      const auto [at, fresh] = seen.emplace(word, number);
      if (!fresh) {
        Problem(kLexdbSource, number,
                Cat({word, " is listed twice (first on line ", Num(at->second), ")"}));
      }
      ++report_.lexemes;
    }
  }

  void LintShareLinks() {
    const std::optional<std::string> text = Read(kShareLinksSource);
    if (!text) return;
    const std::vector<std::string_view> lines = RawLines(*text);
    std::map<std::pair<std::string, std::string>, std::size_t> seen;
    for (std::size_t i = 0; i < lines.size(); ++i) {
      const std::vector<std::string_view> fields = Fields(lines[i]);
      if (fields.empty()) continue;
      if (fields[0][0] == '#') {
        Problem(kShareLinksSource, i + 1, "share links have no comments: # is read as a host");
        continue;
      }
      // The reader pairs tokens across lines, so one stray token shifts every later pair.
      if (fields.size() != 2) {
        Problem(kShareLinksSource, i + 1, "a line holds one host and one path, nothing else");
        continue;
      }
      if (fields[1][0] != '/') {
        Problem(kShareLinksSource, i + 1, Cat({"path ", fields[1], " must start with /"}));
      }
      const auto [at, fresh] =
          seen.emplace(std::make_pair(std::string(fields[0]), std::string(fields[1])), i + 1);
      if (!fresh) {
        Problem(kShareLinksSource, i + 1,
                Cat({"listed twice (first on line ", Num(at->second), ")"}));
      }
      ++report_.share_links;
    }
  }

  void LintCategorisedHosts() {
    const std::optional<std::string> text = Read(kCategorisedHostsSource);
    if (!text) return;
    std::map<std::string, std::size_t> seen;
    for (const SourceLine& line : ReadSourceLines(*text)) {
      const std::string_view first = line.fields[0];
      if (first.find('/') != std::string_view::npos) continue;  // a path of an earlier host
      const std::string host = LowerAscii(first);
      const auto [at, fresh] = seen.emplace(host, line.number);
      if (!fresh) {
        Problem(kCategorisedHostsSource, line.number,
                Cat({"host ", host, " is listed twice (first on line ", Num(at->second), ")"}));
      }
      if (white_) {
        const wd::DomainResult result = white_->Lookup(host);
        if (result.key != 0 && result.partial_flag == 0 && result.other_suffix_flag == 0) {
          Problem(kCategorisedHostsSource, line.number,
                  Cat({"host ", host, " is white (organisation ", Num(result.key),
                       ") and must not be categorised"}));
        }
      }
      ++report_.categorised_hosts;
    }
  }

  fs::path dir_;
  LintReport report_;
  std::set<std::uint64_t> orgs_;
  std::optional<wd::WhiteDomains> white_;
};

}  // namespace

LintReport LintKnowledgeBaseSources(const fs::path& dir) {
  std::error_code error;
  if (!fs::is_directory(dir, error))
    throw std::runtime_error(Cat({dir.string(), ": not a directory"}));
  return Linter(dir).Run();
}

}  // namespace pelmix::kbtools
