// Count and purge over 10 000, 100 000 and 1 000 000 alert rows: the store's
// CountAlerts and DeleteOldAlerts beside the same statement run in a bare
// SQLite loop (open, prepare, bind, step, finalize, close) in the same run.
// At the largest size, the optional index on "When" (alertsummary optimize)
// side by side with the table as the library creates it: a one-month count,
// and the ingest rate of rows stored one commit each as the processing does.
//
//   bench_store [max_rows] [ingest_rows]    (defaults 1000000 and 600)
#include <sqlite3.h>

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <string>
#include <vector>

#include "store/alert_count.h"
#include "store/retention.h"
#include "store/setting_db_management.h"
#include "store/when_index.h"
#include "platform/platform.h"

namespace fs = std::filesystem;
using Clock = std::chrono::steady_clock;

namespace {

constexpr char16_t kFilter[] = u"Email Alert";
constexpr char16_t kRange[] = u"<TO>2024/03/01 00:00:00</FROM><TO>2024/06/30 23:59:59</TO>";
constexpr char16_t kCutoff[] = u"2024/01/01 00:00:00";
constexpr char16_t kMonth[] = u"<TO>2024/03/01 00:00:00</FROM><TO>2024/03/31 23:59:59</TO>";
constexpr int kIngestRounds = 6;
constexpr int kCountRuns = 5;

double MsSince(Clock::time_point start) {
  return std::chrono::duration<double, std::milli>(Clock::now() - start).count();
}

double Median(std::vector<double> v) {
  std::sort(v.begin(), v.end());
  return v[v.size() / 2];
}

// Rows spread over 2023 and 2024, alternating the two actions: each day's
// rows scattered over the whole table, or, as a service stores them, in the
// order they came (a month's rows lie together).
void Fill(const std::u16string& db_path, int rows, bool in_time_order = false) {
  sqlite3* db = nullptr;
  sqlite3_open16(db_path.c_str(), &db);
  sqlite3_exec(db, "BEGIN", nullptr, nullptr, nullptr);
  sqlite3_stmt* insert = nullptr;
  sqlite3_prepare_v2(db, "INSERT INTO AlertDB VALUES(?1,?2,'Name',?3,'No','DOMAIN\\user','Modify','File Server',"
                         "'Delivered','SRV01','C:\\Suite\\AlertReports\\Sent items\\a.eml')",
                     -1, &insert, nullptr);
  const char* types[] = {"Threshold", "Permission Change", "Logon Failure", "File Deleted"};
  char when[32];
  for (int i = 0; i < rows; ++i) {
    const int day = in_time_order ? static_cast<int>(int64_t{i} * 730 / rows) : i % 730;
    std::snprintf(when, sizeof when, "%d/%02d/%02d %02d:%02d:%02d", 2023 + day / 365, 1 + (day % 365) / 31 % 12,
                  1 + day % 28, i % 24, i % 60, (i / 7) % 60);
    sqlite3_bind_text(insert, 1, i % 2 ? "Email Alert" : "Script Alert", -1, SQLITE_STATIC);
    sqlite3_bind_text(insert, 2, types[i % 4], -1, SQLITE_STATIC);
    sqlite3_bind_text(insert, 3, when, -1, SQLITE_TRANSIENT);
    sqlite3_step(insert);
    sqlite3_reset(insert);
  }
  sqlite3_finalize(insert);
  sqlite3_exec(db, "COMMIT", nullptr, nullptr, nullptr);
  sqlite3_close(db);
}

int BareCount(const std::u16string& db_path) {
  const asum::CountStatement s = asum::BuildCountStatement(kFilter, kRange);
  sqlite3* db = nullptr;
  sqlite3_open16(db_path.c_str(), &db);
  sqlite3_stmt* stmt = nullptr;
  sqlite3_prepare16(db, s.sql.c_str(), -1, &stmt, nullptr);
  for (size_t i = 0; i < s.params.size(); ++i) {
    sqlite3_bind_text16(stmt, static_cast<int>(i + 1), s.params[i].data(),
                        static_cast<int>(s.params[i].size() * 2), SQLITE_TRANSIENT);
  }
  const int count = sqlite3_step(stmt) == SQLITE_ROW ? sqlite3_column_int(stmt, 0) : -1;
  sqlite3_finalize(stmt);
  sqlite3_close(db);
  return count;
}

int BarePurge(const std::u16string& db_path) {
  const std::u16string sql = u"DELETE FROM AlertDB WHERE \"When\" <= '" + std::u16string(kCutoff) + u"';";
  sqlite3* db = nullptr;
  sqlite3_open16(db_path.c_str(), &db);
  sqlite3_stmt* stmt = nullptr;
  sqlite3_prepare16(db, sql.c_str(), -1, &stmt, nullptr);
  const int rc = sqlite3_step(stmt);
  sqlite3_finalize(stmt);
  sqlite3_close(db);
  return rc == SQLITE_DONE ? 1 : 0;
}

// Stores `rows` alerts one commit each, as ProcessAlertFiles does; rows per second.
double IngestRate(const std::u16string& db_path, int rows, int first) {
  asum::CSettingDBManagement store;
  store.OpenDB(db_path);
  const auto start = Clock::now();
  for (int i = first; i < first + rows; ++i) {
    char when[32];
    std::snprintf(when, sizeof when, "2025/%02d/%02d %02d:%02d:%02d", 1 + i % 12, 1 + i % 28, i % 24, i % 60,
                  (i / 3) % 60);
    const std::u16string w(when, when + std::char_traits<char>::length(when));
    store.FillDatainDB(u"Email Alert", u"Threshold", u"Name", w, u"No", u"DOMAIN\\user", u"Modify", u"File Server",
                       u"Delivered", u"C:\\Suite\\AlertReports\\Sent items\\b.eml", u"SRV01");
  }
  const double seconds = MsSince(start) / 1000;
  store.CloseDB();
  return rows / seconds;
}

std::u16string NewStore(const fs::path& install) {
  fs::create_directories(install);
  const std::u16string db_path =
      asum::CSettingDBManagement::DatabasePath(asum::CSettingDBManagement::GetAlertSummaryFolder(install.u16string()));
  asum::CSettingDBManagement store;
  store.OpenDB(db_path);
  return db_path;
}

// The same store twice, the second with the index; counts and ingest rounds
// alternate between them so both see the same machine.
void CompareIndex(const fs::path& root, int rows, int ingest_rows) {
  std::printf("\n%10s  %14s %14s %7s\n", "rows", "without index", "with index", "ratio");
  for (const bool in_time_order : {false, true}) {
    const char* layout = in_time_order ? "stored in time order" : "days scattered";
    const fs::path plain_install = root / "plain", indexed_install = root / "indexed";
    const std::u16string plain_db = NewStore(plain_install), indexed_db = NewStore(indexed_install);
    Fill(plain_db, rows, in_time_order);
    fs::copy_file(fs::path(plain_db), fs::path(indexed_db), fs::copy_options::overwrite_existing);
    {
      asum::CDbSQLite db;
      db.Open(indexed_db);
      asum::CreateWhenIndex(db);
    }
    std::vector<double> plain, indexed;
    int plain_count = 0, indexed_count = 0;
    for (int run = 0; run < kCountRuns; ++run) {
      auto start = Clock::now();
      plain_count = asum::CountAlerts(plain_install.u16string(), kFilter, kMonth);
      plain.push_back(MsSince(start));
      start = Clock::now();
      indexed_count = asum::CountAlerts(indexed_install.u16string(), kFilter, kMonth);
      indexed.push_back(MsSince(start));
    }
    if (plain_count != indexed_count) std::printf("counts differ: %d and %d\n", plain_count, indexed_count);
    const double count_plain = Median(plain), count_indexed = Median(indexed);
    std::printf("%10d  %11.2f ms %11.2f ms %7.3f   one-month count (%d alerts), %s\n", rows, count_plain,
                count_indexed, count_indexed / count_plain, plain_count, layout);
    std::printf("SUMMARY store | one-month count with / without the When index, %s, %d rows | %.3f\n", layout, rows,
                count_indexed / count_plain);
    if (in_time_order) {
      double plain_rate = 0, indexed_rate = 0;
      const int per_round = std::max(1, ingest_rows / kIngestRounds);
      for (int round = 0; round < kIngestRounds; ++round) {
        plain_rate += IngestRate(plain_db, per_round, round * per_round) / kIngestRounds;
        indexed_rate += IngestRate(indexed_db, per_round, round * per_round) / kIngestRounds;
      }
      std::printf("%10d  %10.0f r/s %10.0f r/s %7.3f   ingest, one commit per alert (%d rows each)\n", rows,
                  plain_rate, indexed_rate, indexed_rate / plain_rate, per_round * kIngestRounds);
      std::printf("SUMMARY store | ingest rate with / without the When index at %d rows | %.3f\n", rows,
                  indexed_rate / plain_rate);
    }
    fs::remove_all(plain_install);
    fs::remove_all(indexed_install);
  }
}

}  // namespace

