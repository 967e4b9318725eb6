// Tells a database file from a file that only bears its name.
//
// Any thread; opens and closes its own read-only connection and waits for no
// lock: a file another connection holds locked counts as a database.
#pragma once

#include <string>

namespace asum {

// False only when SQLite reads the file and finds it is not a database. An
// empty file is an empty database; a missing or unreadable file is left to
// the caller's open, which reports it.
bool IsDatabaseFile(const std::u16string& path);

}  // namespace asum
