// The optional index on "When" that the support tool adds on request.
//
// The library never creates it: the table stays as other programs expect it.
// When someone has added it, the count's date range and the purge's cut-off
// use it without any change to their statements; nothing else in the
// database changes.
//
// Each function runs one statement on the connection it is given (open, on
// the caller's thread) and reports failure as false.
#pragma once

#include <string>

#include "store/sqlite_db.h"

namespace asum {

inline constexpr char16_t kWhenIndexName[] = u"AlertDB_When";

// True when the database holds the index.
bool HasWhenIndex(CDbSQLite& db);
// Adds the index unless it is there; true when it is there afterwards.
bool CreateWhenIndex(CDbSQLite& db);
// Removes the index if it is there; true when it is gone afterwards.
bool DropWhenIndex(CDbSQLite& db);

}  // namespace asum
