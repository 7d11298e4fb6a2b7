// The page feature extractor: the receiver of the decrunch pipeline and the producer of the
// feature vector the decision model reads. While a document streams through the pipeline it
// records events (words, brand words, links to known organisations' domains, forms posting
// elsewhere, inputs near sensitive words ...) by position in the page, keeps a small table
// of the organisations the page refers to, and at the end turns both into the vector whose
// layout engine/features/feature_layout.h names, and into a target text (the organisations'
// names).
//
// It trusts nothing it is fed: every budget an attacker could drive (events, live phrase
// candidates, domains, anchor organisations) is bounded by a named limit.
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "engine/html/decrunch_interfaces.h"
#include "engine/kb/lexeme_stats.h"
#include "engine/kb/white_domain_i.h"
#include "engine/kb/words_db.h"

namespace html_features {
class LexemeObserverI;
}  // namespace html_features

namespace ap {

class HTMLFeatures : public html::DecrunchInterfaces::Handler {
 public:
  using LexemeDB = lex::WordsDB<char, lex::LexemeStats>;

  // The consumer of per-link feature vectors (mail only): every anchor's vector, and the
  // vector of every link handed to analyseLink. Answering false stops further anchor
  // vectors.
  class TagAFeaturesI {
   public:
    virtual bool operator()(const std::vector<float>& features) = 0;
    virtual ~TagAFeaturesI() = default;
  };

  // The page URL is analysed at once; an empty URL (mail) gives a record of zeros. `lookup`
  // and `lexemes` must outlive the extractor.
  HTMLFeatures(const std::string& pageUrl, WhiteDomainI& lookup, const LexemeDB& lexemes,
               TagAFeaturesI* linkConsumer = nullptr);
  ~HTMLFeatures() override;
  HTMLFeatures(const HTMLFeatures&) = delete;
  HTMLFeatures& operator=(const HTMLFeatures&) = delete;

  // The page URL is on a white domain or a special address (and not a share link): checkers
  // neither scan it nor turn it into a vector.
  bool trusted() const;
  // The page URL's host and path are in the categorised host database.
  bool pageCategorised() const;

  // The vector and target text of everything fed so far; `byteCount` is the number of
  // bytes the pipeline was fed. Does not change the extractor: calling it twice, or feeding
  // more and calling again, gives what one call at the end would give.
  void GetVector(std::string& target, std::vector<float>& vector, std::uint32_t byteCount) const;

  // Mail links: analyses `url` as the page URL is analysed. A link on a white domain (and
  // not a share link) sends nothing and answers true; any other sends ten floats (the URL
  // record's five, then five zeros) to the link consumer and answers false.
  bool analyseLink(const std::string& url);
  // Whether `url`'s host and path are in the categorised host database.
  bool categorised(const std::string& url);

  // Every lexeme and phrase the extractor's word finders match from now on (page, script,
  // title, description and anchor text) is told to `observer` too; null stops it. The
  // observer must outlive the extractor or be replaced before it goes.
  void setLexemeObserver(html_features::LexemeObserverI* observer);

  // html::Decrunch::Handler
  void text(const char* data, std::size_t length) override;
  void breakText() override;
  void end() override;
  void url(std::string_view value, html::UrlKind kind) override;
  void scriptUrl(std::string_view text) override;
  TextHandler* commentSink() override;
  TextHandler* titleSink() override;
  TextHandler* descriptionSink() override;
  TextHandler* selectSink() override;
  TextHandler* anchorSink(const html_decrunch::HtmlHandler& handler) override;
  TextHandler* scriptSink(const html_decrunch::HtmlHandler& handler) override;
  void input(const html_decrunch::HtmlHandler& handler) override;
  void beginNested() override;
  void endNested() override;

  class Impl;

 private:
  std::unique_ptr<Impl> impl_;
};

}  // namespace ap
