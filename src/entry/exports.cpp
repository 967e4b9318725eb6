#include "entry/alertsummary.h"
#include "entry/app.h"
#include "log/log.h"

extern "C" ALERTSUMMARY_EXPORT void* ALERTSUMMARY_CALL _Run(void) {
  try {
    asum::WriteLog(u"void _Run()");
    return asum::TheApp().Processor().GetSuccAlertsInfo();
  } catch (...) {
    return nullptr;
  }
}
