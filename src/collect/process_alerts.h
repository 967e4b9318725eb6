// Alert file processing: each listed alert message becomes one stored alert
// row, and the file gets its "PROC_" name so later cycles skip it.
//
// Runs on one thread at a time per install folder (the processing thread, or
// the command-line tool). Never throws. A file ends in one of three states:
// stored and renamed (or deleted in favour of an existing PROC_ file), renamed
// without a row, or left under its name to be offered again next cycle.
#pragma once

#include <cstdint>
#include <string>

#include "collect/discovery.h"
#include "platform/platform.h"
#include "store/busy_budget.h"

namespace asum {

// One alert row, in the table's column order.
struct AlertRow {
  std::u16string alert_action;
  std::u16string alert_type;
  std::u16string alert_name;
  std::u16string when;
  std::u16string threshold;
  std::u16string who;
  std::u16string operation;
  std::u16string component_name;
  std::u16string email_status;
  std::u16string server_name;
  std::u16string alert_path;
};

enum class AlertOutcome {
  kStore,        // a row is to be stored, then the file renamed
  kMarkWithout,  // the file is renamed without a row
  kLeave,        // the file cannot be loaded and keeps its name
};

// What one alert file says, worked out without touching the file or the store.
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

// Counts of one processing call, for the tool.
struct ProcessTally {
  uint64_t stored = 0;  // rows inserted and files marked
  uint64_t marked = 0;  // files marked without a row
  uint64_t left = 0;    // files that keep their name for the next cycle
};

// What every report folder of one collection cycle shares. Made once per
// cycle, on the cycle's thread, and handed to each ProcessAlertFiles call.
struct CycleContext {
  explicit CycleContext(const platform::StopSignal* stop_request = nullptr,
                        uint32_t busy_ms = kProcessingBusyBudgetMs)
      : stop(stop_request), busy(busy_ms) {}
  bool StopRequested() const { return stop != nullptr && stop->Requested(); }

  // Looked at before each report folder, before the database is first
  // touched and before each file: after a stop only the file in hand is
  // finished, and the files not reached stay for the next cycle.
  const platform::StopSignal* stop;
  // One allowance for waiting on a locked database, for the whole cycle: a
  // database another program holds costs a cycle this much however many
  // report folders have files. The files stay for the next cycle.
  BusyBudget busy;
};

// The first-call rule: true when the database file exists; otherwise creates
// it with its table and returns false.
bool EnsureDatabase(const std::u16string& install_folder);

// Processes `files` (full paths, as the collection cycle lists them) into the
// database of `install_folder`. `cycle` is the context of the cycle the call
// belongs to (null: the call is a cycle of its own). Adds its counts to
// `tally` when given.
void ProcessAlertFiles(const std::u16string& install_folder, StringList& files, const std::u16string& status,
                       const std::u16string& component, CycleContext* cycle = nullptr,
                       ProcessTally* tally = nullptr);

// The PROC_ name of a path: its folder, the separator, "PROC_" and its name.
std::u16string ProcName(const std::u16string& path);

}  // namespace asum
