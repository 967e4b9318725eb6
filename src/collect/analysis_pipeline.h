// The look-ahead reader: reads and classifies the next alert files on a
// helper thread (started through platform::Env) while the processing thread
// stores the current one: the commit waits on the disk and the analysis on a
// processor, so with two cores a cycle runs at nearly the pace of its commits.
// The helper keeps a few files ahead, so that one slow file, or a moment in
// which a busy machine gives it no processor, does not hold up the commits.
//
// Only while the log is off. The log wants each line written as it happens,
// on the processing thread, so that the last file it names is the one in
// hand should reading a file bring the process down. So the helper writes
// nothing, and a file it analysed while the log was switched on is analysed
// again on the processing thread; while the log is on, no file is analysed
// ahead.
//
// One object serves one list of files and one caller thread.
#pragma once

#include <condition_variable>
#include <cstdint>
#include <mutex>
#include <string>
#include <vector>

#include "collect/alert_analysis.h"
#include "collect/discovery.h"
#include "platform/platform.h"

namespace asum {

class LookAhead {
 public:
  // `stop` (may be null) ends the reading ahead once requested. Every
  // argument must outlive the object.
  LookAhead(const StringList& files, const std::u16string& status, const std::u16string& component,
            const platform::StopSignal* stop);
  // Waits for the helper's file in hand; it starts no other.
  ~LookAhead();
  LookAhead(const LookAhead&) = delete;
  LookAhead& operator=(const LookAhead&) = delete;

  // The analysis of files[index], taken in order 0, 1, 2, ... False when it
  // failed (out of memory).
  bool Take(size_t index, AlertAnalysis* out);

 private:
  static constexpr size_t kNone = static_cast<size_t>(-1);
  static constexpr size_t kAhead = 3;
  static constexpr uint32_t kJoinMs = 60000;

  struct Result {
    size_t index = kNone;
    AlertAnalysis analysis;
    bool ok = false;
  };

  Result Analyze(size_t index) const;
  bool StopRequested() const { return stop_ != nullptr && stop_->Requested(); }
  static void Main(void* self);
  void Work();

  const StringList& files_;
  const std::u16string& status_;
  const std::u16string& component_;
  const platform::StopSignal* stop_;
  platform::ThreadHandle thread_ = nullptr;
  bool failed_to_start_ = false;

  std::mutex mutex_;
  std::condition_variable changed_;
  size_t next_ = 0;            // the file the helper analyses next
  size_t end_ = 0;             // ... as long as it is below this
  size_t busy_ = kNone;        // the file the helper is analysing
  std::vector<Result> ready_;  // analysed, not taken yet
  bool closing_ = false;
  bool finished_ = false;
};

}  // namespace asum
