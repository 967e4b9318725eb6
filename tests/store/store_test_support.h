// Helpers of the store tests: a database folder in a temporary install folder,
// rows seeded and read back with plain SQLite, a clock and an executable path
// of the test's choosing, and retention settings seeded where the platform
// keeps them (the real registry on Windows, a temporary folder tree on Linux).
#pragma once

#include <sqlite3.h>

#include <string>
#include <vector>

#include "platform/platform.h"
#include "support/test_support.h"

namespace asum::test {

// An install folder whose "Alert_Summary" database the test owns.
class StoreDir {
 public:
  const std::u16string& install() const { return dir_.path(); }
  std::u16string folder() const;    // install + "Alert_Summary" (not created here)
  std::u16string db_path() const;   // the database file in it
  // Creates folder, file and table through the store's OpenDB.
  void Create() const;
  // Inserts rows of (action, type, when) with the other columns set to "x".
  void Insert(const std::vector<std::vector<std::u16string>>& rows) const;
  // All rows in table order, each column as text.
  std::vector<std::vector<std::u16string>> Rows() const;
  int64_t RowCount() const;

 private:
  TempDir dir_;
};

// A raw connection of another program (no busy handler).
class RawConnection {
 public:
  explicit RawConnection(const std::u16string& path);
  ~RawConnection();
  int Exec(const char* sql);
  sqlite3* get() const { return db_; }

 private:
  sqlite3* db_ = nullptr;
};

// A fixed local clock and executable path; everything else real.
class FakeEnv : public platform::Env {
 public:
  platform::SystemTime local_now{};
  std::u16string executable;
  platform::SystemTime LocalNow() override { return local_now; }
  std::u16string ExecutablePath() override { return executable.empty() ? Env::ExecutablePath() : executable; }
};

// Retention settings under software\Varnholt Suite\Varnholt Suite. Removes
// what it seeded when it goes.
class SeededSettings {
 public:
  SeededSettings();
  ~SeededSettings();
  void SetString(const std::u16string& name, const std::u16string& value);
  // A value of a type other than a string (Windows: REG_DWORD; Linux: a
  // folder in the value's place, which cannot be read as text).
  void SetNonString(const std::u16string& name, uint32_t number);
  void Remove(const std::u16string& name);
  // Whether the setting's own key exists.
  bool KeyExists(const std::u16string& name) const;

 private:
#ifndef _WIN32
  TempDir root_;
  std::u16string previous_root_;
#else
  bool vendor_existed_ = false;
#endif
};

}  // namespace asum::test
