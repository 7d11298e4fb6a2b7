// Variants of the example knowledge base whose web model answers the same whatever the page,
// so that tests can drive the verdict rules (JSON, loud draw, blocks) around a known decision.
#pragma once

#include <string>

#include "tests/support/example_kb.h"

namespace service_test {

// A model that says phishing with certainty to every page (both outputs a sigmoid of bias
// 20, which rounds to 1 in single precision), with `config` as "v3.cfg".
inline std::string AlwaysPhishing(const std::string& config) {
  Entries entries = ExampleEntries();
  entries["web.flow"] = R"({"convs":{"n":{"type":"neur","src":"always.net"}},)"
                        R"("flow":[{"name":"o","input":[[0,1]],"conv":"n"}]})";
  entries["always.net"] = "1 2 2 20 0 20 0";
  entries["v3.cfg"] = config;
  return Pack(entries);
}

// A model that loads but fails at every decision: its network expects two inputs, gets one.
inline std::string FailingModel() {
  Entries entries = ExampleEntries();
  entries["web.flow"] = R"({"convs":{"n":{"type":"neur","src":"two.net"}},)"
                        R"("flow":[{"name":"o","input":[[0,1]],"conv":"n"}]})";
  entries["two.net"] = "1 3 2 20 0 0 20 0 0";
  return Pack(entries);
}

}  // namespace service_test
