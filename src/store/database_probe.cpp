#include "store/database_probe.h"

#include <sqlite3.h>

#include "common/utf.h"

namespace asum {

bool IsDatabaseFile(const std::u16string& path) {
  sqlite3* db = nullptr;
  const std::string utf8 = Utf16ToUtf8(path);
  if (sqlite3_open_v2(utf8.c_str(), &db, SQLITE_OPEN_READONLY, nullptr) != SQLITE_OK) {
    sqlite3_close(db);
    return true;
  }
  sqlite3_stmt* statement = nullptr;
  int rc = sqlite3_prepare_v2(db, "SELECT count(*) FROM sqlite_master", -1, &statement, nullptr);
  if (rc == SQLITE_OK) rc = sqlite3_step(statement);
  sqlite3_finalize(statement);
  sqlite3_close(db);
  return rc != SQLITE_NOTADB;
}

}  // namespace asum
