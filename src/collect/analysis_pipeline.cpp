#include "collect/analysis_pipeline.h"

#include <algorithm>

#include "log/log.h"

namespace asum {

LookAhead::LookAhead(const StringList& files, const std::u16string& status, const std::u16string& component,
                     const platform::StopSignal* stop)
    : files_(files), status_(status), component_(component), stop_(stop) {}

LookAhead::~LookAhead() {
  if (thread_ == nullptr) return;
  std::unique_lock<std::mutex> lock(mutex_);
  closing_ = true;
  changed_.notify_all();
  changed_.wait(lock, [&] { return finished_; });
  lock.unlock();
  // It has left everything of ours; the join only releases the thread.
  platform::Current().JoinThread(thread_, kJoinMs);
}

bool LookAhead::Take(size_t index, AlertAnalysis* out) {
  const bool log_on = LogEnabled();
  const bool ahead = !log_on && !StopRequested();
  Result result;
  if (thread_ != nullptr) {
    std::unique_lock<std::mutex> lock(mutex_);
    if (!log_on) changed_.wait(lock, [&] { return busy_ != index; });
    for (Result& ready : ready_) {
      if (ready.index == index && !log_on) result = std::move(ready);
    }
    std::erase_if(ready_, [&](const Result& ready) { return log_on || ready.index <= index; });
    next_ = log_on ? index + 1 : std::max(next_, index + 1);
    end_ = ahead ? std::min(index + 1 + kAhead, files_.size()) : next_;
    lock.unlock();
    changed_.notify_all();
  } else if (ahead && index + 1 < files_.size() && !failed_to_start_) {
    next_ = index + 1;
    end_ = std::min(index + 1 + kAhead, files_.size());
    thread_ = platform::Current().StartThread(&LookAhead::Main, this);
    failed_to_start_ = thread_ == nullptr;
  }
  if (!result.ok) result = Analyze(index);
  *out = std::move(result.analysis);
  return result.ok;
}

LookAhead::Result LookAhead::Analyze(size_t index) const {
  Result result;
  result.index = index;
  try {
    result.analysis = AnalyzeAlertFile(files_[index], status_, component_);
    // Only the row and the outcome are needed; the message's texts go on
    // the thread that made them rather than on the one that commits.
    result.analysis.sender = std::u16string();
    result.analysis.subject = std::u16string();
    result.analysis.body = std::u16string();
    result.ok = true;
  } catch (...) {
  }
  return result;
}

void LookAhead::Main(void* self) { static_cast<LookAhead*>(self)->Work(); }

void LookAhead::Work() {
  SilencedLog silenced;
  std::unique_lock<std::mutex> lock(mutex_);
  for (;;) {
    changed_.wait(lock, [&] { return closing_ || next_ < end_; });
    if (closing_) break;
    busy_ = next_++;
    lock.unlock();
    Result result = Analyze(busy_);
    lock.lock();
    busy_ = kNone;
    try {
      ready_.push_back(std::move(result));
    } catch (...) {
      // Out of memory: the file is analysed again in its turn.
    }
    changed_.notify_all();
  }
  finished_ = true;
  changed_.notify_all();
}

}  // namespace asum
