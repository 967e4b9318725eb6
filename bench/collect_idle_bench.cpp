// Idle cycle: the thread runs a cycle every ten seconds for years, and most
// cycles find nothing new. This times one cycle over report folders that hold
// only already-processed "PROC_" files (10 000, then 100 000, over two
// components' "Sent items" and "Outbox"), beside a bare listing of the same
// folders in the same run, and prints how the cycle time grows (linear: 10x).
//
//   bench_collect_idle [max_files] [runs]   (defaults 100000 5)
//   The data goes under the system temporary folder (TMPDIR).
#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <string>
#include <string_view>
#include <vector>

#include "collect/cycle.h"
#include "collect/process_alerts.h"
#include "platform/platform.h"

namespace fs = std::filesystem;
using Clock = std::chrono::steady_clock;

namespace {

constexpr int kComponents = 2;

double MsSince(Clock::time_point start) {
  return std::chrono::duration<double, std::milli>(Clock::now() - start).count();
}

double Median(std::vector<double> v) {
  std::sort(v.begin(), v.end());
  const size_t n = v.size();
  return n % 2 ? v[n / 2] : (v[n / 2 - 1] + v[n / 2]) / 2;
}

// Empty files are enough: the cycle reads names only.
std::vector<fs::path> Layout(const fs::path& install, int files) {
  std::vector<fs::path> folders;
  for (int c = 1; c <= kComponents; ++c) {
    const fs::path component = install / ("Component" + std::to_string(c));
    fs::create_directories(component);
    std::ofstream(component / "info.dat");
    for (const char* report : {"Sent items", "Outbox"}) {
      folders.push_back(component / "AlertReports" / report);
      fs::create_directories(folders.back());
    }
  }
  char name[32];
  for (int i = 0; i < files; ++i) {
    std::snprintf(name, sizeof name, "PROC_Alert_%06d.eml", i);
    std::ofstream(folders[i % folders.size()] / name);
  }
  return folders;
}

// The least any cycle must do: read every name once and find it processed.
// The name is looked at where the iterator holds it, without a copy.
size_t BareListing(const std::vector<fs::path>& folders) {
  const auto has = [](const auto& name, std::string_view text) {
    return std::search(name.begin(), name.end(), text.begin(), text.end()) != name.end();
  };
  size_t fresh = 0;
  for (const fs::path& folder : folders) {
    for (const auto& entry : fs::directory_iterator(folder)) {
      const auto& full = entry.path().native();
      const auto name = std::basic_string_view<fs::path::value_type>(full).substr(full.find_last_of(fs::path::preferred_separator) + 1);
      if (has(name, ".eml") && !has(name, "PROC_")) ++fresh;
    }
  }
  return fresh;
}

struct Figures {
  double cycle_ms;
  double bare_ms;
};

Figures Measure(const fs::path& install, int files, int runs) {
  const auto folders = Layout(install, files);
  const std::u16string wide = install.u16string();
  asum::EnsureDatabase(wide);
  size_t handed_over = 0;
  const asum::AlertFileProcessor count = [&](asum::StringList& listed, const std::u16string&,
                                             const std::u16string&) { handed_over += listed.size(); };
  std::vector<double> cycle, bare;
  size_t fresh = 0;
  // The first pass of each only fills the caches; the thread's cycles run
  // against a warm directory too.
  asum::RunLockedCycle(wide, count);
  fresh += BareListing(folders);
  for (int run = 0; run < runs; ++run) {
    auto start = Clock::now();
    if (asum::RunLockedCycle(wide, count) != asum::CycleResult::kDone) std::printf("the cycle did not run\n");
    cycle.push_back(MsSince(start));
    start = Clock::now();
    fresh += BareListing(folders);
    bare.push_back(MsSince(start));
  }
  if (handed_over != 0 || fresh != 0) std::printf("%zu files were taken for new ones\n", handed_over + fresh);
  return {Median(cycle), Median(bare)};
}

}  // namespace

int main(int argc, char** argv) {
  std::setvbuf(stdout, nullptr, _IOLBF, 0);
  const int max_files = argc > 1 ? std::max(10, std::atoi(argv[1])) : 100000;
  const int runs = argc > 2 ? std::max(1, std::atoi(argv[2])) : 5;
  const fs::path root =
      fs::temp_directory_path() / ("collect-idle-bench-" + std::to_string(Clock::now().time_since_epoch().count()));
  asum::platform::SetLogFolder((root / "no-log-folder").u16string());

  const int small = max_files / 10;
  std::printf("%10s  %12s %12s %7s\n", "PROC_ files", "cycle ms", "listing ms", "ratio");
  Figures f[2];
  const int sizes[2] = {small, max_files};
  for (int i = 0; i < 2; ++i) {
    const fs::path install = root / std::to_string(sizes[i]);
    f[i] = Measure(install, sizes[i], runs);
    std::printf("%10d  %12.2f %12.2f %7.2f\n", sizes[i], f[i].cycle_ms, f[i].bare_ms, f[i].cycle_ms / f[i].bare_ms);
    std::error_code ignored;
    fs::remove_all(install, ignored);
  }
  const double growth = f[1].cycle_ms / f[0].cycle_ms;
  std::printf("growth %d to %d files: cycle %.2fx, bare listing %.2fx (linear: 10x)\n", small, max_files, growth,
              f[1].bare_ms / f[0].bare_ms);
  std::printf("SUMMARY collect_idle | idle cycle over %d PROC_ files, ms (median of %d) | %.2f\n", max_files, runs,
              f[1].cycle_ms);
  std::printf("SUMMARY collect_idle | idle cycle / bare listing at %d files | %.2f\n", max_files,
              f[1].cycle_ms / f[1].bare_ms);
  std::printf("SUMMARY collect_idle | idle cycle growth %d to %d files (linear 10) | %.2f\n", small, max_files,
              growth);
  std::error_code ignored;
  fs::remove_all(root, ignored);
  return 0;
}
