#include "engine/features/html_features.h"

#include <algorithm>

#include "engine/features/feature_layout.h"
#include "engine/features/html_features_impl.h"
#include "engine/html/html_handler.h"

namespace ap {

using namespace html_features;

namespace {

// An input counts as near a sensitive word at most this many positions after it.
constexpr std::int64_t kSensitiveWindow = 2;
// Flags (third number) of a lexeme that announces a credential input.
constexpr std::uint16_t kSensitiveFlags = 0x1 | 0x8;

float Weight(std::uint16_t w) { return static_cast<float>(w); }

}  // namespace

HTMLFeatures::Impl::Impl(HTMLFeatures& owner, const std::string& pageUrl, WhiteDomainI& lookup,
                         const LexemeDB& lexemes, TagAFeaturesI* consumer)
    : owner_(owner),
      mail_(consumer != nullptr),
      consumer_(consumer),
      lexemes_(lexemes),
      lookup_(lookup),
      pageFinder_(lexemes, pageHandler_),
      pageText_(pageFinder_),
      scriptFinder_(lexemes, scriptHandler_),
      scriptNormalizer_(scriptFinder_),
      scriptText_(scriptNormalizer_),
      title_(lexemes, [this](const TitleLexer& t) { titleEnd(t); }),
      description_(lexemes,
                   [this](const TitleLexer& t) {
                     descriptionNamesOrg_ = descriptionNamesOrg_ || !t.summary().keys.empty();
                   }),
      anchorText_([this](const std::string& text) { anchorEnd(text); }) {
  domains_.reserve(kDomains);
  if (pageUrl.empty()) return;
  AnalyseUrl(pageUrl, lookup_, lexemes_, true, page_);
  if (!page_.parts.hasHost) return;
  pageRegistrable_ = std::string(RegistrableDomain(page_.parts.host));
  mark(page_.key, 0, 1.0f);
  const std::string& host = page_.parts.host;
  const std::string& path = page_.parts.path;
  pageCategorised_ = lookup_.IsCategorised(host.data(), host.data() + host.size(), path.data(),
                                           path.data() + path.size());
}

int HTMLFeatures::Impl::domainIndex(std::uint32_t key) {
  for (std::size_t i = 0; i < domains_.size(); ++i) {
    if (domains_[i].key == key) {
      ++domains_[i].hits;
      return static_cast<int>(i);
    }
  }
  if (domains_.size() < kDomains) {
    domains_.push_back(DomainRecord{key, 1, static_cast<std::uint32_t>(domains_.size())});
    return static_cast<int>(domains_.size() - 1);
  }
  ++overflow_;
  return static_cast<int>(kDomains);
}

void HTMLFeatures::Impl::mark(std::uint32_t key, int kind, float n) {
  if (key == 0) return;
  auto it = kinds_.find(key);
  if (it == kinds_.end()) {
    if (kinds_.size() >= kMaxDomainKinds) return;
    it = kinds_.emplace(key, Kinds{}).first;
  }
  it->second.counters[kind] += n;
  it->second.mask |= static_cast<std::uint8_t>(1u << kind);
}

bool HTMLFeatures::Impl::foreign(const UrlRecord& r) const {
  if (mail_ || !page_.parts.hasHost) return true;
  if (page_.key != 0 && r.key == page_.key) return false;
  const std::string& host = r.parts.host;
  // The registrable domain of a host is a tail of the host (or the host itself), so a host
  // that does not end in the page's registrable domain is another site without asking the
  // suffix list.
  if (!std::string_view(host).ends_with(pageRegistrable_)) return true;
  if (const auto known = foreignHosts_.find(host); known != foreignHosts_.end())
    return known->second;
  const bool answer = RegistrableDomain(host) != pageRegistrable_;
  if (foreignHosts_.size() < kMaxForeignHosts) foreignHosts_.emplace(host, answer);
  return answer;
}

// --- words --------------------------------------------------------------------------------

void HTMLFeatures::Impl::nestedWord() {
  events_.advance();
  if (depth_ > 0) events_.add(kEvNestedWord);
}

void HTMLFeatures::Impl::sensitive(const lex::LexemeStats& s) {
  if ((s.third_value & kSensitiveFlags) != 0) lastSensitive_ = events_.position();
}

void HTMLFeatures::Impl::organisationText(const lex::LexemeStats& s) {
  if (s.second_value == 0) return;
  // A brand word of no weight still names its organisation.
  const float w = s.first_value != 0 ? Weight(s.first_value) : 1.0f;
  events_.add(kEvTextOrg + domainIndex(s.second_value), w);
  mark(s.second_value, 1, w);
}

void HTMLFeatures::Impl::PageText::word() { f.nestedWord(); }

void HTMLFeatures::Impl::PageText::lexeme(const lex::LexemeStats& s) {
  if (f.observer_ != nullptr) f.observer_->lexeme(s);
  f.events_.addWeighted(kEvLexeme, Weight(s.first_value));
  f.organisationText(s);
  f.sensitive(s);
}

void HTMLFeatures::Impl::PageText::phrase(const LexemeDB::Phrase& p, std::uint16_t items) {
  if (f.observer_ != nullptr) f.observer_->phrase(p);
  f.events_.addWeighted(kEvPhrase, Weight(p.stats.first_value));
  f.events_.add(kEvPhraseItems, items);
  f.organisationText(p.stats);
  f.sensitive(p.stats);
}

void HTMLFeatures::Impl::ScriptText::word() { f.nestedWord(); }

void HTMLFeatures::Impl::ScriptText::lexeme(const lex::LexemeStats& s) {
  if (f.observer_ != nullptr) f.observer_->lexeme(s);
  f.events_.addWeighted(kEvScriptLexeme, Weight(s.first_value));
  // Each hit adds one to the organisation's script-text counter.
  f.mark(s.second_value, 2, 1.0f);
}

void HTMLFeatures::Impl::ScriptText::phrase(const LexemeDB::Phrase& p, std::uint16_t items) {
  if (f.observer_ != nullptr) f.observer_->phrase(p);
  if (p.stats.first_value != 0) f.events_.add(kEvScriptPhrase, Weight(p.stats.first_value));
  f.events_.add(kEvScriptPhraseItems, items);
  f.mark(p.stats.second_value, 2, 1.0f);
}

// --- URLs ---------------------------------------------------------------------------------

void HTMLFeatures::Impl::resourceUrl(std::string_view value) {
  events_.add(kEvResource);
  analyse(value);
  if (!scratch_.parts.hasHost || !foreign(scratch_)) {
    events_.add(kEvResourceOwn);
    return;
  }
  if (knownOrg(scratch_)) {
    events_.add(kEvResourceForeignOrg);
    mark(scratch_.key, 6, 1.0f);
  }
}

void HTMLFeatures::Impl::styleSheet(std::string_view value) {
  analyse(value);
  if (!scratch_.parts.hasHost) return;
  styleSheetOrg_ = knownOrg(scratch_);
  if (styleSheetOrg_) {
    domainIndex(scratch_.key);
    mark(scratch_.key, 6, 1.0f);
  }
}

void HTMLFeatures::Impl::formAction(std::string_view value) {
  analyse(value);
  if (scratch_.parts.hasHost && foreign(scratch_)) events_.add(kEvFormForeign);
}

void HTMLFeatures::Impl::frame(std::string_view value) {
  if (!value.empty()) events_.add(kEvFrame);
  analyse(value);
  urlLexemes(scratch_);
}

// Codes 2 and 13-20: the lexemes of a link's host, or failing that of its path.
// The host's were found when the URL was analysed, unless its host channels were computed.
void HTMLFeatures::Impl::urlLexemes(const UrlRecord& r) {
  constexpr std::size_t kMaxKeys = UrlRecord::kMaxHostLexemeKeys;
  std::uint32_t keys[kMaxKeys];
  const std::uint32_t* found = keys;
  std::size_t count = 0;
  bool any = false;
  if (r.parts.hasHost && r.hostKeysKnown) {
    any = r.hostLexemes;
    found = r.hostKeys.data();
    count = r.hostKeyCount;
  } else if (r.parts.hasHost) {
    any = TextLexemes(r.parts.unicodeHost, lexemes_, keys, kMaxKeys, count);
  }
  if (!any) {
    found = keys;
    any = TextLexemes(r.parts.path, lexemes_, keys, kMaxKeys, count);
  }
  if (!any) return;
  if (count == 0) {
    events_.add(kEvUrlPlainLexeme);
    return;
  }
  for (std::size_t i = 0; i < count; ++i) events_.add(kEvUrlOrgLexeme + domainIndex(found[i]));
}

void HTMLFeatures::Impl::scriptUrl(std::string_view value) {
  analyse(value);
  if (!scratch_.parts.hasHost) return;
  if (knownOrg(scratch_)) {
    if (LinkClassOf(scratch_.category) != 3 && scratch_.category < 10) {
      events_.add(kEvScriptUrlDomain + domainIndex(scratch_.key));
      mark(scratch_.key, 5, 1.0f);
    } else {
      events_.add(kEvScriptUrlOther);
    }
  } else if (scratch_.key == 0 && foreign(scratch_)) {
    events_.add(kEvScriptUrlUnknown);
  }
}

void HTMLFeatures::Impl::scriptSource(std::string_view src) {
  if (src.empty()) return;
  analyse(src);
  if (!scratch_.parts.hasHost || !knownOrg(scratch_) || LinkClassOf(scratch_.category) != 0) return;
  events_.add(kEvScriptSrcFinancial);
  events_.add(kEvLinkDomain + domainIndex(scratch_.key));
  mark(scratch_.key, 3, 1.0f);
}

void HTMLFeatures::Impl::anchor(std::string_view href) {
  analyse(href);
  const UrlRecord& r = scratch_;
  const bool webLink = r.parts.linkClass != LinkClass::kNone && r.parts.hasHost;
  if (webLink && foreign(r)) {
    if (knownOrg(r)) {
      events_.add(LinkClassOf(r.category));
      events_.add(kEvLinkDomain + domainIndex(r.key));
      mark(r.key, 3, 1.0f);
    } else if (r.key == 0 && !mail_) {
      events_.add(kEvAnchorUnknownHost);
    }
  }
  urlLexemes(r);
  anchorFive_ = r.five();
  inAnchor_ = true;
  anchorText_.start();
}

void HTMLFeatures::Impl::anchorEnd(const std::string& text) {
  if (!inAnchor_) return;
  inAnchor_ = false;
  // The anchor's own lexemes: their weights and the organisations they name.
  LexemeSummary summary;
  summary.observer = observer_;
  {
    lex::WordsFinder<LexemeDB, LexemeSummary> finder(lexemes_, summary);
    lex::UTF8Normalizer<lex::WordsFinder<LexemeDB, LexemeSummary>> normalizer(finder);
    normalizer.text(text.data(), text.size());
    normalizer.wordEnd();
  }
  const bool namesOrg = !summary.keys.empty();
  if (namesOrg) events_.add(kEvAnchorTextOrg);

  std::string_view t(text);
  while (!t.empty() && static_cast<unsigned char>(t.front()) <= 0x20) t.remove_prefix(1);
  while (!t.empty() && static_cast<unsigned char>(t.back()) <= 0x20) t.remove_suffix(1);

  bool looksLikeHost = false;
  if (t.size() >= 6) {
    const std::size_t dot = t.rfind('.');
    if (dot != std::string_view::npos && dot >= t.size() - 6) {
      std::string ending(t.substr(dot + 1));
      for (char& c : ending) c = (c >= 'A' && c <= 'Z') ? static_cast<char>(c + 32) : c;
      looksLikeHost = IsTopLevelDomain(ending);
    }
  }
  if (looksLikeHost) events_.add(kEvAnchorTextHost);

  // Anchor text that reads as an address of a known organisation: with a scheme, or a bare
  // host name followed by an optional path.
  bool textUrl = false;
  if (!t.empty() && t.size() <= 2048 && t.find(' ') == std::string_view::npos) {
    analyse(t);
    if (!scratch_.parts.hasHost && t.find('.') != std::string_view::npos &&
        t.find(':') == std::string_view::npos)
      analyse("http://" + std::string(t));
    if (scratch_.parts.hasHost && knownOrg(scratch_)) {
      textUrl = true;
      events_.add(kEvAnchorTextUrl);
      events_.add(kEvUrlOrgLexeme + domainIndex(scratch_.key));
    }
  }

  if (mail_ && consumerOpen_) {
    std::vector<float> v(anchorFive_.begin(), anchorFive_.end());
    v.push_back(static_cast<float>(summary.lexemeTotal()));
    v.push_back(static_cast<float>(summary.phraseTotal()));
    v.push_back(namesOrg ? 1.0f : 0.0f);
    v.push_back(looksLikeHost ? 1.0f : 0.0f);
    v.push_back(textUrl ? 1.0f : 0.0f);
    consumerOpen_ = (*consumer_)(v);
  }
}

void HTMLFeatures::Impl::inputElement() {
  // An input element stands between words: the word before it ends first.
  pageText_.wordEnd();
  nestedWord();
  events_.add(kEvInput);
  if (lastSensitive_ >= 0 &&
      static_cast<std::int64_t>(events_.position()) - lastSensitive_ <= kSensitiveWindow) {
    events_.add(kEvInputAfterSensitive);
    lastSensitive_ = -1;
  }
}

void HTMLFeatures::Impl::titleEnd(const TitleLexer& title) {
  const LexemeSummary& s = title.summary();
  if (s.lexemeTotal() != 0) events_.add(kEvTitleLexemes, static_cast<float>(s.lexemeTotal()));
  if (s.phraseTotal() != 0) events_.add(kEvTitlePhrases, static_cast<float>(s.phraseTotal()));
  for (std::uint32_t key : s.keys) {
    titleNamesOrg_ = true;
    events_.add(kEvTextOrg + domainIndex(key), 1.0f);
  }
}

// --- the interface ------------------------------------------------------------------------

HTMLFeatures::HTMLFeatures(const std::string& pageUrl, WhiteDomainI& lookup,
                           const LexemeDB& lexemes, TagAFeaturesI* linkConsumer)
    : impl_(std::make_unique<Impl>(*this, pageUrl, lookup, lexemes, linkConsumer)) {}

HTMLFeatures::~HTMLFeatures() = default;

void HTMLFeatures::setLexemeObserver(html_features::LexemeObserverI* observer) {
  impl_->observer_ = observer;
  impl_->title_.setObserver(observer);
  impl_->description_.setObserver(observer);
}

bool HTMLFeatures::trusted() const { return impl_->page_.trusted; }
bool HTMLFeatures::pageCategorised() const { return impl_->pageCategorised_; }

void HTMLFeatures::GetVector(std::string& target, std::vector<float>& vector,
                             std::uint32_t byteCount) const {
  impl_->vector(target, vector, byteCount);
}

bool HTMLFeatures::analyseLink(const std::string& url) {
  impl_->analyse(url);
  const UrlRecord& r = impl_->scratch_;
  if (r.parts.hasHost && r.white) return true;
  if (impl_->consumer_ != nullptr) {
    const auto five = r.five();
    std::vector<float> v(five.begin(), five.end());
    v.resize(2 * kUrlRecordSize, 0.0f);
    (*impl_->consumer_)(v);
  }
  return false;
}

bool HTMLFeatures::categorised(const std::string& url) {
  UrlParts parts;
  SplitUrl(url, parts);
  if (!parts.hasHost) return false;
  return impl_->lookup_.IsCategorised(parts.host.data(), parts.host.data() + parts.host.size(),
                                      parts.path.data(), parts.path.data() + parts.path.size());
}

void HTMLFeatures::text(const char* data, std::size_t length) {
  impl_->pageText_.text(data, length);
}
void HTMLFeatures::breakText() { impl_->pageText_.wordEnd(); }
void HTMLFeatures::end() {}

void HTMLFeatures::url(std::string_view value, html::UrlKind kind) {
  switch (static_cast<int>(kind)) {
    case 0:
    case 1:
    case 3:
    case 6:
    case 9:
      impl_->resourceUrl(value);
      break;
    case 2:
      impl_->styleSheet(value);
      break;
    case 5:
      impl_->formAction(value);
      break;
    case 7:
    case 8:
      impl_->frame(value);
      break;
    default:  // 4 icons, 11 links found in PDFs (they reach the vector as mail links)
      break;
  }
}

void HTMLFeatures::scriptUrl(std::string_view text) { impl_->scriptUrl(text); }
HTMLFeatures::TextHandler* HTMLFeatures::commentSink() { return nullptr; }

HTMLFeatures::TextHandler* HTMLFeatures::titleSink() {
  impl_->hasTitle_ = true;
  return &impl_->title_;
}

HTMLFeatures::TextHandler* HTMLFeatures::descriptionSink() { return &impl_->description_; }

HTMLFeatures::TextHandler* HTMLFeatures::selectSink() {
  impl_->inputElement();
  return nullptr;
}

HTMLFeatures::TextHandler* HTMLFeatures::anchorSink(const html_decrunch::HtmlHandler& handler) {
  impl_->anchor(handler.first().value);
  return &impl_->anchorText_;
}

HTMLFeatures::TextHandler* HTMLFeatures::scriptSink(const html_decrunch::HtmlHandler& handler) {
  impl_->scriptSource(handler.first().value);
  return &impl_->scriptText_;
}

void HTMLFeatures::input(const html_decrunch::HtmlHandler&) { impl_->inputElement(); }
void HTMLFeatures::beginNested() { ++impl_->depth_; }
void HTMLFeatures::endNested() {
  if (impl_->depth_ > 0) --impl_->depth_;
}

}  // namespace ap
