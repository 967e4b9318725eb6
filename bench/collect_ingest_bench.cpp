// Ingest: one collection cycle over a backlog of realistic alert files (every
// kind, base64 and quoted-printable bodies, 5 to 50 KB, three components and
// "Predefine Alerts"), beside the same rows inserted through a bare SQLite
// loop on the same disk: UTF-16 database, the table's own CREATE statement,
// one statement prepared once, eleven texts bound, one implicit transaction
// per insert. Every alert is committed before its file is renamed, so the bare
// loop is the ceiling; the figure that matters is the ratio.
//
// The shared disks here swing by a factor of two within seconds, so the two
// are measured side by side, file by file: the bare loop's insert of a row
// runs inside the cycle, between the cycle's commit of that row and its
// rename (through the platform seam), and the cycle's time is its whole run
// less those inserts. The reading and extraction share is timed apart, over
// the same files, so that a ratio below the target says where the time went.
// Each round runs the cycle with the diagnostic log off, as on a host without
// the debug folder (the figure with the target), then with it on (every file
// analysed on the processing thread, its lines written as they happen), each
// beside its own bare loop.
//
//   bench_collect_ingest [files] [runs] [with_log]   (defaults 2000 3 1)
//   The data goes under the system temporary folder (TMPDIR).
#include <sqlite3.h>

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <unordered_map>
#include <string>
#include <vector>

#include "alert_generator.h"
#include "collect/alert_message.h"
#include "collect/cycle.h"
#include "collect/process_alerts.h"
#include "platform/platform.h"
#include "store/alert_table.h"

namespace fs = std::filesystem;
using Clock = std::chrono::steady_clock;

