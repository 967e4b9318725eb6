// What the library does when it leaves a process.
//
// Linux: exit() and dlclose() run this file's static destructor while the
// processing thread may be inside a cycle; it asks the thread to stop and waits
// for its current file, so no code is unmapped under a running thread.
//
// Windows: the loader runs DllMain with its lock held, and at process exit the
// other threads are already gone; waiting there would hang the exit. The DLL
// therefore does nothing at detach: while its thread runs it holds itself
// loaded, so FreeLibrary never unmaps code the thread is running.
#include "entry/app.h"

namespace asum {
namespace {

// Long enough for the file in hand to be stored and renamed, short enough that
// a host's exit is never held up noticeably when the database is locked.
constexpr uint32_t kTeardownWaitMs = 15000;

#ifndef _WIN32
struct Teardown {
  ~Teardown() { TheApp().Processor().StopProcessing(kTeardownWaitMs); }
} g_teardown;
#endif

}  // namespace
}  // namespace asum
