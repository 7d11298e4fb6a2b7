// pelmix dump lexemes: which lines of a knowledge base's lexicon (its "lexdb.txt") the
// engine's word finders match in a page or a mail message, and how often. The pages go
// through the decrunch pipeline into the feature extractor and the messages through the
// mail walk into a mail checker, as the checkers take them; an observer on the extractor
// hears every match. The trainer counts these to learn the lexemes' weights.
#include <algorithm>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <iterator>
#include <map>
#include <memory>
#include <sstream>
#include <string>
#include <vector>

#include "engine/checkers/cached_white_domains.h"
#include "engine/checkers/mail_checker_v3.h"
#include "engine/features/html_features.h"
#include "engine/features/text_sinks.h"
#include "engine/html/decrunch.h"
#include "engine/kb/case_fold.h"
#include "engine/kb/kb_loader.h"
#include "host/stream.h"
#include "internal/helpers/io_adapters/antiphishing_io_adapter.h"
#include "tools/mail/checker_sink.h"
#include "tools/mail/message_splitter.h"
#include "tools/mail/message_walk.h"
#include "tools/pelmix/command.h"
#include "tools/pelmix/json_lines.h"
#include "tools/pelmix/kb_container.h"
#include "tools/pelmix/module_host.h"

namespace pelmix::cli {
namespace {

using LexemeDB = html_features::LexemeDB;

// An input bigger than this is not a page or a message the trainer wants; it is refused.
constexpr std::uintmax_t kMaxInputBytes = 64u << 20;

// Maps the database's terms and phrases back to the lines of the lexicon text they came
// from (1-based line numbers of the entry).
class LineIndex {
 public:
  // Fails (false, `error` set) when the text and the loaded database do not agree.
  bool Build(const std::string& text, const LexemeDB& db, std::string* error) {
    std::istringstream in(text);
    std::string raw;
    std::vector<std::pair<std::string, std::size_t>> phrases;  // normalised text, line
    std::size_t number = 0;
    bool inPhrases = true;
    while (std::getline(in, raw)) {
      ++number;
      const std::string line = lex::NormalizeLine(raw);
      if (number == 1 && !line.empty() && line[0] == '#') continue;
      if (line.empty() || line[0] == ' ' || line[0] == '\t') break;
      const std::string lexeme = line.substr(0, line.find_first_of(" \t"));
      if (inPhrases && lexeme.find('(') == std::string::npos) inPhrases = false;
      if (inPhrases) {
        phrases.emplace_back(lexeme, number);
        continue;
      }
      const std::uint32_t term = db.FindTerm(lexeme);
      if (term != 0) terms_.emplace(term, number);  // the first line of a word wins
    }
    // The loader builds the phrases in the order of their text; a phrase it dropped is
    // missing from its table, so lines and records are paired by their items' gaps.
    std::stable_sort(phrases.begin(), phrases.end(),
                     [](const auto& a, const auto& b) { return a.first < b.first; });
    const auto& records = db.phrases();
    std::size_t next = 0;
    std::vector<LexemeDB::PhraseMaker::Part> parts;
    for (const auto& [phrase, line] : phrases) {
      if (next >= records.size()) break;
      if (!LexemeDB::PhraseMaker::Split(phrase, parts)) continue;
      const auto& r = records[next];
      bool same = r.end - r.first + 1 == parts.size();
      for (std::size_t i = 1; same && i < parts.size(); ++i)
        same = db.items()[r.first + i - 1].gap == parts[i].gap;
      if (!same) continue;
      phraseLines_.push_back(line);
      ++next;
    }
    if (phraseLines_.size() != records.size()) {
      *error = "the lexicon's phrase lines do not match the loaded phrases";
      return false;
    }
    return true;
  }
  std::size_t TermLine(std::uint32_t term) const {
    const auto it = terms_.find(term);
    return it == terms_.end() ? 0 : it->second;
  }
  std::size_t PhraseLine(std::size_t index) const {
    return index < phraseLines_.size() ? phraseLines_[index] : 0;
  }

 private:
  std::map<std::uint32_t, std::size_t> terms_;
  std::vector<std::size_t> phraseLines_;
};

class LineCounter final : public html_features::LexemeObserverI {
 public:
  LineCounter(const LexemeDB& db, const LineIndex& index) : db_(db), index_(index) {}
  void lexeme(const lex::LexemeStats& stats) override {
    Count(index_.TermLine(db_.TermOfStats(&stats)));
  }
  void phrase(const LexemeDB::Phrase& p) override {
    const auto& all = db_.phrases();
    const auto address = reinterpret_cast<std::uintptr_t>(&p);
    const auto begin = reinterpret_cast<std::uintptr_t>(all.data());
    if (address < begin || address >= begin + all.size() * sizeof(p)) return;
    Count(index_.PhraseLine((address - begin) / sizeof(p)));
  }
  std::map<std::size_t, std::uint64_t> hits;

