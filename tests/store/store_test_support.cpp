#include "store_test_support.h"

#include <filesystem>
#include <fstream>

#ifdef _WIN32
#include <windows.h>
#else
#include <fcntl.h>
#include <linux/fs.h>
#include <sys/ioctl.h>
#include <unistd.h>
#endif

#include "store/setting_db_management.h"

namespace asum::test {

void StoreDir::Create(const std::vector<std::array<std::u16string, 3>>& rows) const {
  CSettingDBManagement store;
  ASSERT_TRUE(store.OpenDB(CSettingDBManagement::DatabasePath(CSettingDBManagement::GetAlertSummaryFolder(install()))));
  store.ExecuteQuery(u"BEGIN");
  for (const auto& [action, type, when] : rows) {
    EXPECT_TRUE(store.FillDatainDB(action, type, u"x", when, u"x", u"x", u"x", u"x", u"x", u"x", u"x"));
  }
  store.ExecuteQuery(u"COMMIT");
}

std::vector<std::u16string> StoreDir::Column(const char* expression) const {
  std::vector<std::u16string> column;
  RawConnection raw(db_path());
  sqlite3_stmt* stmt = nullptr;
  sqlite3_prepare_v2(raw.get(), (std::string("SELECT ") + expression + " FROM AlertDB").c_str(), -1, &stmt, nullptr);
  while (stmt != nullptr && sqlite3_step(stmt) == SQLITE_ROW) {
    column.emplace_back(static_cast<const char16_t*>(sqlite3_column_text16(stmt, 0)));
  }
  sqlite3_finalize(stmt);
  return column;
}

UnwritableFile::UnwritableFile(const std::u16string& path) : path_(path) {
  std::filesystem::permissions(std::filesystem::path(path_), std::filesystem::perms::owner_read);
  if (!unwritable()) locked_out_ = LockOut(true);
}

UnwritableFile::~UnwritableFile() {
  if (locked_out_) LockOut(false);
  std::filesystem::permissions(std::filesystem::path(path_), std::filesystem::perms::owner_all);
}

bool UnwritableFile::unwritable() const { return !std::ofstream(std::filesystem::path(path_), std::ios::app).good(); }

bool UnwritableFile::LockOut(bool on) {
#ifdef _WIN32
  if (!on) return CloseHandle(handle_);
  handle_ = CreateFileW(reinterpret_cast<const wchar_t*>(path_.c_str()), GENERIC_READ, FILE_SHARE_READ, nullptr,
                        OPEN_EXISTING, FILE_ATTRIBUTE_NORMAL, nullptr);
  return handle_ != INVALID_HANDLE_VALUE;
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

}  // namespace asum::test
