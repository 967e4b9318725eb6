#include "entry/processing_thread.h"

#include "log/log.h"

namespace asum {

ProcessingThread::ProcessingThread(uint32_t interval_ms, Cycle cycle)
    : interval_ms_(interval_ms), cycle_(std::move(cycle)) {}

ProcessingThread* ProcessingThread::Start(uint32_t interval_ms, Cycle cycle) {
  auto* thread = new ProcessingThread(interval_ms, std::move(cycle));
  // The handle is stored before the thread can be joined: joining starts only
  // after Start has returned it to the caller.
  thread->handle_ = platform::Current().StartThread(&ProcessingThread::Main, thread);
  if (thread->handle_ == nullptr) {
    delete thread;
    return nullptr;
  }
  return thread;
}

bool ProcessingThread::WaitUntilFinished(uint32_t ms) {
  if (handle_ == nullptr) return true;
  if (!platform::Current().JoinThread(handle_, ms)) return false;
  handle_ = nullptr;
  return true;
}

void ProcessingThread::Main(void* self) {
  auto* thread = static_cast<ProcessingThread*>(self);
  WriteLog(u"Inside EnableProcessAlertThread(LPVOID lp)");
  // The first cycle starts one interval after the thread: the host has just
  // started and its report folders may still be settling.
  while (!thread->stop_.WaitFor(thread->interval_ms_)) {
    try {
      thread->cycle_(thread->stop_);
    } catch (...) {
      // A cycle that ran out of memory is abandoned; its files are offered
      // again in the next one. The thread must outlive any single cycle.
    }
    thread->cycles_.fetch_add(1);
  }
}

}  // namespace asum
