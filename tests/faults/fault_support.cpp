#include "fault_support.h"

#include <gtest/gtest.h>
#include <sqlite3.h>

#include <cstdlib>

#ifdef _WIN32
#include <windows.h>
#endif

#include "platform/platform.h"

namespace asum::test {

Install::Install() {
  WriteText(dir_.Join(std::u16string(kComponent) + u"\\info.dat"), "marker");
  MakeFolders(SentFolder());
  EnsureDatabase(path());
}

std::u16string Install::SentFolder() const {
  return dir_.Join(std::u16string(kComponent) + u"\\AlertReports\\Sent items");
}

std::u16string Install::Drop(const std::u16string& name, const std::string& bytes) const {
  const std::u16string target = SentFolder() + platform::kPathSeparator + name;
  WriteText(target, bytes);
  return target;
}

std::u16string Install::DropAtomically(const std::u16string& name, const std::string& bytes) const {
  const std::u16string staging = dir_.Join(u"staging");
  MakeFolders(staging);
  const std::u16string temp = staging + platform::kPathSeparator + name + u".part";
  const std::u16string target = SentFolder() + platform::kPathSeparator + name;
  platform::Env& env = platform::Env::Default();
  if (!env.WriteFile(temp, bytes).ok()) ADD_FAILURE() << "cannot write " << Narrow(temp);
  if (!env.RenameNoReplace(temp, target).ok()) ADD_FAILURE() << "cannot rename into " << Narrow(target);
  return target;
}

CycleResult Install::Cycle(ProcessTally* tally, CycleContext* cycle) const {
  CycleContext own;
  return RunProcessingCycle(path(), cycle != nullptr ? *cycle : own, tally);
}

namespace {

template <typename Fn>
void Query(const std::u16string& db_path, const char* sql, Fn&& on_row) {
  sqlite3* db = nullptr;
  if (sqlite3_open16(db_path.c_str(), &db) == SQLITE_OK) {
    sqlite3_stmt* st = nullptr;
    if (sqlite3_prepare_v2(db, sql, -1, &st, nullptr) == SQLITE_OK) {
      while (sqlite3_step(st) == SQLITE_ROW) on_row(st);
    } else {
      ADD_FAILURE() << sql << ": " << sqlite3_errmsg(db);
    }
    sqlite3_finalize(st);
  }
  sqlite3_close(db);
}

std::u16string Column16(sqlite3_stmt* st, int column) {
  const void* text = sqlite3_column_text16(st, column);
  return text == nullptr ? std::u16string() : std::u16string(static_cast<const char16_t*>(text));
}

}  // namespace

std::map<std::u16string, int> Install::RowsByPath() const {
  std::map<std::u16string, int> rows;
  Query(DbPath(), "SELECT \"Alert Path\" FROM AlertDB", [&](sqlite3_stmt* st) { ++rows[Column16(st, 0)]; });
  return rows;
}

int Install::RowCount() const {
  int count = -1;
  Query(DbPath(), "SELECT count(*) FROM AlertDB", [&](sqlite3_stmt* st) { count = sqlite3_column_int(st, 0); });
  return count;
}

std::string Install::IntegrityCheck() const {
  std::string report;
  Query(DbPath(), "PRAGMA integrity_check", [&](sqlite3_stmt* st) {
    if (!report.empty()) report += "\n";
    report += reinterpret_cast<const char*>(sqlite3_column_text(st, 0));
  });
  return report;
}

std::string ExecSql(const std::u16string& db_path, const std::string& sql) {
  sqlite3* db = nullptr;
  std::string error;
  if (sqlite3_open16(db_path.c_str(), &db) != SQLITE_OK) {
    error = "cannot open";
  } else if (sqlite3_exec(db, sql.c_str(), nullptr, nullptr, nullptr) != SQLITE_OK) {
    error = sqlite3_errmsg(db);
  }
  sqlite3_close(db);
  return error;
}

bool Exists(const std::u16string& path) { return platform::Env::Default().PathExists(path); }

std::u16string NameOf(const std::u16string& path) {
  const size_t cut = path.rfind(platform::kPathSeparator);
  return cut == std::u16string::npos ? path : path.substr(cut + 1);
}

bool QuickRun() {
  if (std::getenv("ALERTSUMMARY_QUICK") != nullptr) return true;
#ifdef _WIN32
  HMODULE ntdll = GetModuleHandleW(L"ntdll.dll");
  if (ntdll != nullptr && GetProcAddress(ntdll, "wine_get_version") != nullptr) return true;
#endif
  return false;
}

}  // namespace asum::test
