// The checker contracts every checker shares: the verdict query, and the receiver of data a
// host fetched on a checker's request.
#pragma once

#include <cstddef>
#include <string>

#include "engine/checkers/engine_verdict.h"

namespace ap::easy2 {

class BaseChecker {
 public:
  virtual void GetVerdict(EngineVerdict& out) = 0;  // slot 0
  virtual ~BaseChecker() = default;                 // slot 1
};

// Implemented by a checker that asks for external data (ExtHandlerI::Request); the host's
// sink forwards what it delivers here, possibly from its own threads.
class ExtDataReceiver {
 public:
  virtual void SetParameter(const std::string& name, const std::string& value) = 0;  // slot 0
  virtual void AppendData(const char* data, std::size_t length) = 0;                 // slot 1
  virtual ~ExtDataReceiver() = default;
};

}  // namespace ap::easy2
