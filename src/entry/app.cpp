#include "entry/app.h"

#include "collect/cycle.h"
#include "collect/process_alerts.h"
#include "log/log.h"

namespace asum {

COvranticApp& TheApp() {
  // Leaked on purpose: a destructor that ran at process exit could meet the
  // thread mid-cycle. Nothing in it needs tearing down.
  static COvranticApp* app = new COvranticApp;
  return *app;
}

void* BEProcessSuccessfulAlerts::GetSuccAlertsInfo() {
  WriteLog(u"Inside HANDLE BEProcessSuccessfulAlerts::GetSuccAlertsInfo()");
  std::lock_guard<std::mutex> lock(mutex_);
  if (m_hThread == nullptr || m_hThread->StopRequested()) {
    platform::Current().HoldLibraryLoaded();
    m_hThread = ProcessingThread::Start(kCycleIntervalMs, RunLibraryCycle);
  }
  return m_hThread;
}

bool BEProcessSuccessfulAlerts::StopProcessing(uint32_t ms) {
  std::lock_guard<std::mutex> lock(mutex_);
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