int main(int argc, char** argv) {
  const long max_rows = argc > 1 ? std::strtol(argv[1], nullptr, 10) : 1000000;
  const int ingest_rows = argc > 2 ? static_cast<int>(std::strtol(argv[2], nullptr, 10)) : 600;
  asum::platform::SetLogFolder(u"");  // the figures are the store's, not the log's
  const fs::path root = fs::temp_directory_path() / ("store-bench-" + std::to_string(Clock::now().time_since_epoch().count()));
  fs::create_directories(root);
  std::printf("%10s  %12s %12s %7s  %12s %12s %7s\n", "rows", "count ms", "bare ms", "ratio", "purge ms", "bare ms",
              "ratio");
  const int sizes[] = {10000, 100000, 1000000};
  for (int rows : sizes) {
    if (rows > max_rows) break;
    const bool largest = rows == sizes[2] || rows * 10 > max_rows;
    const std::u16string install = (root / std::to_string(rows)).u16string();
    fs::create_directories(fs::path(install));
    const std::u16string db_path =
        asum::CSettingDBManagement::DatabasePath(asum::CSettingDBManagement::GetAlertSummaryFolder(install));
    {
      asum::CSettingDBManagement store;
      store.OpenDB(db_path);
    }
    Fill(db_path, rows);

    std::vector<double> ours, bare;
    int ours_result = 0, bare_result = 0;
    for (int run = 0; run < kCountRuns; ++run) {
      auto start = Clock::now();
      ours_result = asum::CountAlerts(install, kFilter, kRange);
      ours.push_back(MsSince(start));
      start = Clock::now();
      bare_result = BareCount(db_path);
      bare.push_back(MsSince(start));
    }
    if (ours_result != bare_result) std::printf("counts differ: %d and %d\n", ours_result, bare_result);

    // Each purge starts from the same file.
    const fs::path original(db_path), copy = fs::path(db_path).concat(".orig");
    fs::copy_file(original, copy, fs::copy_options::overwrite_existing);
    auto start = Clock::now();
    const int purge_result = asum::DeleteOldAlerts(install, kCutoff);
    const double purge_ms = MsSince(start);
    fs::copy_file(copy, original, fs::copy_options::overwrite_existing);
    start = Clock::now();
    const int bare_purge_result = BarePurge(db_path);
    const double bare_purge_ms = MsSince(start);
    if (purge_result != 1 || bare_purge_result != 1) std::printf("a purge failed\n");

    const double count_ms = Median(ours), count_bare = Median(bare);
    std::printf("%10d  %12.2f %12.2f %7.2f  %12.2f %12.2f %7.2f   (count %d)\n", rows, count_ms, count_bare,
                count_ms / count_bare, purge_ms, bare_purge_ms, purge_ms / bare_purge_ms, ours_result);
    std::printf("SUMMARY store | count / bare at %d rows | %.2f\n", rows, count_ms / count_bare);
    std::printf("SUMMARY store | purge / bare at %d rows | %.2f\n", rows, purge_ms / bare_purge_ms);
    fs::remove_all(fs::path(install));
    if (largest) CompareIndex(root, rows, ingest_rows);
  }
  fs::remove_all(root);
  return 0;
}
