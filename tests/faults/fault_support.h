// An install folder for the fault tests: one component with its marker file,
// alert files dropped into its report folders, cycles run the way the
// library's thread runs them, and the stored rows read back directly.
//
// Single-threaded use unless a method says otherwise.
#pragma once

#include <atomic>
#include <cstdint>
#include <map>
#include <string>
#include <vector>

#include "collect/cycle.h"
#include "collect/process_alerts.h"
#include "support/test_support.h"

namespace asum::test {

inline constexpr char16_t kComponent[] = u"Main Component";

class Install {
 public:
  // Creates the component folder and the database (so the first cycle works).
  Install();

  const std::u16string& path() const { return dir_.path(); }
  std::u16string SentFolder() const;
  std::u16string DbPath() const { return DatabasePathOf(path()); }

  // Writes an alert file straight into the Sent items folder; returns its path.
  std::u16string Drop(const std::u16string& name, const std::string& bytes) const;
  // Writes it under another name outside the report folders, then renames it
  // in, so a collector never sees half a file. Safe beside a running cycle.
  std::u16string DropAtomically(const std::u16string& name, const std::string& bytes) const;

  // One cycle through the collector lock, as the library's thread runs it,
  // in `cycle` when given. Adds to `tally` when given.
  CycleResult Cycle(ProcessTally* tally = nullptr, CycleContext* cycle = nullptr) const;

  // "Alert Path" of every stored row, with its number of rows.
  std::map<std::u16string, int> RowsByPath() const;
  int RowCount() const;
  // "ok" when the database is sound, else SQLite's report.
  std::string IntegrityCheck() const;

 private:
  TempDir dir_;
};

// True when the file exists.
bool Exists(const std::u16string& path);

// The name of an alert file's path (after its last separator).
std::u16string NameOf(const std::u16string& path);

// True for a run that should leave out its largest cases: ALERTSUMMARY_QUICK
// is set, or the Windows build runs under an emulation layer.
bool QuickRun();

// Runs one SQL text on its own connection; empty on success, else the error.
std::string ExecSql(const std::u16string& db_path, const std::string& sql);

}  // namespace asum::test
