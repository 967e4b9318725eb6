// Helpers of the store tests: an install folder whose database the test owns,
// a connection of another program, a file nobody may write, and a machine
// whose clock, executable path and settings the test chooses.
#pragma once

#include <gtest/gtest.h>
#include <sqlite3.h>

#include <array>
#include <map>
#include <set>

#include "platform/platform.h"
#include "support/test_support.h"

namespace asum::test {

class StoreDir {
 public:
  const std::u16string& install() const { return dir_.path(); }
  std::u16string db_path() const { return dir_.Join(u"Alert_Summary\\AlertSummaryDB.db"); }
  // Creates folder, file and table through OpenDB when missing, and inserts
  // rows of (action, type, when) with "x" in every other column.
  void Create(const std::vector<std::array<std::u16string, 3>>& rows = {}) const;
  // An SQL expression over every row, in table order.
  std::vector<std::u16string> Column(const char* expression = "\"When\"") const;

 private:
  TempDir dir_;
};

// A connection of another program: no busy handler, so it fails at once.
class RawConnection {
 public:
  explicit RawConnection(const std::u16string& path) { EXPECT_EQ(sqlite3_open16(path.c_str(), &db_), SQLITE_OK); }
  ~RawConnection() { sqlite3_close_v2(db_); }  // a test that fails half-way leaves nothing locked
  int Exec(const char* sql) { return sqlite3_exec(db_, sql, nullptr, nullptr, nullptr); }
  sqlite3* get() const { return db_; }

 private:
  sqlite3* db_ = nullptr;
};

// Makes a file unwritable for this user while it lives: read-only permissions,
// or where they do not bind (root) the immutable attribute of chattr +i on
// Linux, and on Windows a handle that shares the file for reading alone.
class UnwritableFile {
 public:
  explicit UnwritableFile(const std::u16string& path);
  ~UnwritableFile();
  bool unwritable() const;

 private:
  bool LockOut(bool on);
  std::u16string path_;
  bool locked_out_ = false;
  void* handle_ = nullptr;
};

// Today is 2024-03-20 13:45; the settings are a registry in memory whose keys
// are paths below HKEY_LOCAL_MACHINE ("software\Varnholt Suite"), a value at
// its key's path, "\" and its name.
class StoreEnv : public platform::Env {
 public:
  std::u16string executable;
  std::set<std::u16string> keys = {u"software"};
  std::map<std::u16string, std::u16string> values;
  int open_keys = 0;

  // Where the host writes a retention setting; null removes it.
  void SetSetting(const std::u16string& name, const char16_t* value) {
    const std::u16string path = u"software\\Varnholt Suite\\Varnholt Suite\\" + name + u"\\" + name;
    value ? void(values[path] = value) : void(values.erase(path));
  }
  platform::SystemTime LocalNow() override { return {2024, 3, 3, 20, 13, 45, 0, 0}; }
  std::u16string ExecutablePath() override { return executable; }
  using Key = platform::SettingsKey;
  static std::u16string Path(Key parent, const std::u16string& name) {
    return parent == LocalMachine() ? name : *static_cast<std::u16string*>(parent) + u"\\" + name;
  }
  Key OpenKey(Key parent, const std::u16string& name) override {
    return keys.count(Path(parent, name)) ? CreateKey(parent, name) : nullptr;
  }
  Key OpenKeyForReading(Key parent, const std::u16string& name) override { return OpenKey(parent, name); }
  Key CreateKey(Key parent, const std::u16string& name) override {
    return ++open_keys, new std::u16string(*keys.insert(Path(parent, name)).first);
  }
  std::optional<std::u16string> QueryStringValue(Key key, const std::u16string& name) override {
    const auto found = values.find(Path(key, name));
    return found == values.end() ? std::nullopt : std::optional(found->second);
  }
  void CloseKey(Key key) override {
    if (key != LocalMachine()) --open_keys, delete static_cast<std::u16string*>(key);
  }
};

}  // namespace asum::test
