#include <process.h>

#include "platform/win32/win32_util.h"

namespace asum::platform {

Env& Env::Default() {
  // Leaked on purpose: the processing thread may still use it during exit.
  static Env* env = new Env;
  return *env;
}

std::u16string Env::ExecutablePath() {
  // The limit of 1000 characters is the one the host's own tools use; a longer
  // path comes back cut, and the cut path names no folder of ours.
  wchar_t buffer[1025] = {};
  const DWORD n = ::GetModuleFileNameW(nullptr, buffer, 1000);
  return win32::FromW(buffer, n);
}

namespace {

struct ThreadStart {
  void (*fn)(void*);
  void* arg;
};

unsigned __stdcall ThreadMain(void* p) {
  const ThreadStart start = *static_cast<ThreadStart*>(p);
  delete static_cast<ThreadStart*>(p);
  start.fn(start.arg);
  return 0;
}

}  // namespace

ThreadHandle Env::StartThread(void (*fn)(void*), void* arg) {
  auto* start = new ThreadStart{fn, arg};
  const uintptr_t handle = _beginthreadex(nullptr, 0, ThreadMain, start, 0, nullptr);
  if (handle == 0) {
    delete start;
    return nullptr;
  }
  return reinterpret_cast<HANDLE>(handle);
}

bool Env::JoinThread(ThreadHandle thread, uint32_t ms) {
  if (thread == nullptr) return true;
  if (::WaitForSingleObject(static_cast<HANDLE>(thread), ms) != WAIT_OBJECT_0) return false;
  ::CloseHandle(static_cast<HANDLE>(thread));
  return true;
}

bool StderrIsTerminal() {
  DWORD mode = 0;
  return ::GetConsoleMode(::GetStdHandle(STD_ERROR_HANDLE), &mode) != 0;
}

namespace {
const char kModuleAnchor = 0;  // any address inside this module
}  // namespace

bool Env::HoldLibraryLoaded() {
  HMODULE self = nullptr;
  return ::GetModuleHandleExW(GET_MODULE_HANDLE_EX_FLAG_FROM_ADDRESS | GET_MODULE_HANDLE_EX_FLAG_PIN,
                              reinterpret_cast<LPCWSTR>(&kModuleAnchor), &self) != 0;
}

}  // namespace asum::platform