namespace {

constexpr uint32_t kSeed = 7;
constexpr int kComponents = 3;
constexpr size_t kMinBytes = 5000;
constexpr size_t kMaxBytes = 50000;
constexpr double kTarget = 0.9;

double SecondsSince(Clock::time_point start) {
  return std::chrono::duration<double>(Clock::now() - start).count();
}

double Median(std::vector<double> v) {
  std::sort(v.begin(), v.end());
  const size_t n = v.size();
  return n % 2 ? v[n / 2] : (v[n / 2 - 1] + v[n / 2]) / 2;
}

struct ReportFolder {
  fs::path path;
  std::u16string status;
  std::u16string component;
};

// The generator sizes its tables for the table kinds; script and data-leakage
// alerts come out smaller, so those are made again with more rows until the
// file is near the size asked for.
asum::gen::GeneratedAlert AlertOfSize(uint32_t index, size_t size, bool predefined) {
  int rows = asum::gen::RowsForSize(size);
  auto alert = asum::gen::GenerateAlert(kSeed, index, rows, predefined);
  for (int attempt = 0; attempt < 3 && alert.bytes.size() * 10 < size * 9; ++attempt) {
    rows = static_cast<int>(rows * static_cast<double>(size) / static_cast<double>(alert.bytes.size())) + 1;
    alert = asum::gen::GenerateAlert(kSeed, index, rows, predefined);
  }
  return alert;
}

// Lays the files out as the alerting service does and returns the report
// folders and the total size written.
std::vector<ReportFolder> Generate(const fs::path& install, int files, size_t* bytes) {
  std::vector<ReportFolder> folders;
  for (int c = 0; c <= kComponents; ++c) {
    const bool predefined = c == kComponents;
    const std::string name = predefined ? "Predefine Alerts" : "Component" + std::to_string(c + 1);
    fs::create_directories(install / name / "AlertReports");
    if (!predefined) std::ofstream(install / name / "info.dat");
    for (const char* report : {"Sent items", "Outbox"}) {
      const fs::path path = install / name / "AlertReports" / report;
      fs::create_directories(path);
      folders.push_back({path, report[0] == 'S' ? u"Delivered" : u"Failed", fs::path(name).u16string()});
    }
  }
  *bytes = 0;
  for (int i = 0; i < files; ++i) {
    const int slot = i % (kComponents + 1);
    // Two of every three to "Sent items", as the service's retries leave them.
    const ReportFolder& folder = folders[2 * slot + ((i / 2 + i / 12) % 3 == 2 ? 1 : 0)];
    const size_t size = kMinBytes + (static_cast<size_t>(i) * 7919) % (kMaxBytes - kMinBytes + 1);
    const auto alert = AlertOfSize(static_cast<uint32_t>(i), size, slot == kComponents);
    std::ofstream out(folder.path / alert.file_name, std::ios::binary);
    out.write(alert.bytes.data(), static_cast<std::streamsize>(alert.bytes.size()));
    *bytes += alert.bytes.size();
  }
  return folders;
}

using RowsByPath = std::unordered_map<std::u16string, asum::AlertRow>;

struct AnalysisFigures {
  double reading_seconds = 0;   // the message reader alone
  double analysis_seconds = 0;  // reading, subject and body extraction
  int files = 0;
};

// The rows the cycle will store, worked out outside it; also times the
// reading and the extraction of every file.
RowsByPath AnalyzeAll(const std::vector<ReportFolder>& folders, AnalysisFigures* f) {
  RowsByPath rows;
  std::vector<std::pair<std::u16string, const ReportFolder*>> files;
  for (const ReportFolder& folder : folders) {
    for (const auto& entry : fs::directory_iterator(folder.path)) files.emplace_back(entry.path().u16string(), &folder);
  }
  f->files = static_cast<int>(files.size());
  auto start = Clock::now();
  for (const auto& [path, folder] : files) {
    asum::AlertMessage message;
    asum::LoadAlertMessage(path, &message);
  }
  f->reading_seconds = SecondsSince(start);
  start = Clock::now();
  for (const auto& [path, folder] : files) {
    asum::AlertAnalysis a = asum::AnalyzeAlertFile(path, folder->status, folder->component);
    if (a.outcome == asum::AlertOutcome::kStore) rows.emplace(path, std::move(a.row));
  }
  f->analysis_seconds = SecondsSince(start);
  return rows;
}

// Gives every processed file its own name back, so that the next run finds
// the same backlog.
void Unmark(const std::vector<ReportFolder>& folders) {
  for (const ReportFolder& folder : folders) {
    std::vector<fs::path> marked;
    for (const auto& entry : fs::directory_iterator(folder.path)) {
      if (entry.path().filename().string().rfind("PROC_", 0) == 0) marked.push_back(entry.path());
    }
    for (const fs::path& p : marked) fs::rename(p, folder.path / p.filename().string().substr(5));
  }
}

void RemoveDatabase(const fs::path& db) {
  fs::remove(db);
  fs::remove(fs::path(db).concat("-journal"));
}

// The bare loop: one connection and one statement for the whole run, the
// table made by the library's own CREATE statement in a UTF-16 database, and
// the very rows the cycle stores (the cycle ends each value at its first
// character of code 0, so the loop does too).
class BareInserter {
 public:
  explicit BareInserter(const fs::path& path) {
    RemoveDatabase(path);
    if (sqlite3_open16(path.u16string().c_str(), &db_) != SQLITE_OK) return;
    sqlite3_stmt* create = nullptr;
    sqlite3_prepare16_v2(db_, asum::CreateAlertTableSql().c_str(), -1, &create, nullptr);
    sqlite3_step(create);
    sqlite3_finalize(create);
    sqlite3_prepare16_v2(db_, u"INSERT into AlertDB VALUES(?,?,?,?,?,?,?,?,?, ?, ?)", -1, &insert_, nullptr);
  }
  ~BareInserter() {
    sqlite3_finalize(insert_);
    sqlite3_close(db_);
  }
  BareInserter(const BareInserter&) = delete;
  BareInserter& operator=(const BareInserter&) = delete;

  // Inserts one row in its own implicit transaction.
  void Insert(const asum::AlertRow& r) {
    const std::u16string* values[] = {&r.alert_action, &r.alert_type,   &r.alert_name,     &r.when,
                                      &r.threshold,    &r.who,          &r.operation,      &r.component_name,
                                      &r.email_status, &r.server_name,  &r.alert_path};
    const auto start = Clock::now();
    for (int i = 0; i < 11; ++i) {
      const size_t length = std::min(values[i]->find(u'\0'), values[i]->size());
      sqlite3_bind_text16(insert_, i + 1, values[i]->data(), static_cast<int>(length * 2), SQLITE_STATIC);
    }
    if (sqlite3_step(insert_) == SQLITE_DONE) ++inserted_;
    sqlite3_reset(insert_);
    seconds_ += SecondsSince(start);
  }
  double seconds() const { return seconds_; }
  int inserted() const { return inserted_; }

