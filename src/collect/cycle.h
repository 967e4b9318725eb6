// One collection cycle: the walk over an install folder's report folders, and
// the cycle as the library's thread and the command-line tool run it: under
// the install folder's collector lock, so that the service and a support
// person's tool never process the same files at once.
//
// Runs on the calling thread; never throws.
#pragma once

#include <functional>
#include <string>

#include "collect/discovery.h"
#include "collect/process_alerts.h"

namespace asum {

// Receives one non-empty list of alert files, its status text ("Delivered" or
// "Failed") and the component folder's name.
using AlertFileProcessor =
    std::function<void(StringList& files, const std::u16string& status, const std::u16string& component)>;

// One collection cycle over `install_folder`. A stop request (when given) is
// looked at before each report folder: no folder is listed after it.
void RunCollectionCycle(const std::u16string& install_folder, const AlertFileProcessor& process,
                        const platform::StopSignal* stop = nullptr);

enum class CycleResult {
  kDone,          // the cycle ran (or was stopped)
  kBusy,          // another collector holds the install folder; nothing was done
  kNoLock,        // the lock file cannot be made or opened (logged); nothing was done
  kNotADatabase,  // the database file is not a database; no file was touched
};

// Takes the collector lock without waiting, checks that the database (when it
// exists) is one, and runs one collection cycle over `install_folder`. A stop
// request (when given) is looked at before the database is probed and before
// each report folder.
CycleResult RunLockedCycle(const std::u16string& install_folder, const AlertFileProcessor& process,
                           const platform::StopSignal* stop = nullptr);

// One cycle as the library's thread and the tool run it: RunLockedCycle with
// every report folder processed into the install folder's database, all of
// them sharing `cycle` when given (its stop request and its one lock-wait
// allowance; otherwise a context of the cycle's own). Adds the counts to
// `tally` when given; `after_folder` (when set) is called after each report
// folder's files are processed.
CycleResult RunProcessingCycle(const std::u16string& install_folder, ProcessTally* tally = nullptr,
                               CycleContext* cycle = nullptr, const std::function<void()>& after_folder = {});

}  // namespace asum
