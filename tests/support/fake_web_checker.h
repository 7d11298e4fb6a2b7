// A web checker that answers a verdict the test sets and records what the session hands it.
#pragma once

#include <memory>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

#include "engine/checkers/web_checker_i.h"

namespace pelmix::testing {

class FakeWebChecker final : public ap::easy2::WebCheckerI {
 public:
  void GetVerdict(ap::easy2::EngineVerdict& out) override {
    ++verdictsAsked;
    if (failVerdict) throw std::runtime_error("verdict failed");
    out = verdict;
  }
  void SetParameter(const std::string& name, const std::string& value) override {
    calls.push_back("param " + name + "=" + value);
  }
  void AppendData(const char* data, std::size_t length) override {
    calls.push_back("data " + std::string(data, length));
  }
  void AppendStream(std::shared_ptr<ap::ReadableFileI>) override { calls.push_back("stream"); }
  bool LastFeatures(std::vector<float>& vector) const override {
    vector = features;
    return !features.empty();
  }
  void SetExtHandler(ExtHandlerI* handler) override {
    calls.push_back("handler");
    extHandler = handler;
  }

  ap::easy2::EngineVerdict verdict;
  std::vector<float> features;
  bool failVerdict = false;
  int verdictsAsked = 0;
  std::vector<std::string> calls;
  ExtHandlerI* extHandler = nullptr;
};

}  // namespace pelmix::testing