 private:
  sqlite3* db_ = nullptr;
  sqlite3_stmt* insert_ = nullptr;
  double seconds_ = 0;
  int inserted_ = 0;
};

// Runs the bare loop inside the cycle, one row at a time: each stored file's
// row goes through the bare connection right after the cycle committed it and
// before the cycle renames the file. Both commits then meet the same disk
// within milliseconds, and each still pays for what the other left dirty as a
// bare loop pays for its own previous commit. The lookup is a hash of the
// target name: the cycle's own time must not carry the benchmark's work.
class SideBySideEnv : public asum::platform::Env {
 public:
  SideBySideEnv(BareInserter* bare, const RowsByPath* rows) : bare_(bare) {
    for (const auto& [path, row] : *rows) proc_names_.emplace(asum::ProcName(path), &row);
  }
  asum::platform::FileResult RenameNoReplace(const std::u16string& from, const std::u16string& to) override {
    const auto found = proc_names_.find(to);
    if (bare_ != nullptr && found != proc_names_.end()) {
      bare_->Insert(*found->second);
      proc_names_.erase(found);
    }
    return Env::RenameNoReplace(from, to);
  }

 private:
  BareInserter* bare_;
  std::unordered_map<std::u16string, const asum::AlertRow*> proc_names_;  // PROC_ name -> its row
};

struct RunFigures {
  double cycle_seconds = 0;
  asum::ProcessTally tally;
};

// One cycle over the backlog; with `bare`, the bare inserts run inside it and
// their time is taken out of the cycle's.
RunFigures RunCycle(const std::u16string& install, const RowsByPath& rows, BareInserter* bare) {
  RunFigures f;
  const fs::path db(asum::DatabasePathOf(install));
  RemoveDatabase(db);
  asum::EnsureDatabase(install);
  SideBySideEnv env(bare, &rows);
  asum::platform::ScopedEnv scoped(&env);
  const double bare_before = bare != nullptr ? bare->seconds() : 0;
  const auto start = Clock::now();
  asum::CycleContext cycle;
  const asum::CycleResult result = asum::RunProcessingCycle(install, cycle, &f.tally);
  f.cycle_seconds = SecondsSince(start) - (bare != nullptr ? bare->seconds() - bare_before : 0);
  if (result != asum::CycleResult::kDone) std::printf("the cycle did not run (%d)\n", static_cast<int>(result));
  return f;
}

struct Ratios {
  std::vector<double> cycle_rates, bare_rates, ratios;
  void Add(double cycle_rate, double bare_rate) {
    cycle_rates.push_back(cycle_rate);
    bare_rates.push_back(bare_rate);
    ratios.push_back(cycle_rate / bare_rate);
  }
};

// One cycle beside its bare loop; prints the round's figures, checks the
// counts and adds the rates.
void Round(const std::u16string& install, const fs::path& bare_db, const RowsByPath& rows, int listed,
           const char* label, int round, Ratios* out) {
  BareInserter bare(bare_db);
  const RunFigures f = RunCycle(install, rows, &bare);
  if (f.tally.stored != rows.size() || f.tally.stored + f.tally.marked != static_cast<uint64_t>(listed) ||
      bare.inserted() != static_cast<int>(rows.size())) {
    std::printf("the cycle stored %llu, marked %llu and left %llu files; the bare loop inserted %d rows\n",
                static_cast<unsigned long long>(f.tally.stored), static_cast<unsigned long long>(f.tally.marked),
                static_cast<unsigned long long>(f.tally.left), bare.inserted());
  }
  const double cycle_rate = listed / f.cycle_seconds;
  const double bare_rate = rows.size() / bare.seconds();
  out->Add(cycle_rate, bare_rate);
  std::printf("%4d %-4s %10.3f %10.1f  %10.3f %10.1f  %7.3f\n", round, label, f.cycle_seconds, cycle_rate,
              bare.seconds(), bare_rate, cycle_rate / bare_rate);
}

}  // namespace

