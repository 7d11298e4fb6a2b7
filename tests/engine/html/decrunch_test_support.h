// Test support for the decrunch pipeline: a receiver that records every call it gets, and
// through every sink it hands out, as one string per call.
#pragma once

#include <cstdint>
#include <memory>
#include <set>
#include <string>
#include <string_view>
#include <vector>

#include "engine/html/decrunch.h"

namespace decrunch_test {

using Events = std::vector<std::string>;

// Events: "text:<data>", "break", "end" for the page text; "<sink>.text:<data>",
// "<sink>.break", "<sink>.end" for a sink; "sink:<sink>" when one is handed out (with
// ":<href>" for anchors and scripts); "url:<kind>:<url>"; "script_url:<url>";
// "input:<type>|<src>|<value>"; "begin_nested"; "end_nested".
class Recorder : public html::Decrunch::Handler {
 public:
  // Sinks named here are refused (the receiver answers none).
  explicit Recorder(std::set<std::string> refused = {}) : refused_(std::move(refused)) {}

  class Sink : public html::Decrunch::TextHandler {
   public:
    Sink(std::string name, Events& events) : name_(std::move(name)), events_(events) {}
    void text(const char* data, std::size_t n) override {
      events_.push_back(name_ + ".text:" + std::string(data, n));
    }
    void breakText() override { events_.push_back(name_ + ".break"); }
    void end() override { events_.push_back(name_ + ".end"); }

   private:
    std::string name_;
    Events& events_;
  };

  void text(const char* data, std::size_t n) override {
    events.push_back("text:" + std::string(data, n));
  }
  void breakText() override { events.push_back("break"); }
  void end() override { events.push_back("end"); }
  void url(std::string_view value, html::UrlKind kind) override {
    events.push_back("url:" + std::to_string(kind) + ":" + std::string(value));
  }
  void scriptUrl(std::string_view text) override {
    events.push_back("script_url:" + std::string(text));
  }
  TextHandler* commentSink() override { return hand("comment"); }
  TextHandler* titleSink() override { return hand("title"); }
  TextHandler* descriptionSink() override { return hand("description"); }
  TextHandler* selectSink() override { return hand("select"); }
  TextHandler* anchorSink(const html_decrunch::HtmlHandler& h) override {
    return hand("anchor", h.first().value);
  }
  TextHandler* scriptSink(const html_decrunch::HtmlHandler& h) override {
    return hand("script", h.first().value);
  }
  void input(const html_decrunch::HtmlHandler& h) override {
    events.push_back("input:" + h.first().value + "|" + h.second().value + "|" + h.third().value);
  }
  void beginNested() override { events.push_back("begin_nested"); }
  void endNested() override { events.push_back("end_nested"); }

  Events events;

 private:
  TextHandler* hand(const std::string& name, const std::string* href = nullptr) {
    if (refused_.count(name) != 0) return nullptr;
    events.push_back("sink:" + name + (href != nullptr ? ":" + *href : ""));
    sinks_.push_back(std::make_unique<Sink>(name, events));
    return sinks_.back().get();
  }
  TextHandler* hand(const std::string& name, const std::string& href) { return hand(name, &href); }

  std::set<std::string> refused_;
  std::vector<std::unique_ptr<Sink>> sinks_;
};

// Runs a fresh top-level pipeline over the chunks; the last event, after the pipeline is
// gone, is "json:<0|1>".
inline Events Decrunched(const std::vector<std::string_view>& chunks,
                         const std::set<std::string>& refused = {}) {
  Recorder recorder(refused);
  bool accepted;
  {
    html::Decrunch pipeline(recorder, false);
    for (std::string_view chunk : chunks) pipeline.feed(chunk.data(), chunk.size());
    accepted = pipeline.jsonAccepted();
  }
  recorder.events.push_back(std::string("json:") + (accepted ? "1" : "0"));
  return recorder.events;
}

// The base64 form of `bytes`, without padding (the data-URL decoder ignores it anyway).
inline std::string Base64(std::string_view bytes) {
  static constexpr char kDigits[] =
      "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
  std::string out;
  std::uint32_t bits = 0;
  int held = 0;
  for (const char c : bytes) {
    bits = (bits << 8) | static_cast<std::uint8_t>(c);
    for (held += 8; held >= 6;) out += kDigits[(bits >> (held -= 6)) & 63];
  }
  if (held > 0) out += kDigits[(bits << (6 - held)) & 63];
  return out;
}

inline Events Decrunched(std::string_view page, const std::set<std::string>& refused = {}) {
  return Decrunched(std::vector<std::string_view>{page}, refused);
}

}  // namespace decrunch_test
