// The SQLite access layer: one connection (`CDbSQLite`) and the statements
// prepared on it (`CSqlStatement`). Nothing else in the library calls SQLite.
//
// All SQL text and paths are UTF-16 and go through SQLite's UTF-16 entry
// points, so a database file created here stores its text as UTF-16LE. Only
// the first statement of a text is compiled; the rest is ignored.
//
// Threads: a `CDbSQLite` and its statements belong to one operation on one
// thread (one processing call, one count, one purge). Give each operation its
// own object; never share one between threads.
//
// Failures are booleans, never exceptions. The layer writes no log line and
// never retries; the only waiting it does is the busy handler, which charges
// its waits to a `BusyBudget` when the owner gives it one.
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "store/busy_budget.h"

struct sqlite3;
struct sqlite3_stmt;

namespace asum {

class CSqlStatement;

class CDbSQLite {
 public:
  CDbSQLite() = default;
  CDbSQLite(const CDbSQLite&) = delete;
  CDbSQLite& operator=(const CDbSQLite&) = delete;
  // Closes a connection that is still open (the same way as `Close`).
  virtual ~CDbSQLite();

  // Lock conflicts wait while `budget` has time left (null: fail at once).
  // The budget must outlive the connection; it may be set before or after Open.
  void SetBusyBudget(BusyBudget* budget) { budget_ = budget; }

  // Opens (creating when missing) the file read-write. A connection this
  // object still holds is closed first. On failure nothing stays open and the
  // result is false.
  bool Open(const std::u16string& path);
  // Opens an existing file for reading only: a missing file is not created
  // (false), and no statement on this connection can change the file.
  bool OpenReadOnly(const std::u16string& path);
  // Closes the connection. Statements still alive are finalized first (their
  // objects stay valid and fail from then on). Always true.
  bool Close();
  bool IsOpen() const { return db_ != nullptr; }
  // The row id of this connection's last successful insert (0 when none).
  int64_t LastInsertRowId() const;

  // Prepares the first statement of `sql` on this connection. Never null; a
  // text that does not compile (or no open connection) gives a statement whose
  // every step fails.
  std::unique_ptr<CSqlStatement> Statement(const std::u16string& sql);
  // How many statements this object has prepared (retries show in it).
  uint64_t StatementsPrepared() const { return prepared_; }

 private:
  friend class CSqlStatement;
  static int OnBusy(void* self, int attempts);
  bool Adopt(int rc, sqlite3* db);
  void Forget(CSqlStatement* statement);
  void Detach(sqlite3_stmt* handle);

  sqlite3* db_ = nullptr;
  BusyBudget* budget_ = nullptr;
  uint64_t prepared_ = 0;
  std::vector<CSqlStatement*> live_;  // statements prepared here and not yet destroyed
};

class CSqlStatement {
 public:
  CSqlStatement(const CSqlStatement&) = delete;
  CSqlStatement& operator=(const CSqlStatement&) = delete;
  virtual ~CSqlStatement();

  // True when the text compiled.
  bool IsValid() const { return stmt_ != nullptr; }

  // Binds parameter `index` (from 1) to a text that ends before its first
  // character of code 0. False when the statement is invalid or has no such
  // parameter. A statement without parameters is unaffected.
  bool BindText(int index, const std::u16string& value);

  // One step. A row or the end: the statement is reset and the result is
  // true. Busy, error, misuse or any other code: false, without reset.
  bool Execute();
  // One step. A row: true, the statement stays on it. The end: reset, false.
  // Any other code: false, without reset.
  bool NextRow();
  // The column of the current row as text, ending before its first character
  // of code 0; empty for NULL or when there is no row.
  std::u16string ValueString(int column);
  // True when the compile or the last step found that the file is not a
  // database (as opposed to busy, missing or unreadable).
  bool FoundNotADatabase() const;

 private:
  friend class CDbSQLite;
  CSqlStatement(const std::u16string& sql, CDbSQLite* owner);

  sqlite3_stmt* stmt_ = nullptr;
  CDbSQLite* owner_ = nullptr;
  std::u16string value_;
  int last_code_ = 0;  // of the compile, then of the last step
};

// SQLite wants a UTF-16 text to end at its first character of code 0; values
// that carry one are cut there, as the text functions of the host would.
std::u16string UpToFirstNul(const std::u16string& text);

}  // namespace asum
