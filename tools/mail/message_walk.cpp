#include "tools/mail/message_walk.h"

#include <gmime/gmime.h>

#include <algorithm>
#include <memory>
#include <mutex>
#include <unordered_set>

#include "tools/mail/link_finder.h"
#include "tools/mail/structure_budget.h"

namespace pelmix::mail {
namespace {

constexpr std::size_t kDecodeChunkBytes = 64u << 10;

// Charsets tried, in order, for header bytes that no encoded word declares.
const char* kFallbackCharsets[] = {"UTF-8", "windows-1252", nullptr};

void EnsureGMime() {
  static std::once_flag once;
  std::call_once(once, [] { g_mime_init(); });
}

// Holds one GObject reference.
template <typename T>
class Ref {
 public:
  explicit Ref(T* object = nullptr) : object_(object) {}
  ~Ref() {
    if (object_ != nullptr) g_object_unref(object_);
  }
  Ref(const Ref&) = delete;
  Ref& operator=(const Ref&) = delete;
  T* get() const { return object_; }

 private:
  T* object_;
};

struct GFree {
  void operator()(void* p) const { g_free(p); }
};

struct OptionsFree {
  void operator()(GMimeParserOptions* options) const { g_mime_parser_options_free(options); }
};

void OnParserWarning(gint64, GMimeParserWarning warning, const gchar*, gpointer user) {
  const auto code = static_cast<unsigned>(warning);
  if (code < 32) static_cast<WalkReport*>(user)->warnings |= 1u << code;
}

std::string BareType(GMimeObject* object) {
  std::string type = "application/octet-stream";
  if (GMimeContentType* contentType = g_mime_object_get_content_type(object)) {
    std::unique_ptr<char, GFree> mime(g_mime_content_type_get_mime_type(contentType));
    if (mime) type = mime.get();
  }
  std::transform(type.begin(), type.end(), type.begin(),
                 [](unsigned char c) { return static_cast<char>(g_ascii_tolower(c)); });
  return type;
}

// The file name from the disposition, else the older content-type "name"; nullptr when none.
const char* FileName(GMimeObject* object) {
  const char* name = g_mime_object_get_content_disposition_parameter(object, "filename");
  if (name == nullptr || *name == '\0') {
    name = g_mime_object_get_content_type_parameter(object, "name");
  }
  return name != nullptr && *name != '\0' ? name : nullptr;
}

bool IsAttachment(GMimeObject* object, const char* name) {
  if (name != nullptr) return true;
  GMimeContentDisposition* disposition = g_mime_object_get_content_disposition(object);
  return disposition != nullptr && g_mime_content_disposition_is_attachment(disposition);
}

// A converter to UTF-8, or nullptr when the text is meant as UTF-8 or ASCII already, or the
// charset is unknown: then the bytes are passed as they are.
GMimeFilter* ConverterFrom(const char* charset) {
  const char* canonical = g_mime_charset_canon_name(charset);
  if (canonical == nullptr || g_ascii_strcasecmp(canonical, "utf-8") == 0 ||
      g_ascii_strcasecmp(canonical, "us-ascii") == 0) {
    return nullptr;
  }
  return g_mime_filter_charset_new(charset, "UTF-8");
}

// At most `max` bytes of `text`, not ending inside a UTF-8 sequence.
std::string_view CutUtf8(std::string_view text, std::size_t max) {
  if (text.size() <= max) return text;
  std::size_t end = max;
  while (end > 0 && (static_cast<unsigned char>(text[end]) & 0xC0) == 0x80) --end;
  return text.substr(0, end);
}

class Walker {
 public:
  Walker(MessageSink& sink, const MailLimits& limits, WalkReport& report)
      : sink_(sink), limits_(limits), report_(report) {}

  void Message(GMimeMessage* message, int depth) {
    if (depth > limits_.maxDepth) {
      Hit(Limit::kDepth);
      return;
    }
    if (const char* subject = g_mime_message_get_subject(message)) {
      std::string_view text(subject);
      if (text.size() > limits_.maxSubjectBytes) {
        text = CutUtf8(text, limits_.maxSubjectBytes);
        Hit(Limit::kSubjectSize);
      }
      sink_.Subject(text, depth);
    }
    if (GMimeObject* body = g_mime_message_get_mime_part(message)) Object(body, depth);
  }

 private:
  void Hit(Limit limit) { report_.limits |= Bit(limit); }

