// Where the decoded string text of one script element goes. At the first byte above 32 it
// decides: text that starts with '<' is HTML written by the script and runs through a nested
// pipeline (HtmlInScript) reporting to the same receiver; any other text goes to the sink the
// receiver hands out for scripts. Leading bytes up to 32 are dropped.
#pragma once

#include <cstddef>
#include <memory>

#include "engine/html/html_handler.h"

namespace html_decrunch {

class HtmlHandler::ScriptTextHandler final : public TextHandler {
 public:
  explicit ScriptTextHandler(HtmlHandler& owner);
  ~ScriptTextHandler() override;
  ScriptTextHandler(const ScriptTextHandler&) = delete;
  ScriptTextHandler& operator=(const ScriptTextHandler&) = delete;

  void text(const char* data, std::size_t length) override;
  void breakText() override {}
  // Passed to the script sink; a nested pipeline ends when this handler is destroyed.
  void end() override;

 private:
  void decide(char first);

  HtmlHandler& owner_;
  bool decided_ = false;
  TextHandler* sink_ = nullptr;
  std::unique_ptr<HtmlInScript> html_;
};

}  // namespace html_decrunch
