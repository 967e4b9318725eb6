// One collection cycle as the library's thread and the command-line tool run
// it: under the install folder's collector lock, so that the service and a
// support person's tool never process the same files at once.
//
// Runs on the calling thread; never throws.
#pragma once

#include <string>

#include "collect/discovery.h"

namespace asum {

enum class CycleResult {
  kDone,          // the cycle ran
  kBusy,          // another collector holds the install folder; nothing was done
  kNotADatabase,  // the database file is not a database; no file was touched
};

// The database file of an install folder.
std::u16string DatabasePathOf(const std::u16string& install_folder);
// The collector lock file, beside the database.
std::u16string CollectorLockPathOf(const std::u16string& install_folder);
// The lock file in a database folder, for readers that must not create the folder.
std::u16string CollectorLockPathIn(const std::u16string& summary_folder);

// Takes the collector lock without waiting, checks that the database (when it
// exists) is one, and runs one collection cycle over `install_folder`.
CycleResult RunLockedCycle(const std::u16string& install_folder, const AlertFileProcessor& process);

}  // namespace asum
