// The feature vector of a page, assembled from the extractor's state without changing it.
#include <algorithm>

#include "engine/features/feature_layout.h"
#include "engine/features/html_features_impl.h"

namespace ap {

using namespace html_features;

namespace {

using Histogram = EventRecorder::Histogram;

float Flag(bool b) { return b ? 1.0f : 0.0f; }

void Normalise(float* bins, std::size_t count) {
  float sum = 0;
  for (std::size_t i = 0; i < count; ++i) sum += bins[i];
  if (sum == 0) return;
  for (std::size_t i = 0; i < count; ++i) bins[i] /= sum;
}

}  // namespace

void HTMLFeatures::Impl::vector(std::string& target, std::vector<float>& out,
                                std::uint32_t bytes) const {
  const EventRecorder::Segments segments = events_.finish();
  out.clear();
  out.reserve(kWebVectorSize);

  // 1, 2: the three histograms, then per segment three ratios to its positions.
  std::vector<float> ratios;
  for (std::size_t s = 0; s < kSegments; ++s) {
    Histogram bins = segments.bins[s];
    Normalise(&bins[0], 4);
    Normalise(&bins[34], 3);
    out.insert(out.end(), bins.begin(), bins.end());
    const float positions = static_cast<float>(segments.positions[s]);
    for (int code : {kEvPhraseItems, kEvScriptPhraseItems, kEvNestedWord})
      ratios.push_back(positions == 0 ? 0.0f : bins[code] / positions);
  }
  out.insert(out.end(), ratios.begin(), ratios.end());

  // 3: style sheet, title and description, title presence and length.
  out.push_back(Flag(styleSheetOrg_));
  out.push_back(Flag(titleNamesOrg_));
  out.push_back(Flag(descriptionNamesOrg_));
  out.push_back(!hasTitle_ ? 1.0f : title_.bytes() < 3 ? 0.5f : 0.0f);

  // 4: an organisation of the title or description also named by the page text.
  auto namedInText = [this](const TitleLexer& lexer) {
    for (std::uint32_t key : lexer.summary().keys) {
      const auto it = kinds_.find(key);
      if (it != kinds_.end() && it->second.counters[1] != 0) return true;
    }
    return false;
  };
  out.push_back(Flag(namedInText(title_)));
  out.push_back(Flag(namedInText(description_)));

  // 5, 6, 7: domains seen in two ways, and the title's phrase density.
  auto bothKinds = [this](int a, int b) {
    const std::uint8_t want = static_cast<std::uint8_t>(1u << a | 1u << b);
    for (const auto& [key, kinds] : kinds_)
      if ((kinds.mask & want) == want) return true;
    return false;
  };
  out.push_back(Flag(bothKinds(1, 6)));
  out.push_back(Flag(bothKinds(1, 2)));
  const LexemeSummary& t = title_.summary();
  out.push_back(t.words == 0 ? 0.0f : static_cast<float>(double(t.phraseItems) / t.words));
  out.push_back(Flag(bothKinds(1, 0)));
  out.push_back(Flag(bothKinds(6, 0)));
  out.push_back(Flag(bothKinds(2, 0)));

  // 8, 9: the page URL's record (web pages only), the bytes fed.
  if (!mail_) {
    const auto five = page_.five();
    out.insert(out.end(), five.begin(), five.end());
  }
  out.push_back(static_cast<float>(bytes));

  // 10: the domains by hits (ties keep their order of appearance); the top three take the
  // first per-domain slots of every segment, whose bins of indexes 3 to 6 are dropped.
  std::vector<DomainRecord> table = domains_;
  std::stable_sort(table.begin(), table.end(),
                   [](const DomainRecord& a, const DomainRecord& b) { return a.hits > b.hits; });
  int top[3];
  for (int i = 0; i < 3; ++i)
    top[i] = i < static_cast<int>(table.size()) ? static_cast<int>(table[i].order) : 7;
  std::vector<float> segmentsOut;
  segmentsOut.reserve(kSegmentCount * kBinsPerSegment);
  for (std::size_t s = 0; s < kSegments; ++s) {
    Histogram bins;
    std::copy_n(out.begin() + s * kEventCodes, kEventCodes, bins.begin());
    const Histogram original = bins;
    for (int base : {kEvLinkDomain, kEvUrlOrgLexeme, kEvScriptUrlDomain, kEvTextOrg})
      for (int i = 0; i < 3; ++i) bins[base + i] = original[base + top[i]];
    for (int code : kKeptCodes) segmentsOut.push_back(bins[code]);
  }
  out.erase(out.begin(), out.begin() + kSegments * kEventCodes);
  out.insert(out.begin(), segmentsOut.begin(), segmentsOut.end());

  for (int i = 0; i < 3; ++i) {
    int cls = 3;
    if (i < static_cast<int>(table.size())) {
      OrgResult org;
      lookup_.find_org(table[i].key, org);
      cls = LinkClassOf(org.category);
    }
    out.push_back(Flag(cls == 0));
    out.push_back(Flag(cls == 1));
  }
  if (page_.white) {
    out.push_back(1.0f);
    for (int i = 0; i < 3; ++i) {
      const std::uint32_t key = i < static_cast<int>(table.size()) ? table[i].key : 0;
      out.push_back(Flag(key == page_.key));
    }
  } else {
    out.insert(out.end(), 4, 0.0f);
  }

  // 11: the page host's three channels (web pages only).
  if (!mail_) out.insert(out.end(), page_.hostFloats.begin(), page_.hostFloats.end());

  target.clear();
  for (const DomainRecord& d : table) {
    OrgResult org;
    const bool found = lookup_.find_org(d.key, org);
    if (!target.empty()) target.push_back(' ');
    if (found && !org.name.empty()) {
      target.append(org.name);
    } else {
      target += std::to_string(d.key);
    }
  }
}

}  // namespace ap
