#include "store/database_probe.h"

#include "store/sqlite_db.h"

namespace asum {

bool IsDatabaseFile(const std::u16string& path) {
  // No budget: a file another connection holds locked is busy, not junk.
  CDbSQLite db;
  if (!db.OpenReadOnly(path)) return true;
  std::unique_ptr<CSqlStatement> statement = db.Statement(u"SELECT count(*) FROM sqlite_master");
  statement->NextRow();
  return !statement->FoundNotADatabase();
}

}  // namespace asum
