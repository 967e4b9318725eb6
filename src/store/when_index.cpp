#include "store/when_index.h"

namespace asum {

bool HasWhenIndex(CDbSQLite& db) {
  std::unique_ptr<CSqlStatement> probe =
      db.Statement(u"SELECT count(*) FROM sqlite_master WHERE type = 'index' AND name = ?1");
  probe->BindText(1, kWhenIndexName);
  return probe->NextRow() && probe->ValueString(0) == u"1";
}

bool CreateWhenIndex(CDbSQLite& db) {
  return db.Statement(u"CREATE INDEX IF NOT EXISTS " + std::u16string(kWhenIndexName) + u" ON AlertDB (\"When\")")
      ->Execute();
}

bool DropWhenIndex(CDbSQLite& db) {
  return db.Statement(u"DROP INDEX IF EXISTS " + std::u16string(kWhenIndexName))->Execute();
}

}  // namespace asum
