#include <pthread.h>
#include <unistd.h>

#include <climits>
#include <ctime>

#include "platform/posix/posix_util.h"

namespace asum::platform {

Env& Env::Default() {
  // Leaked on purpose: the processing thread may still use it during exit.
  static Env* env = new Env;
  return *env;
}

std::u16string Env::ExecutablePath() {
  char buffer[PATH_MAX + 1];
  const ssize_t n = ::readlink("/proc/self/exe", buffer, PATH_MAX);
  if (n <= 0) return {};
  return posix::FromNative(std::string(buffer, static_cast<size_t>(n)));
}

namespace {

struct ThreadStart {
  void (*fn)(void*);
  void* arg;
};

void* ThreadMain(void* p) {
  const ThreadStart start = *static_cast<ThreadStart*>(p);
  delete static_cast<ThreadStart*>(p);
  start.fn(start.arg);
  return nullptr;
}

}  // namespace

ThreadHandle Env::StartThread(void (*fn)(void*), void* arg) {
  auto* start = new ThreadStart{fn, arg};
  auto* thread = new pthread_t;
  if (pthread_create(thread, nullptr, ThreadMain, start) != 0) {
    delete start;
    delete thread;
    return nullptr;
  }
  return thread;
}

bool Env::JoinThread(ThreadHandle handle, uint32_t ms) {
  if (handle == nullptr) return true;
  auto* thread = static_cast<pthread_t*>(handle);
  struct timespec deadline;
  clock_gettime(CLOCK_REALTIME, &deadline);
  deadline.tv_sec += ms / 1000;
  deadline.tv_nsec += static_cast<long>(ms % 1000) * 1000000L;
  if (deadline.tv_nsec >= 1000000000L) {
    deadline.tv_sec += 1;
    deadline.tv_nsec -= 1000000000L;
  }
  if (pthread_timedjoin_np(*thread, nullptr, &deadline) != 0) return false;
  delete thread;
  return true;
}

bool Env::HoldLibraryLoaded() { return true; }

bool StderrIsTerminal() { return ::isatty(2) == 1; }

}  // namespace asum::platform