  void Object(GMimeObject* object, int depth) {
    if (stopped_) return;
    if (depth > limits_.maxDepth) {
      Hit(Limit::kDepth);
      return;
    }
    if (report_.parts >= limits_.maxParts) {
      Hit(Limit::kParts);
      stopped_ = true;
      return;
    }
    ++report_.parts;
    if (GMIME_IS_MULTIPART(object)) {
      GMimeMultipart* multipart = GMIME_MULTIPART(object);
      const int count = g_mime_multipart_get_count(multipart);
      for (int i = 0; i < count && !stopped_; ++i) {
        Object(g_mime_multipart_get_part(multipart, i), depth + 1);
      }
    } else if (GMIME_IS_MESSAGE_PART(object)) {
      GMimeMessage* inner = g_mime_message_part_get_message(GMIME_MESSAGE_PART(object));
      const char* name = FileName(object);
      if (IsAttachment(object, name)) MessageAttachment(object, inner, name, depth);
      if (inner != nullptr) Message(inner, depth + 1);
    } else if (GMIME_IS_PART(object)) {
      Leaf(GMIME_PART(object), depth);
    }
  }

  void Leaf(GMimePart* part, int depth) {
    GMimeObject* object = GMIME_OBJECT(part);
    type_ = BareType(object);
    const char* name = FileName(object);
    const bool attachment = IsAttachment(object, name);
    const bool image = type_.starts_with("image/");
    const bool text = !attachment && type_.starts_with("text/");
    if (!attachment && !image && !text) return;

    PartInfo info;
    info.contentType = type_;
    info.depth = depth;
    const char* charset =
        text ? g_mime_object_get_content_type_parameter(object, "charset") : nullptr;
    if (charset != nullptr) info.charset = charset;
    Ref<GMimeFilter> converter(charset != nullptr ? ConverterFrom(charset) : nullptr);
    info.converted = converter.get() != nullptr;
    info.cut = !Decode(part, converter.get());
    if (info.cut) Hit(Limit::kPartSize);
    if (attachment) sink_.Attachment(name != nullptr ? name : "", data_, info);
    if (image) sink_.Image(data_, info);
    if (text) {
      sink_.Text(data_, info);
      if (type_ == "text/plain") Links();
    }
  }

  // An embedded message with a file name or an attachment disposition is an attachment too;
  // its data is the message as GMime writes it back out.
  void MessageAttachment(GMimeObject* object, GMimeMessage* inner, const char* name, int depth) {
    type_ = BareType(object);
    PartInfo info;
    info.contentType = type_;
    info.depth = depth;
    data_.clear();
    if (inner != nullptr) {
      Ref<GMimeStream> out(g_mime_stream_mem_new());
      g_mime_object_write_to_stream(GMIME_OBJECT(inner), nullptr, out.get());
      const GByteArray* bytes = g_mime_stream_mem_get_byte_array(GMIME_STREAM_MEM(out.get()));
      std::size_t size = bytes->len;
      if (size > limits_.maxPartBytes) {
        size = limits_.maxPartBytes;
        info.cut = true;
        Hit(Limit::kPartSize);
      }
      data_.assign(reinterpret_cast<const char*>(bytes->data), size);
    }
    sink_.Attachment(name != nullptr ? name : "", data_, info);
  }

  // Fills data_ with the part's transfer-decoded (and converted) content; false when it was
  // cut at the part budget.
  bool Decode(GMimePart* part, GMimeFilter* converter) {
    data_.clear();
    GMimeDataWrapper* content = g_mime_part_get_content(part);
    if (content == nullptr) return true;
    GMimeStream* raw = g_mime_data_wrapper_get_stream(content);
    if (raw == nullptr) return true;
    g_mime_stream_reset(raw);
    Ref<GMimeStream> filtered(g_mime_stream_filter_new(raw));
    GMimeStreamFilter* chain = GMIME_STREAM_FILTER(filtered.get());
    const GMimeContentEncoding encoding = g_mime_data_wrapper_get_encoding(content);
    if (encoding == GMIME_CONTENT_ENCODING_BASE64 ||
        encoding == GMIME_CONTENT_ENCODING_QUOTEDPRINTABLE ||
        encoding == GMIME_CONTENT_ENCODING_UUENCODE) {
      Ref<GMimeFilter> decoder(g_mime_filter_basic_new(encoding, FALSE));
      g_mime_stream_filter_add(chain, decoder.get());
    }
    if (converter != nullptr) g_mime_stream_filter_add(chain, converter);

    const std::size_t max = limits_.maxPartBytes;
    for (;;) {
      const std::size_t used = data_.size();
      // One byte past the budget tells a cut part from one that fits exactly.
      const std::size_t want = std::min(kDecodeChunkBytes, max - used + 1);
      data_.resize(used + want);
      const ssize_t n = g_mime_stream_read(filtered.get(), data_.data() + used, want);
      data_.resize(used + static_cast<std::size_t>(std::max<ssize_t>(n, 0)));
      if (n <= 0) return true;
      if (data_.size() > max) {
        data_.resize(max);
        return false;
      }
    }
  }

