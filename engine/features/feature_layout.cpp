#include "engine/features/feature_layout.h"

namespace html_features {
namespace {

std::string CodeName(int code) {
  static constexpr std::string_view kDomain[] = {"top1", "top2", "top3", "", "", "", "", "other"};
  auto slot = [&](int base) { return std::string(kDomain[code - base]); };
  switch (code) {
    case 0:
      return "anchor_to_org_financial";
    case 1:
      return "anchor_to_org_account";
    case 2:
      return "url_plain_lexemes";
    case 3:
      return "anchor_to_org_other";
    case 4:
      return "script_src_financial";
    case 28:
      return "script_url_org_other";
    case 29:
      return "script_url_unknown_foreign";
    case 30:
      return "anchor_text_org_lexeme";
    case 31:
      return "anchor_text_org_url";
    case 32:
      return "anchor_unknown_foreign";
    case 33:
      return "anchor_text_hostname";
    case 34:
      return "resource";
    case 35:
      return "resource_foreign_org";
    case 36:
      return "resource_own_or_relative";
    case 37:
      return "form_foreign";
    case 38:
      return "nested_word";
    case 39:
      return "lexeme_band0";
    case 40:
      return "lexeme_band1";
    case 41:
      return "lexeme_band2";
    case 42:
      return "phrase_band0";
    case 43:
      return "phrase_band1";
    case 44:
      return "phrase_band2";
    case 45:
      return "phrase_items";
    case 46:
      return "title_lexeme_weight";
    case 47:
      return "title_phrase_weight";
    case 48:
      return "unused";
    case 57:
      return "script_lexeme_band0";
    case 58:
      return "script_lexeme_band1";
    case 59:
      return "script_lexeme_band2";
    case 60:
      return "script_phrase";
    case 61:
      return "script_phrase_items";
    case 62:
      return "frame";
    case 63:
      return "input_after_sensitive";
    case 64:
      return "input";
    default:
      break;
  }
  if (code >= 5 && code < 13) return "link_domain_" + slot(5);
  if (code >= 13 && code < 21) return "url_org_lexeme_" + slot(13);
  if (code >= 21 && code < 28) return "script_url_domain_" + slot(21);
  return "text_org_" + slot(49);
}

std::string WebName(std::size_t i) {
  static constexpr std::string_view kSeg[] = {"seg1.", "seg2.", "seg3."};
  if (i < kSegmentRatiosBegin)
    return std::string(kSeg[i / kBinsPerSegment]) + CodeName(kKeptCodes[i % kBinsPerSegment]);
  if (i < kStyleSheetOrg) {
    static constexpr std::string_view kRatio[] = {"phrase_items_per_position",
                                                  "script_phrase_items_per_position",
                                                  "nested_words_per_position"};
    const std::size_t k = i - kSegmentRatiosBegin;
    return std::string(kSeg[k / 3]) + std::string(kRatio[k % 3]);
  }
  switch (i) {
    case kStyleSheetOrg:
      return "stylesheet_org";
    case kTitleNamesOrg:
      return "title_names_org";
    case kDescriptionNamesOrg:
      return "description_names_org";
    case kTitleMissing:
      return "title_missing_or_short";
    case kTitleOrgInText:
      return "title_org_in_text";
    case kDescriptionOrgInText:
      return "description_org_in_text";
    case kKindsTextResource:
      return "domain_text_and_resource";
    case kKindsTextScript:
      return "domain_text_and_script_text";
    case kTitlePhraseItemsPerWord:
      return "title_phrase_items_per_word";
    case kKindsTextOwn:
      return "domain_text_and_own";
    case kKindsResourceOwn:
      return "domain_resource_and_own";
    case kKindsScriptOwn:
      return "domain_script_text_and_own";
    case kUrlRecordBegin + 0:
      return "url.host_has_lexemes";
    case kUrlRecordBegin + 1:
      return "url.host_is_ip";
    case kUrlRecordBegin + 2:
      return "url.path_length";
    case kUrlRecordBegin + 3:
      return "url.host_length";
    case kUrlRecordBegin + 4:
      return "url.host_dots";
    case kByteCount:
      return "bytes";
    case kWhitePage:
      return "page_white";
    default:
      break;
  }
  if (i < kWhitePage) {
    const std::size_t k = i - kDomainClassesBegin;
    return "top" + std::to_string(k / 2 + 1) + (k % 2 == 0 ? ".financial" : ".account");
  }
  if (i < kHostFloatsBegin) return "top" + std::to_string(i - kOwnDomainBegin + 1) + ".own";
  static constexpr std::string_view kChannel[] = {"host.plain_lexeme.", "host.org_lexeme.",
                                                  "host.class_change."};
  const std::size_t k = i - kHostFloatsBegin;
  return std::string(kChannel[k / kHostChannelSize]) + std::to_string(k % kHostChannelSize);
}

}  // namespace

std::string FeatureName(std::size_t index, bool mail) {
  if (!mail) return index < kWebVectorSize ? WebName(index) : std::string();
  if (index >= kMailVectorSize) return std::string();
  if (index >= kMailPageVectorSize) {
    const std::size_t k = index - kMailPageVectorSize;
    if (k == 0) return "mail.dangerous_attachment";
    return "mail.link" + std::to_string((k - 1) / 10 + 1) + "." + std::to_string((k - 1) % 10);
  }
  return WebName(index < kUrlRecordBegin ? index : index + kUrlRecordSize);
}

}  // namespace html_features
