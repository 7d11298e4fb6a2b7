// The reference host's tracer. It accepts records whose level is at or below its own level,
// keeps committed lines in memory and can echo them to a stream. It can withhold its level
// source (0xFA0CE748), refuse every record, or refuse to regrow a record, so that tests can
// drive the module through each of those paths.
#pragma once

#include <cstdint>
#include <map>
#include <memory>
#include <mutex>
#include <ostream>
#include <string>
#include <vector>

#include "framework/uvo/interfaces.h"
#include "framework/uvo/object.h"

namespace pelmix::host {

struct TraceLine {
  int level;
  std::string text;
};

class Tracer final : public uvo::ObjectImpl<Tracer, uvo::ITracer, uvo::ITraceLevelSource> {
 public:
  // While one is alive on a thread, every tracer sees that thread at least at the capture's
  // level, and lines committed on it go to the capture instead of the tracer's list (they
  // are still echoed when the tracer's own level admits them). A host that runs one session
  // per thread thus gets each session's lines apart, and a long run keeps no lines.
  class ThreadCapture {
   public:
    explicit ThreadCapture(int level);
    ~ThreadCapture();
    ThreadCapture(const ThreadCapture&) = delete;
    ThreadCapture& operator=(const ThreadCapture&) = delete;
    // The lines captured so far; the capture starts empty again.
    std::vector<TraceLine> Take();

   private:
    friend class Tracer;
    int level_;
    std::vector<TraceLine> lines_;
    ThreadCapture* previous_;
  };

  static uvo::Ptr<Tracer> Create(int level = 1000);
  explicit Tracer(int level) : level_(level) {}
  ~Tracer() = default;

  // uvo::ITracer
  uvo::result_t CreateRecord(int level, char** buffer, std::uint32_t size) override;
  uvo::result_t CommitRecord(char* buffer, std::uint32_t length) override;
  // uvo::ITraceLevelSource
  uvo::result_t SetTraceLevel(int level) override;
  uvo::result_t Flush() override;
  uvo::result_t GetCommittedCount(std::uint64_t* count) override;
  uvo::result_t GetTraceLevel(int* level) override;
  uvo::result_t QueryInterface(uvo::iid_t iid, void** out) override;

  void SetOfferLevelSource(bool offer) { offerLevelSource_ = offer; }
  void SetRefuseRecords(bool refuse) { refuseRecords_ = refuse; }
  void SetRefuseRegrow(bool refuse) { refuseRegrow_ = refuse; }
  // Committed lines are also written to `echo`, one per line (null: none).
  void SetEcho(std::ostream* echo) { echo_ = echo; }

  std::vector<TraceLine> Lines() const;
  std::vector<std::string> Texts() const;
  void Clear();
  int Level() const { return level_; }
  std::size_t OpenRecords() const;
  // Sizes asked for by each regrow (level 1000), in order.
  std::vector<std::uint32_t> RegrowSizes() const;

 private:
  mutable std::mutex mutex_;
  int level_;
  bool offerLevelSource_ = true;
  bool refuseRecords_ = false;
  bool refuseRegrow_ = false;
  std::ostream* echo_ = nullptr;
  struct Record {
    int level;
    std::unique_ptr<char[]> data;
    std::uint32_t size;
  };
  std::map<char*, Record> open_;
  std::vector<TraceLine> lines_;
  std::vector<std::uint32_t> regrows_;
};

}  // namespace pelmix::host
