// Test support for the streaming scanners: chunk plans for the invariance tests and
// recording handlers that turn scanner calls into comparable event lists.
#pragma once

#include <gtest/gtest.h>

#include <cstdint>
#include <map>
#include <random>
#include <string>
#include <string_view>
#include <vector>

#include "engine/common/error.h"
#include "engine/html/data_url_machine.h"
#include "engine/html/js_parser.h"
#include "engine/html/tokenizer.h"

namespace html_test {

using Events = std::vector<std::string>;

inline std::vector<std::string_view> Bytewise(std::string_view doc) {
  std::vector<std::string_view> chunks;
  for (std::size_t i = 0; i < doc.size(); ++i) chunks.push_back(doc.substr(i, 1));
  return chunks;
}

// Mostly short chunks, now and then a long one, from a fixed seed.
inline std::vector<std::string_view> RandomChunks(std::string_view doc, std::uint32_t seed) {
  std::mt19937 random(seed);
  std::uniform_int_distribution<std::size_t> small(1, 7);
  std::uniform_int_distribution<std::size_t> large(8, 2100);
  std::vector<std::string_view> chunks;
  for (std::size_t at = 0; at < doc.size();) {
    const std::size_t n = (random() % 5 == 0) ? large(random) : small(random);
    chunks.push_back(doc.substr(at, n));
    at += chunks.back().size();
  }
  return chunks;
}

// scan(chunks) runs a fresh scanner over the chunks and returns its events. The events must
// not depend on where the chunks are cut.
template <typename Scan>
void ExpectChunkInvariant(std::string_view doc, Scan scan) {
  const Events whole = scan(std::vector<std::string_view>{doc});
  EXPECT_EQ(scan(Bytewise(doc)), whole) << "byte by byte: " << doc;
  for (std::uint32_t seed = 1; seed <= 6; ++seed) {
    EXPECT_EQ(scan(RandomChunks(doc, seed)), whole) << "seed " << seed << ": " << doc;
  }
}

// A tokenizer handler that records every call. What it wants is set by its policy.
class RecordingHandler {
 public:
  struct Policy {
    bool reportAttributes = true;  // openElement's answer
    int defaultMode = html::kAttrCollect;
    std::map<std::string, int, std::less<>> modes;  // per attribute name
    bool rawText = true;                            // startTagEnd's answer
    bool comments = true;                           // whether commentSink gives a sink
  };

  class Sink {
   public:
    explicit Sink(Events& events) : events_(events) {}
    void text(const char* data, std::size_t n) {
      events_.push_back("comment:" + std::string(data, n));
    }
    void end() { events_.push_back("comment_end"); }

   private:
    Events& events_;
  };

  RecordingHandler() = default;
  explicit RecordingHandler(Policy policy) : policy_(std::move(policy)) {}

  void text(const char* data, std::size_t n) { events.push_back("text:" + std::string(data, n)); }
  bool openElement(std::string_view name) {
    events.push_back("open:" + std::string(name));
    return policy_.reportAttributes;
  }
  bool startTagEnd() {
    events.push_back("tagend");
    return policy_.rawText;
  }
  void closeElement(std::string_view name) { events.push_back("close:" + std::string(name)); }
  int attributeName(std::string_view name) {
    events.push_back("attr:" + std::string(name));
    const auto it = policy_.modes.find(name);
    return it == policy_.modes.end() ? policy_.defaultMode : it->second;
  }
  void attributeValue(std::string_view value) { events.push_back("value:" + std::string(value)); }
  // Streamed bytes are merged into one event per run.
  void attributeChar(char c) {
    if (events.empty() || events.back().rfind("chars:", 0) != 0) events.push_back("chars:");
    events.back().push_back(c);
  }
  Sink* commentSink() { return policy_.comments ? &sink_ : nullptr; }
  void scriptText(const char* data, std::size_t n) {
    events.push_back("script:" + std::string(data, n));
  }

  Events events;

 private:
  Policy policy_;
  Sink sink_{events};
};

using Tokenizer = html::FastParserMachine<char, RecordingHandler>;

inline Events Tokenize(const std::vector<std::string_view>& chunks,
                       const RecordingHandler::Policy& policy = {}) {
  RecordingHandler handler(policy);
  {
    Tokenizer tokenizer(handler);
    for (std::string_view chunk : chunks) tokenizer.feed(chunk.data(), chunk.size());
  }
  return handler.events;
}

inline Events Tokenize(std::string_view doc, const RecordingHandler::Policy& policy = {}) {
  return Tokenize(std::vector<std::string_view>{doc}, policy);
}

// Script scanner: one event per text call, then the pieces handed over by finish.
class StringRecorder : public ap::JSParser<char>::Handler {
 public:
  void text(const char* data, std::size_t n) override { events.emplace_back(data, n); }
  Events events;
};

inline Events ScanScript(const std::vector<std::string_view>& chunks) {
  StringRecorder recorder;
  ap::JSParser<char> parser(&recorder);
  for (std::string_view chunk : chunks) parser.feed(chunk.data(), chunk.size());
  recorder.events.push_back("<finish>");
  parser.finish();
  return recorder.events;
}

inline Events ScanScript(std::string_view doc) {
  return ScanScript(std::vector<std::string_view>{doc});
}

// Data-URL decoder fed byte by byte, swallowing the header error as its users do.
class ByteRecorder : public utils::DataUrlMachine::Handler {
 public:
  void byte(std::uint8_t b) override { bytes.push_back(static_cast<char>(b)); }
  std::string bytes;
};

struct DecodedUrl {
  std::string mediaType;
  std::string bytes;
  std::size_t errors = 0;
};

inline DecodedUrl DecodeDataUrl(const std::vector<std::string_view>& chunks) {
  ByteRecorder recorder;
  utils::DataUrlMachine decoder(recorder);
  DecodedUrl result;
  for (std::string_view chunk : chunks) {
    for (const char c : chunk) {
      try {
        decoder.feed(static_cast<std::uint8_t>(c));
      } catch (const ap::Error&) {
        ++result.errors;
      }
    }
  }
  result.mediaType = decoder.mediaType();
  result.bytes = recorder.bytes;
  return result;
}

inline DecodedUrl DecodeDataUrl(std::string_view url) {
  return DecodeDataUrl(std::vector<std::string_view>{url});
}

}  // namespace html_test
