// Alert file processing: each listed alert message becomes one stored alert
// row, and the file gets its "PROC_" name so later cycles skip it. What a
// file says is the alert rules' (alert_analysis.h), read ahead by the
// look-ahead reader (analysis_pipeline.h); here the store-and-rename loop.
//
// Runs on one thread at a time per install folder (the processing thread, or
// the command-line tool). Never throws. A file ends in one of three states:
// stored and renamed (or deleted in favour of an existing PROC_ file), renamed
// without a row, or left under its name to be offered again next cycle.
#pragma once

#include <cstdint>
#include <string>

#include "collect/alert_analysis.h"
#include "collect/discovery.h"
#include "platform/platform.h"
#include "store/busy_budget.h"

namespace asum {

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

// The processing call, the one RunProcessingCycle makes for each report
// folder (its first log line names it as the host's application knew it).
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
