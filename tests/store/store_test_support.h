// Helpers of the store tests: an install folder whose database the test owns,
// rows seeded and read back with plain SQLite, and a machine whose clock,
// executable path and settings the test chooses.
#pragma once

#include <gtest/gtest.h>
#include <sqlite3.h>

#include <array>
#include <map>
#include <set>
#include <string>
#include <vector>

#include "platform/platform.h"
#include "support/test_support.h"

namespace asum::test {

using Row = std::vector<std::u16string>;

class StoreDir {
 public:
  const std::u16string& install() const { return dir_.path(); }
  std::u16string db_path() const { return dir_.Join(u"Alert_Summary\\AlertSummaryDB.db"); }
  void Create() const;  // folder, file and table, through OpenDB
  // Rows of (action, type, when); every other column "x".
  void Insert(const std::vector<std::array<std::u16string, 3>>& rows) const;
  std::vector<Row> Rows() const;  // every column as text, in table order

 private:
  TempDir dir_;
};

// A connection of another program: no busy handler, so it fails at once.
class RawConnection {
 public:
  explicit RawConnection(const std::u16string& path) { EXPECT_EQ(sqlite3_open16(path.c_str(), &db_), SQLITE_OK); }
  // close_v2: a test that fails half-way must not leave the file locked.
  ~RawConnection() { sqlite3_close_v2(db_); }
  int Exec(const char* sql) { return sqlite3_exec(db_, sql, nullptr, nullptr, nullptr); }
  sqlite3* get() const { return db_; }

 private:
  sqlite3* db_ = nullptr;
};

// Makes a file unwritable for this user while the object lives: read-only
// permissions, or for root, whom they do not bind, the immutable attribute
// (chattr +i) where the file system keeps it.
class UnwritableFile {
 public:
  explicit UnwritableFile(const std::u16string& path);
  ~UnwritableFile();
  bool unwritable() const;

 private:
  bool SetImmutable(bool on) const;
  std::u16string path_;
  bool immutable_ = false;
};

// A machine of the test's making: its local clock, its executable path and
// its settings, a registry in memory whose keys are paths below
// HKEY_LOCAL_MACHINE ("software\Varnholt Suite"); a value lives at its key's
// path, "\" and its name.
class StoreEnv : public platform::Env {
 public:
  platform::SystemTime local_now{2024, 3, 3, 20, 13, 45, 0, 0};
  std::u16string executable;
  std::set<std::u16string> keys = {u"software"};
  std::map<std::u16string, std::u16string> values;
  int open_keys = 0;

  // The value a host writes for a retention setting, at its exact place.
  void SetSetting(const std::u16string& name, const std::u16string& value) {
    values[u"software\\Varnholt Suite\\Varnholt Suite\\" + name + u"\\" + name] = value;
  }
  platform::SystemTime LocalNow() override { return local_now; }
  std::u16string ExecutablePath() override { return executable; }
  platform::SettingsKey OpenKey(platform::SettingsKey parent, const std::u16string& name) override;
  platform::SettingsKey CreateKey(platform::SettingsKey parent, const std::u16string& name) override;
  std::optional<std::u16string> QueryStringValue(platform::SettingsKey key, const std::u16string& name) override;
  void CloseKey(platform::SettingsKey key) override;
};

}  // namespace asum::test
