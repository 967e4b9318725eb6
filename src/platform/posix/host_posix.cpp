#include <pthread.h>
#include <unistd.h>

#include <climits>

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

bool Env::StartThread(void (*fn)(void*), void* arg) {
  auto* start = new ThreadStart{fn, arg};
  pthread_attr_t attr;
  if (pthread_attr_init(&attr) != 0) {
    delete start;
    return false;
  }
  pthread_attr_setdetachstate(&attr, PTHREAD_CREATE_DETACHED);
  pthread_t thread;
  const int rc = pthread_create(&thread, &attr, ThreadMain, start);
  pthread_attr_destroy(&attr);
  if (rc != 0) {
    delete start;
    return false;
  }
  return true;
}

bool Env::HoldLibraryLoaded() { return true; }

bool StderrIsTerminal() { return ::isatty(2) == 1; }

}  // namespace asum::platform
