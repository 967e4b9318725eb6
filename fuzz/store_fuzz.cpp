// Range splitting and count statement building over arbitrary texts. The
// input's bytes are read as UTF-16; a U+FFFF (or the middle, when there is
// none) separates the filter from the range. Every statement built must
// compile and run on a database of the real schema: filter and bounds are
// bound, so no text can break it.
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <string>

#include "store/alert_count.h"
#include "store/alert_table.h"
#include "store/sqlite_db.h"

namespace {

asum::CDbSQLite* Database() {
  static asum::CDbSQLite* db = [] {
    auto* d = new asum::CDbSQLite;
    if (!d->Open(u":memory:") || !d->Statement(asum::CreateAlertTableSql())->Execute() ||
        !d->Statement(u"INSERT INTO AlertDB VALUES('Email Alert','T','N','2024/03/05 00:00:00','','','','','','','')")
             ->Execute()) {
      std::abort();
    }
    return d;
  }();
  return db;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  std::u16string text;
  for (size_t i = 0; i + 1 < size; i += 2) text += static_cast<char16_t>(data[i] | (data[i + 1] << 8));
  size_t cut = text.find(u'\xFFFF');
  if (cut == std::u16string::npos) cut = text.size() / 2;
  const std::u16string filter = text.substr(0, cut);
  const std::u16string range = cut < text.size() ? text.substr(cut + 1) : std::u16string();

  const asum::RangeBounds bounds = asum::SplitRange(range);
  // Each bound is a piece of the range text; the lower one holds no ">".
  if (bounds.lower.size() > range.size() || bounds.upper.size() > range.size()) std::abort();
  if (!bounds.lower.empty() && range.find(bounds.lower) == std::u16string::npos) std::abort();
  if (!bounds.upper.empty() && range.find(bounds.upper) == std::u16string::npos) std::abort();
  if (bounds.lower.find(u'>') != std::u16string::npos) std::abort();
  if (bounds.has_date_condition != (range.rfind(u"</FROM>", 0) != 0)) std::abort();

  const asum::CountStatement statement = asum::BuildCountStatement(filter, range);
  if (statement.params.size() != (bounds.has_date_condition ? 3u : 1u)) std::abort();
  auto query = Database()->Statement(statement.sql);
  if (!query->IsValid()) std::abort();
  for (size_t i = 0; i < statement.params.size(); ++i) {
    if (!query->BindText(static_cast<int>(i + 1), statement.params[i])) std::abort();
  }
  if (!query->NextRow()) std::abort();
  const std::u16string count = query->ValueString(0);
  if (count != u"0" && count != u"1") std::abort();
  return 0;
}
