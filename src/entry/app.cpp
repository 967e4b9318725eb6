#include "entry/app.h"

#include <mutex>

#include "collect/cycle.h"
#include "collect/process_alerts.h"
#include "log/log.h"

namespace asum {

namespace {

// Storage that is never destroyed: a destructor that ran at process exit could
// meet the thread mid-cycle, and nothing in the object needs tearing down.
union AppStorage {
  constexpr AppStorage() : app() {}
  ~AppStorage() {}
  COvranticApp app;
};

// Built by the compiler, not by code that runs at load: on Windows that code
// would run under the loader lock, where nothing may take a lock or start a
// thread. So the object exists from the moment the library is mapped.
constinit AppStorage g_app;

// Keeps starting and stopping the thread apart. Not a member: a mutex cannot
// be built by the compiler everywhere (MinGW's needs code), so it is made on
// first use, which is never at load, and kept for the life of the process.
std::mutex& StartStopMutex() {
  static std::mutex* mutex = new std::mutex;
  return *mutex;
}

}  // namespace

COvranticApp& TheApp() { return g_app.app; }

void* BEProcessSuccessfulAlerts::GetSuccAlertsInfo() {
  WriteLog(u"Inside HANDLE BEProcessSuccessfulAlerts::GetSuccAlertsInfo()");
  std::lock_guard<std::mutex> lock(StartStopMutex());
  if (m_hThread == nullptr || m_hThread->StopRequested()) {
    platform::Current().HoldLibraryLoaded();
    m_hThread = ProcessingThread::Start(kCycleIntervalMs, RunLibraryCycle);
  }
  return m_hThread;
}

bool BEProcessSuccessfulAlerts::StopProcessing(uint32_t ms) {
  std::lock_guard<std::mutex> lock(StartStopMutex());
  if (m_hThread == nullptr) return true;
  m_hThread->RequestStop();
  return m_hThread->WaitUntilFinished(ms);
}

void BEProcessSuccessfulAlerts::ProcessAlertFiles(StringList* strListofFilePaths, std::u16string strEmailStatus,
                                                  std::u16string strComponentFolder) {
  if (strListofFilePaths == nullptr) return;
  asum::ProcessAlertFiles(InstallFolderOf(platform::Current().ExecutablePath()), *strListofFilePaths, strEmailStatus,
                          strComponentFolder);
}

void RunLibraryCycle(const platform::StopSignal& stop) {
  CycleContext cycle(&stop);
  RunProcessingCycle(InstallFolderOf(platform::Current().ExecutablePath()), cycle);
}

}  // namespace asum
