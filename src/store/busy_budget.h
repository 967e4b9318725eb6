// How long the connections of one piece of work may wait, in all, for a
// database that another connection holds locked.
//
// A busy handler charges every wait to the budget it is given; once the budget
// is spent, each later lock conflict fails at once. So a database that another
// program keeps locked for minutes costs a processing cycle at most its budget,
// however many files or statements the cycle tries; the files stay for the
// next cycle.
//
// One budget belongs to one thread at a time (the processing thread's cycle, or
// one query call); it is not safe to share between threads.
#pragma once

#include <cstdint>

namespace asum {

// A count or purge waits this long for a writer before it gives up with 0.
inline constexpr uint32_t kQueryBusyTimeoutMs = 5000;
// What one collection cycle may spend, in all, waiting for a locked database.
inline constexpr uint32_t kProcessingBusyBudgetMs = 5000;

class BusyBudget {
 public:
  explicit BusyBudget(uint32_t total_ms) : total_ms_(total_ms) {}
  virtual ~BusyBudget() = default;

  uint32_t TotalMs() const { return total_ms_; }
  uint64_t SpentMs() const { return spent_ms_; }
  bool Exhausted() const { return spent_ms_ >= total_ms_; }
  uint32_t RemainingMs() const {
    return Exhausted() ? 0 : static_cast<uint32_t>(total_ms_ - spent_ms_);
  }
  // A wait that overran what was left is charged only that: the budget counts
  // the waiting it granted, so what it spent never exceeds its total. Called
  // after each wait; virtual so a test can act while a statement waits.
  virtual void Charge(uint64_t ms) { spent_ms_ = ms >= RemainingMs() ? total_ms_ : spent_ms_ + ms; }

 private:
  uint32_t total_ms_;
  uint64_t spent_ms_ = 0;
};

}  // namespace asum
