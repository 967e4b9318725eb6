// One collection cycle as the library's thread and the command-line tool run
// it: under the install folder's collector lock, so that the service and a
// support person's tool never process the same files at once.
//
// Runs on the calling thread; never throws.
#pragma once

#include <string>

#include "collect/discovery.h"
#include "collect/process_alerts.h"

namespace asum {

enum class CycleResult {
  kDone,          // the cycle ran (or was stopped)
  kBusy,          // another collector holds the install folder; nothing was done
  kNoLock,        // the lock file cannot be made or opened (logged); nothing was done
  kNotADatabase,  // the database file is not a database; no file was touched
};

// The database file of an install folder.
std::u16string DatabasePathOf(const std::u16string& install_folder);
// The collector lock file, beside the database.
std::u16string CollectorLockPathOf(const std::u16string& install_folder);
// The lock file in a database folder, for readers that must not create the folder.
std::u16string CollectorLockPathIn(const std::u16string& summary_folder);

// Takes the collector lock without waiting, checks that the database (when it
// exists) is one, and runs one collection cycle over `install_folder`. A stop
// request (when given) is looked at before the database is probed and before
// each report folder.
CycleResult RunLockedCycle(const std::u16string& install_folder, const AlertFileProcessor& process,
                           const platform::StopSignal* stop = nullptr);

// The cycle of the library's thread: RunLockedCycle with every report folder
// processed into the install folder's database, all of them sharing `cycle`
// (its stop request and its one lock-wait allowance). Adds the counts to
// `tally` when given.
CycleResult RunProcessingCycle(const std::u16string& install_folder, CycleContext& cycle,
                               ProcessTally* tally = nullptr);

}  // namespace asum