 private:
  void Count(std::size_t line) {
    if (line != 0) ++hits[line];
  }
  const LexemeDB& db_;
  const LineIndex& index_;
};

void Collect(const std::filesystem::path& path, std::vector<std::string>& files) {
  std::error_code ec;
  if (std::filesystem::is_directory(path, ec)) {
    std::vector<std::filesystem::path> entries;
    for (const auto& e : std::filesystem::recursive_directory_iterator(path, ec))
      if (e.is_regular_file()) entries.push_back(e.path());
    std::sort(entries.begin(), entries.end());
    for (const auto& e : entries) files.push_back(e.string());
  } else {
    files.push_back(path.string());
  }
}

bool ReadWhole(const std::string& path, std::string& data, std::string& error) {
  std::error_code ec;
  const auto size = std::filesystem::file_size(path, ec);
  if (ec) {
    error = ec.message();
    return false;
  }
  if (size > kMaxInputBytes) {
    error = "larger than " + std::to_string(kMaxInputBytes) + " bytes";
    return false;
  }
  std::ifstream in(path, std::ios::binary);
  data.assign(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
  if (!in && !in.eof()) {
    error = "cannot read";
    return false;
  }
  return true;
}

int RunDumpLexemes(const std::vector<std::string>& args, const GlobalOptions&) {
  std::string kbPath = DefaultKnowledgeBase();
  bool mail = false;
  std::vector<std::string> files;
  for (std::size_t i = 0; i < args.size(); ++i) {
    if (args[i] == "--kb") {
      if (i + 1 >= args.size()) return UsageError("dump lexemes: --kb needs a value");
      kbPath = args[++i];
    } else if (args[i] == "--mail") {
      mail = true;
    } else if (!args[i].empty() && args[i][0] == '-') {
      return UsageError("dump lexemes: unknown option " + args[i]);
    } else {
      Collect(args[i], files);
    }
  }
  if (files.empty()) return UsageError("dump lexemes: name a FILE or DIR");

  auto knowledge = std::make_shared<WebCheckerV3Data>();
  std::string lexicon;
  LineIndex index;
  try {
    std::string error;
    uvo::Ptr<host::FileStream> file = host::FileStream::Open(kbPath, &error);
    if (!file) throw KbFileError(error);
    loaders_misc::load(*knowledge,
                       std::make_shared<cf::adapters::AntiphishingIOAdapter>(file.Get()));
    const auto entry = OpenContainer(kbPath)->open(lex::kLexdbEntry);
    char buffer[64 * 1024];
    while (entry) {
      const std::int64_t got = entry->file_read(buffer, sizeof buffer);
      if (got <= 0) break;
      lexicon.append(buffer, static_cast<std::size_t>(got));
    }
    if (!index.Build(lexicon, knowledge->lexemes, &error)) throw KbFileError(error);
  } catch (const std::exception& e) {
    std::cerr << "pelmix dump lexemes: cannot load " << kbPath << ": " << DescribeFailure(e)
              << "\n";
    return kExitModule;
  }
  std::shared_ptr<const WebCheckerV3Data> data = knowledge;
  easy3_impl::CachedWhiteDomains lookup(*data->whiteDomains, data->shareLinks,
                                        data->categorisedHosts);
  int status = kExitOk;
  for (const std::string& name : files) {
    std::string input, error;
    JsonLine line;
    line.Bytes("file", name);
    if (!ReadWhole(name, input, error)) {
      line.Bytes("error", error).Write(std::cout);
      status = kExitFailure;
      continue;
    }
    LineCounter counter(data->lexemes, index);
    if (mail) {
      // An mbox's messages are counted together: the input is one document.
      const auto mode = mail::LooksLikeMbox(input) ? mail::MessageSplitter::Mode::kMbox
                                                   : mail::MessageSplitter::Mode::kSingle;
      mail::MessageSplitter splitter(mode, [&](mail::MessageBuffer& message) {
        easy3_impl::MailCheckerV3 checker(data, [] { return std::uint64_t{0}; });
        checker.SetLexemeObserver(&counter);
        mail::CheckerSink sink(checker);
        mail::WalkMessage(message, sink);
        checker.SetLexemeObserver(nullptr);
      });
      splitter.Feed(input);
      splitter.Finish();
    } else {
      ap::HTMLFeatures features(std::string(), lookup, data->lexemes);
      features.setLexemeObserver(&counter);
      html::Decrunch pipeline(features, false);
      pipeline.feed(input.data(), input.size());
    }
    std::string lines = "[", counts = "[";
    for (const auto& [number, n] : counter.hits) {
      lines += (lines.size() > 1 ? "," : "") + std::to_string(number);
      counts += (counts.size() > 1 ? "," : "") + std::to_string(n);
    }
    line.Raw("lines", lines + "]").Raw("counts", counts + "]").Write(std::cout);
  }
  return status;
}

}  // namespace

PELMIX_COMMAND({"dump lexemes", "[--kb FILE] [--mail] FILE|DIR...",
                "list the lexicon lines (lexdb.txt) the engine matches in pages or, with "
                "--mail, messages, with their counts",
                RunDumpLexemes})

}  // namespace pelmix::cli
