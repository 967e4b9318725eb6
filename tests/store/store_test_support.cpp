#include "store_test_support.h"

#include <filesystem>
#include <fstream>

#ifndef _WIN32
#include <fcntl.h>
#include <linux/fs.h>
#include <sys/ioctl.h>
#include <unistd.h>
#endif

#include "store/setting_db_management.h"

namespace asum::test {

void StoreDir::Create() const {
  CSettingDBManagement store;
  ASSERT_TRUE(store.OpenDB(CSettingDBManagement::DatabasePath(CSettingDBManagement::GetAlertSummaryFolder(install()))));
}

void StoreDir::Insert(const std::vector<std::array<std::u16string, 3>>& rows) const {
  RawConnection raw(db_path());
  sqlite3_stmt* stmt = nullptr;
  ASSERT_EQ(sqlite3_prepare_v2(raw.get(), "INSERT INTO AlertDB VALUES(?1,?2,'x',?3,'x','x','x','x','x','x','x')", -1,
                               &stmt, nullptr),
            SQLITE_OK);
  for (const auto& row : rows) {
    for (int i = 0; i < 3; ++i) sqlite3_bind_text16(stmt, i + 1, row[i].c_str(), -1, SQLITE_TRANSIENT);
    EXPECT_EQ(sqlite3_step(stmt), SQLITE_DONE);
    sqlite3_reset(stmt);
  }
  sqlite3_finalize(stmt);
}

std::vector<Row> StoreDir::Rows() const {
  std::vector<Row> rows;
  RawConnection raw(db_path());
  sqlite3_stmt* stmt = nullptr;
  if (sqlite3_prepare_v2(raw.get(), "SELECT * FROM AlertDB", -1, &stmt, nullptr) != SQLITE_OK) return rows;
  while (sqlite3_step(stmt) == SQLITE_ROW) {
    Row& row = rows.emplace_back();
    for (int c = 0; c < sqlite3_column_count(stmt); ++c) {
      row.emplace_back(static_cast<const char16_t*>(sqlite3_column_text16(stmt, c)));
    }
  }
  sqlite3_finalize(stmt);
  return rows;
}

UnwritableFile::UnwritableFile(const std::u16string& path) : path_(path) {
  std::filesystem::permissions(std::filesystem::path(path_), std::filesystem::perms::owner_read);
  if (!unwritable()) immutable_ = SetImmutable(true);
}

UnwritableFile::~UnwritableFile() {
  if (immutable_) SetImmutable(false);
  std::filesystem::permissions(std::filesystem::path(path_), std::filesystem::perms::owner_all);
}

bool UnwritableFile::unwritable() const { return !std::ofstream(std::filesystem::path(path_), std::ios::app).good(); }

bool UnwritableFile::SetImmutable(bool on) const {
#ifdef _WIN32
  (void)on;
  return false;
#else
  const int fd = ::open(Narrow(path_).c_str(), O_RDONLY);
  int flags = 0;
  bool ok = fd >= 0 && ::ioctl(fd, FS_IOC_GETFLAGS, &flags) == 0;
  flags = on ? flags | FS_IMMUTABLE_FL : flags & ~FS_IMMUTABLE_FL;
  ok = ok && ::ioctl(fd, FS_IOC_SETFLAGS, &flags) == 0;
  if (fd >= 0) ::close(fd);
  return ok;
#endif
}

namespace {

const std::u16string& PathOf(platform::SettingsKey key) { return *static_cast<std::u16string*>(key); }

std::u16string ChildPath(platform::SettingsKey parent, const std::u16string& name) {
  return parent == platform::Env::LocalMachine() ? name : PathOf(parent) + u"\\" + name;
}

}  // namespace

platform::SettingsKey StoreEnv::OpenKey(platform::SettingsKey parent, const std::u16string& name) {
  if (parent == nullptr || keys.count(ChildPath(parent, name)) == 0) return nullptr;
  ++open_keys;
  return new std::u16string(ChildPath(parent, name));
}

platform::SettingsKey StoreEnv::CreateKey(platform::SettingsKey parent, const std::u16string& name) {
  if (parent == nullptr) return nullptr;
  keys.insert(ChildPath(parent, name));
  ++open_keys;
  return new std::u16string(ChildPath(parent, name));
}

std::optional<std::u16string> StoreEnv::QueryStringValue(platform::SettingsKey key, const std::u16string& name) {
  const auto found = values.find(PathOf(key) + u"\\" + name);
  if (found == values.end()) return std::nullopt;
  return found->second;
}

void StoreEnv::CloseKey(platform::SettingsKey key) {
  --open_keys;
  delete static_cast<std::u16string*>(key);
}

}  // namespace asum::test
