// The library's application object and its processing object.
//
// Exactly one COvranticApp exists, a global that exists from the moment the
// library loads (built by the compiler: no code runs for it at load). Its
// processing object starts the processing thread on the first `_Run` and hands
// back the same thread on every later one: two threads over the same folders
// would store every alert twice.
#pragma once

#include "collect/discovery.h"
#include "entry/processing_thread.h"

namespace asum {

class BEProcessSuccessfulAlerts {
 public:
  constexpr BEProcessSuccessfulAlerts() = default;
  virtual ~BEProcessSuccessfulAlerts() = default;

  // Starts the processing thread (or returns the running one). The result is
  // the thread object's address, null when no thread could be started.
  void* GetSuccAlertsInfo();

  // Asks a running thread to stop and waits up to `ms` for its current cycle
  // to end. True when no thread runs any more.
  bool StopProcessing(uint32_t ms);

  // Processes one report folder's alert files into the database beside the
  // host executable.
  void ProcessAlertFiles(StringList* strListofFilePaths, std::u16string strEmailStatus,
                         std::u16string strComponentFolder);

 private:
  ProcessingThread* m_hThread = nullptr;  // the thread reference; never freed
};

class COvranticApp {
 public:
  constexpr COvranticApp() = default;
  virtual ~COvranticApp() = default;
  bool InitInstance() { return true; }
  BEProcessSuccessfulAlerts& Processor() { return m_processor; }

 private:
  BEProcessSuccessfulAlerts m_processor;
};

// The one application object.
COvranticApp& TheApp();

// One collection cycle of the library's thread: the install folder is the host
// executable's folder, worked out afresh each time.
void RunLibraryCycle(const platform::StopSignal& stop);

}  // namespace asum
