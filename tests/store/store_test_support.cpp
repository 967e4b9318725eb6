#include "store_test_support.h"

#include <gtest/gtest.h>

#include "common/utf.h"
#include "store/setting_db_management.h"

#ifdef _WIN32
#include <windows.h>
#endif

namespace asum::test {

std::u16string StoreDir::folder() const { return dir_.Join(u"Alert_Summary"); }
std::u16string StoreDir::db_path() const { return CSettingDBManagement::DatabasePath(folder()); }

void StoreDir::Create() const {
  CSettingDBManagement store;
  ASSERT_TRUE(store.OpenDB(CSettingDBManagement::DatabasePath(CSettingDBManagement::GetAlertSummaryFolder(install()))));
}

void StoreDir::Insert(const std::vector<std::vector<std::u16string>>& rows) const {
  RawConnection raw(db_path());
  sqlite3_stmt* stmt = nullptr;
  ASSERT_EQ(sqlite3_prepare_v2(raw.get(), "INSERT INTO AlertDB VALUES(?1,?2,'x',?3,'x','x','x','x','x','x','x')", -1,
                               &stmt, nullptr),
            SQLITE_OK);
  raw.Exec("BEGIN");
  for (const auto& row : rows) {
    for (size_t i = 0; i < row.size() && i < 3; ++i) {
      sqlite3_bind_text16(stmt, static_cast<int>(i + 1), row[i].data(), static_cast<int>(row[i].size() * 2),
                          SQLITE_TRANSIENT);
    }
    const int rc = sqlite3_step(stmt);
    sqlite3_reset(stmt);
    if (rc != SQLITE_DONE) {
      ADD_FAILURE() << "seeding a row failed with " << rc;
      break;
    }
  }
  sqlite3_finalize(stmt);
  raw.Exec("COMMIT");
}

std::vector<std::vector<std::u16string>> StoreDir::Rows() const {
  std::vector<std::vector<std::u16string>> rows;
  RawConnection raw(db_path());
  sqlite3_stmt* stmt = nullptr;
  if (sqlite3_prepare_v2(raw.get(), "SELECT * FROM AlertDB", -1, &stmt, nullptr) != SQLITE_OK) return rows;
  while (sqlite3_step(stmt) == SQLITE_ROW) {
    std::vector<std::u16string> row;
    for (int c = 0; c < sqlite3_column_count(stmt); ++c) {
      const auto* text = static_cast<const char16_t*>(sqlite3_column_text16(stmt, c));
      row.emplace_back(text, static_cast<size_t>(sqlite3_column_bytes16(stmt, c)) / 2);
    }
    rows.push_back(row);
  }
  sqlite3_finalize(stmt);
  return rows;
}

int64_t StoreDir::RowCount() const { return static_cast<int64_t>(Rows().size()); }

RawConnection::RawConnection(const std::u16string& path) {
  EXPECT_EQ(sqlite3_open16(path.c_str(), &db_), SQLITE_OK);
}
// close_v2: a test that fails half-way must not leave the file locked for the next.
RawConnection::~RawConnection() { sqlite3_close_v2(db_); }
int RawConnection::Exec(const char* sql) { return sqlite3_exec(db_, sql, nullptr, nullptr, nullptr); }

#ifndef _WIN32

namespace {
std::u16string SettingFolder(const std::u16string& root, const std::u16string& name) {
  return root + u"/software/Varnholt Suite/Varnholt Suite/" + name;
}
}  // namespace

SeededSettings::SeededSettings() : previous_root_(platform::SettingsRoot()) {
  MakeFolders(root_.Join(u"software"));
  platform::SetSettingsRoot(root_.path());
}
SeededSettings::~SeededSettings() { platform::SetSettingsRoot(previous_root_); }

void SeededSettings::SetString(const std::u16string& name, const std::u16string& value) {
  const std::u16string file = SettingFolder(root_.path(), name) + u"/" + name;
  RemoveTree(file);
  WriteText(file, Utf16ToUtf8(value));
}
void SeededSettings::SetNonString(const std::u16string& name, uint32_t) {
  const std::u16string file = SettingFolder(root_.path(), name) + u"/" + name;
  RemoveTree(file);
  MakeFolders(file);
}
void SeededSettings::Remove(const std::u16string& name) { RemoveTree(SettingFolder(root_.path(), name)); }
bool SeededSettings::KeyExists(const std::u16string& name) const {
  return platform::Current().PathExists(SettingFolder(root_.path(), name));
}

#else

namespace {
constexpr wchar_t kVendor[] = L"software\\Varnholt Suite";
constexpr wchar_t kSuite[] = L"software\\Varnholt Suite\\Varnholt Suite";
const wchar_t* W(const std::u16string& s) { return reinterpret_cast<const wchar_t*>(s.c_str()); }

HKEY SettingKey(const std::u16string& name) {
  std::wstring path = std::wstring(kSuite) + L"\\" + W(name);
  HKEY key = nullptr;
  EXPECT_EQ(RegCreateKeyExW(HKEY_LOCAL_MACHINE, path.c_str(), 0, nullptr, 0, KEY_ALL_ACCESS, nullptr, &key, nullptr),
            ERROR_SUCCESS);
  return key;
}
}  // namespace

SeededSettings::SeededSettings() {
  HKEY key = nullptr;
  vendor_existed_ = RegOpenKeyExW(HKEY_LOCAL_MACHINE, kVendor, 0, KEY_READ, &key) == ERROR_SUCCESS;
  if (key != nullptr) RegCloseKey(key);
  Remove(u"Sch_Retention");
  Remove(u"Sch_Retention_Val");
}

SeededSettings::~SeededSettings() {
  Remove(u"Sch_Retention");
  Remove(u"Sch_Retention_Val");
  if (!vendor_existed_) {
    RegDeleteTreeW(HKEY_LOCAL_MACHINE, kVendor);
    RegDeleteKeyW(HKEY_LOCAL_MACHINE, kVendor);
  }
}

void SeededSettings::SetString(const std::u16string& name, const std::u16string& value) {
  HKEY key = SettingKey(name);
  EXPECT_EQ(RegSetValueExW(key, W(name), 0, REG_SZ, reinterpret_cast<const BYTE*>(value.c_str()),
                           static_cast<DWORD>((value.size() + 1) * 2)),
            ERROR_SUCCESS);
  RegCloseKey(key);
}

void SeededSettings::SetNonString(const std::u16string& name, uint32_t number) {
  HKEY key = SettingKey(name);
  const DWORD value = number;
  EXPECT_EQ(RegSetValueExW(key, W(name), 0, REG_DWORD, reinterpret_cast<const BYTE*>(&value), sizeof value),
            ERROR_SUCCESS);
  RegCloseKey(key);
}

void SeededSettings::Remove(const std::u16string& name) {
  std::wstring path = std::wstring(kSuite) + L"\\" + W(name);
  RegDeleteTreeW(HKEY_LOCAL_MACHINE, path.c_str());
  RegDeleteKeyW(HKEY_LOCAL_MACHINE, path.c_str());
}

bool SeededSettings::KeyExists(const std::u16string& name) const {
  std::wstring path = std::wstring(kSuite) + L"\\" + W(name);
  HKEY key = nullptr;
  const bool exists = RegOpenKeyExW(HKEY_LOCAL_MACHINE, path.c_str(), 0, KEY_READ, &key) == ERROR_SUCCESS;
  if (key != nullptr) RegCloseKey(key);
  return exists;
}

#endif

}  // namespace asum::test
