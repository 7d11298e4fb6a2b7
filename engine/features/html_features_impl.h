// The state of one page's feature extractor (see html_features.h): the event recorder, the
// domain table and domain-kind map, the page URL record, the word finders and collectors.
#pragma once

#include <array>
#include <cstdint>
#include <map>
#include <string>
#include <unordered_map>
#include <vector>

#include "engine/features/event_recorder.h"
#include "engine/features/html_features.h"
#include "engine/features/text_sinks.h"
#include "engine/features/url_record.h"

namespace ap {

// Organisations the domain-kind map holds; a page naming more adds nothing to it.
inline constexpr std::size_t kMaxDomainKinds = 4096;
// Hosts whose site is remembered per page (own or foreign); past this many, a new host is
// asked about every time it comes.
inline constexpr std::size_t kMaxForeignHosts = 1024;

class HTMLFeatures::Impl {
 public:
  Impl(HTMLFeatures& owner, const std::string& pageUrl, WhiteDomainI& lookup,
       const LexemeDB& lexemes, TagAFeaturesI* consumer);

  // The domain table: up to 7 domains in order of first appearance, then "other" (7).
  struct DomainRecord {
    std::uint32_t key = 0;
    std::uint32_t hits = 0;
    std::uint32_t order = 0;
  };
  static constexpr std::size_t kDomains = 7;
  int domainIndex(std::uint32_t key);

  struct Kinds {
    std::array<float, 7> counters{};
    std::uint8_t mask = 0;
  };
  void mark(std::uint32_t key, int kind, float n);

  // Text handlers of the page-text and script-text word finders.
  struct PageText {
    Impl& f;
    void word();
    void lexeme(const lex::LexemeStats& s);
    void phrase(const LexemeDB::Phrase& p, std::uint16_t items);
  };
  struct ScriptText {
    Impl& f;
    void word();
    void lexeme(const lex::LexemeStats& s);
    void phrase(const LexemeDB::Phrase& p, std::uint16_t items);
  };

  void organisationText(const lex::LexemeStats& s);
  void sensitive(const lex::LexemeStats& s);
  void nestedWord();

  void resourceUrl(std::string_view value);
  void styleSheet(std::string_view value);
  void formAction(std::string_view value);
  void frame(std::string_view value);
  void urlLexemes(const html_features::UrlRecord& r);
  void scriptUrl(std::string_view value);
  void anchor(std::string_view href);
  void anchorEnd(const std::string& text);
  void scriptSource(std::string_view src);
  void inputElement();
  void titleEnd(const html_features::TitleLexer& title);

  // A host that is not the page's own site.
  bool foreign(const html_features::UrlRecord& r) const;
  bool knownOrg(const html_features::UrlRecord& r) const {
    return r.key != 0 && r.category != kNoOrgCategory;
  }
  void analyse(std::string_view url, bool hostFloats = false) {
    html_features::AnalyseUrl(url, lookup_, lexemes_, hostFloats, scratch_, &hosts_);
  }

  void vector(std::string& target, std::vector<float>& out, std::uint32_t bytes) const;

  HTMLFeatures& owner_;
  bool mail_;
  TagAFeaturesI* consumer_;
  bool consumerOpen_ = true;
  html_features::EventRecorder events_;
  bool styleSheetOrg_ = false, titleNamesOrg_ = false, descriptionNamesOrg_ = false;
  bool hasTitle_ = false;
  std::vector<DomainRecord> domains_;
  std::uint32_t overflow_ = 0;
  std::map<std::uint32_t, Kinds> kinds_;
  const LexemeDB& lexemes_;
  html_features::UrlRecord page_;
  std::string pageRegistrable_;
  // The answers of foreign() by host: a page links to few hosts many times, and the
  // registrable domain is costly to find.
  mutable std::unordered_map<std::string, bool> foreignHosts_;
  bool pageCategorised_ = false;
  WhiteDomainI& lookup_;
  std::int64_t lastSensitive_ = -1;
  int depth_ = 0;

  PageText pageHandler_{*this};
  lex::WordsFinder<LexemeDB, PageText> pageFinder_;
  lex::UTF8Normalizer<lex::WordsFinder<LexemeDB, PageText>> pageText_;
  ScriptText scriptHandler_{*this};
  lex::WordsFinder<LexemeDB, ScriptText> scriptFinder_;
  lex::UTF8Normalizer<lex::WordsFinder<LexemeDB, ScriptText>> scriptNormalizer_;
  html_features::LexerWrapper<decltype(scriptNormalizer_)> scriptText_;
  html_features::TitleLexer title_;
  html_features::TitleLexer description_;
  html_features::TextToString anchorText_;
  html_features::LexemeObserverI* observer_ = nullptr;
  bool inAnchor_ = false;
  std::array<float, html_features::kUrlRecordSize> anchorFive_{};
  html_features::UrlRecord scratch_;
  // The look-ups and lexemes of the hosts this page's URLs named.
  html_features::HostMemo hosts_;
};

}  // namespace ap
