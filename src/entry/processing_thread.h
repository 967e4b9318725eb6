// The background processing thread: sleeps, runs one collection cycle, and
// again, until a stop is requested.
//
// A thread object is created on the heap and never destroyed: the thread may
// still read it while the process exits, when no destructor may wait for it.
// Start, RequestStop and WaitUntilFinished are safe from any thread.
#pragma once

#include <atomic>
#include <cstdint>
#include <functional>

#include "platform/platform.h"

namespace asum {

// The interval of the library's thread; tests and the tool pass shorter ones.
inline constexpr uint32_t kCycleIntervalMs = 10000;

class ProcessingThread {
 public:
  // `cycle` runs once per interval; it may poll `stop()` to end early.
  using Cycle = std::function<void(const platform::StopSignal& stop)>;

  // Starts the thread; returns null when no thread could be started.
  static ProcessingThread* Start(uint32_t interval_ms, Cycle cycle);

  void RequestStop() { stop_.Request(); }
  bool StopRequested() const { return stop_.Requested(); }
  // Waits up to `ms` for the thread to end; true when it has ended. Call it
  // from one thread at a time.
  bool WaitUntilFinished(uint32_t ms);
  uint64_t CyclesCompleted() const { return cycles_.load(); }
  uint32_t IntervalMs() const { return interval_ms_; }

 private:
  ProcessingThread(uint32_t interval_ms, Cycle cycle);
  static void Main(void* self);

  const uint32_t interval_ms_;
  const Cycle cycle_;
  platform::StopSignal stop_;
  platform::ThreadHandle handle_ = nullptr;
  std::atomic<uint64_t> cycles_{0};
};

}  // namespace asum