int main(int argc, char** argv) {
  std::setvbuf(stdout, nullptr, _IOLBF, 0);
  const int files = argc > 1 ? std::max(1, std::atoi(argv[1])) : 2000;
  const int runs = argc > 2 ? std::max(1, std::atoi(argv[2])) : 3;
  const bool with_log = argc > 3 ? std::atoi(argv[3]) != 0 : true;
  const fs::path root =
      fs::temp_directory_path() / ("collect-ingest-bench-" + std::to_string(Clock::now().time_since_epoch().count()));
  const fs::path install = root / "install";
  fs::create_directories(install);
  fs::create_directories(root / "bare");
  // The log folder existing is what turns the log on.
  const fs::path no_log = root / "no-log-folder";
  const fs::path log_folder = root / "log";
  fs::create_directories(log_folder);
  asum::platform::SetLogFolder(no_log.u16string());

  size_t bytes = 0;
  const auto folders = Generate(install, files, &bytes);
  AnalysisFigures analysis;
  const RowsByPath rows = AnalyzeAll(folders, &analysis);
  const int listed = analysis.files;
  std::printf("%d alert files, %.1f KB average, %zu with a row; under %s\n", listed, bytes / 1024.0 / listed,
              rows.size(), root.string().c_str());

  const std::u16string wide_install = install.u16string();
  Ratios off, on;
  std::printf("%4s %-4s %10s %10s  %10s %10s  %7s\n", "run", "log", "cycle s", "files/s", "bare s", "inserts/s",
              "ratio");
  for (int run = 0; run < runs; ++run) {
    const std::string n = std::to_string(run);
    Round(wide_install, root / "bare" / ("off" + n + ".db"), rows, listed, "off", run + 1, &off);
    Unmark(folders);
    if (!with_log) continue;
    asum::platform::SetLogFolder(log_folder.u16string());
    Round(wide_install, root / "bare" / ("on" + n + ".db"), rows, listed, "on", run + 1, &on);
    asum::platform::SetLogFolder(no_log.u16string());
    Unmark(folders);
  }

  const double cycle_rate = Median(off.cycle_rates), bare_rate = Median(off.bare_rates), ratio = Median(off.ratios);
  const double per_file_ms = 1e3 / cycle_rate, per_insert_ms = 1e3 / bare_rate;
  std::printf("median, log off: cycle %.1f files/s, bare %.1f inserts/s, ratio %.3f (target %.2f: %s)\n",
              cycle_rate, bare_rate, ratio, kTarget, ratio >= kTarget ? "met" : "missed");
  if (with_log) {
    std::printf("median, log on:  cycle %.1f files/s, bare %.1f inserts/s, ratio %.3f (every file analysed on the "
                "processing thread, its lines written as they happen)\n",
                Median(on.cycle_rates), Median(on.bare_rates), Median(on.ratios));
  }
  std::printf("per file, log off: cycle %.3f ms, bare insert %.3f ms, difference %.3f ms; outside the cycle, reading "
              "%.3f ms and extraction %.3f ms\n",
              per_file_ms, per_insert_ms, per_file_ms - per_insert_ms, analysis.reading_seconds * 1e3 / listed,
              (analysis.analysis_seconds - analysis.reading_seconds) * 1e3 / listed);

  std::printf("SUMMARY collect_ingest | cycle over %d files, files/s (median of %d) | %.1f\n", listed, runs,
              cycle_rate);
  std::printf("SUMMARY collect_ingest | bare autocommit inserts/s, same disk | %.1f\n", bare_rate);
  std::printf("SUMMARY collect_ingest | cycle / bare ratio (target >= %.2f) | %.3f\n", kTarget, ratio);
  if (with_log) {
    std::printf("SUMMARY collect_ingest | cycle / bare ratio, diagnostic log on | %.3f\n", Median(on.ratios));
  }
  std::error_code ignored;
  fs::remove_all(root, ignored);
  return 0;
}
