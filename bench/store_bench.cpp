// Count and purge over 10 000, 100 000 and 1 000 000 alert rows: the store's
// CountAlerts and DeleteOldAlerts beside the same statement run in a bare
// SQLite loop (open, prepare, bind, step, finalize, close) in the same run.
//
//   bench_store [max_rows]     (default 1000000)
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

namespace fs = std::filesystem;
using Clock = std::chrono::steady_clock;

namespace {

constexpr char16_t kFilter[] = u"Email Alert";
constexpr char16_t kRange[] = u"<TO>2024/03/01 00:00:00</FROM><TO>2024/06/30 23:59:59</TO>";
constexpr char16_t kCutoff[] = u"2024/01/01 00:00:00";
constexpr int kCountRuns = 5;

double MsSince(Clock::time_point start) {
  return std::chrono::duration<double, std::milli>(Clock::now() - start).count();
}

double Median(std::vector<double> v) {
  std::sort(v.begin(), v.end());
  return v[v.size() / 2];
}

// Rows spread over 2023 and 2024, alternating the two actions.
void Fill(const std::u16string& db_path, int rows) {
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
    const int day = i % 730;
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

}  // namespace

int main(int argc, char** argv) {
  const long max_rows = argc > 1 ? std::strtol(argv[1], nullptr, 10) : 1000000;
  const fs::path root = fs::temp_directory_path() / ("store-bench-" + std::to_string(Clock::now().time_since_epoch().count()));
  fs::create_directories(root);
  std::printf("%10s  %12s %12s %7s  %12s %12s %7s\n", "rows", "count ms", "bare ms", "ratio", "purge ms", "bare ms",
              "ratio");
  for (int rows : {10000, 100000, 1000000}) {
    if (rows > max_rows) break;
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
  }
  fs::remove_all(root);
  return 0;
}
