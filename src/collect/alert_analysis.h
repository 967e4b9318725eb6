// The alert rules: what one alert file says (its message, and the row it
// gives), worked out without touching the file's name or the store.
//
// Writes the processing's log lines for the file; callable on any thread
// (the look-ahead reader calls it with the log silenced). Never throws except
// std::bad_alloc.
#pragma once

#include <string>

#include "platform/platform.h"
#include "store/alert_table.h"

namespace asum {

enum class AlertOutcome {
  kStore,        // a row is to be stored, then the file renamed
  kMarkWithout,  // the file is renamed without a row
  kLeave,        // the file cannot be loaded and keeps its name
};

// What one alert file says.
struct AlertAnalysis {
  bool loaded = false;
  std::u16string sender, subject, body;
  platform::SystemTime local_date;
  AlertOutcome outcome = AlertOutcome::kLeave;
  AlertRow row;  // meaningful when outcome is kStore
};

// Reads one alert file and derives its row as the processing does, writing
// the same log lines. `status` is "Delivered" or "Failed"; `component` the
// component folder's name.
AlertAnalysis AnalyzeAlertFile(const std::u16string& path, const std::u16string& status,
                               const std::u16string& component);

}  // namespace asum