  void Links() {
    FindLinks(
        data_,
        [this](std::string_view link) {
          if (link.size() > limits_.maxLinkBytes) {
            link = link.substr(0, limits_.maxLinkBytes);
            Hit(Limit::kLinkSize);
          }
          std::string key(link);
          if (seen_.contains(key)) return;
          if (seen_.size() >= limits_.maxLinks) {
            Hit(Limit::kLinks);
            return;
          }
          seen_.insert(std::move(key));
          ++report_.links;
          sink_.Url(link);
        },
        scratch_);
  }

  MessageSink& sink_;
  const MailLimits& limits_;
  WalkReport& report_;
  bool stopped_ = false;
  std::string type_;
  std::string data_;  // the current part, reused from part to part
  std::string scratch_;
  std::unordered_set<std::string> seen_;
};

}  // namespace

WalkReport WalkMessage(const MessageBuffer& message, MessageSink& sink, const MailLimits& limits) {
  EnsureGMime();
  WalkReport report;
  if (message.cut) report.limits |= Bit(Limit::kMessageSize);
  const StructureCut cut = MeasureStructure(message.bytes(), limits);
  report.limits |= cut.limit;
  report.bytes = cut.length;

  // GMime reads the bytes where they are; the parsed parts refer to ranges of them.
  Ref<GMimeStream> whole(g_mime_stream_mem_new_with_byte_array(message.array()));
  g_mime_stream_mem_set_owner(GMIME_STREAM_MEM(whole.get()), FALSE);
  Ref<GMimeStream> stream(g_mime_stream_substream(whole.get(), 0, static_cast<gint64>(cut.length)));
  Ref<GMimeParser> parser(g_mime_parser_new_with_stream(stream.get()));
  g_mime_parser_set_format(parser.get(), GMIME_FORMAT_MESSAGE);
  std::unique_ptr<GMimeParserOptions, OptionsFree> options(g_mime_parser_options_new());
  g_mime_parser_options_set_warning_callback(options.get(), OnParserWarning, &report);
  g_mime_parser_options_set_fallback_charsets(options.get(), kFallbackCharsets);
  Ref<GMimeMessage> parsed(g_mime_parser_construct_message(parser.get(), options.get()));
  if (parsed.get() == nullptr) {
    report.error = message.size() == 0 ? "empty message"
                   : cut.length == 0   ? "the first header line is over the structure budget"
                                       : "no message header found";
    return report;
  }
  report.readable = true;
  Walker(sink, limits, report).Message(parsed.get(), 0);
  return report;
}

WalkReport WalkMessage(std::string_view message, MessageSink& sink, const MailLimits& limits) {
  MessageBuffer buffer;
  buffer.Append(message.substr(0, limits.maxMessageBytes));
  buffer.cut = message.size() > limits.maxMessageBytes;
  return WalkMessage(buffer, sink, limits);
}

std::vector<std::string_view> LimitNames(std::uint32_t limits) {
  std::vector<std::string_view> names;
  for (int i = 0; i < kLimitCount; ++i) {
    const auto limit = static_cast<Limit>(1u << i);
    if ((limits & Bit(limit)) != 0) names.push_back(LimitName(limit));
  }
  return names;
}

std::vector<std::string_view> WarningNames(std::uint32_t warnings) {
  static constexpr std::string_view kNames[] = {
      "",
      "duplicated header",
      "duplicated parameter",
      "unencoded 8-bit header",
      "invalid content type",
      "invalid encoded word",
      "malformed multipart",
      "truncated message",
      "malformed message",
      "invalid header name",
      "conflicting header",
      "conflicting parameter",
      "multipart without boundary",
      "invalid parameter",
      "invalid address list",
      "nesting overflow",
      "part without content",
      "part without headers or content",
  };
  std::vector<std::string_view> names;
  for (std::uint32_t code = 1; code < 32; ++code) {
    if ((warnings & (1u << code)) == 0) continue;
    names.push_back(code < std::size(kNames) ? kNames[code] : "unknown warning");
  }
  return names;
}

}  // namespace pelmix::mail
