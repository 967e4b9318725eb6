#include <cstdint>
#include <cstdio>
#include <memory>

#include "collect/cycle.h"
#include "collect/process_alerts.h"
#include "commands.h"
#include "platform/platform.h"
#include "progress.h"

namespace asum::tool {
namespace {

struct CollectOptions {
  CommonOptions common;
  bool once = false;
  double interval = 10;
};

uint64_t Backlog(const std::u16string& install) {
  uint64_t total = 0;
  RunCollectionCycle(install, [&](StringList& files, const std::u16string&, const std::u16string&) {
    total += files.size();
  });
  return total;
}

int RunOnce(const std::u16string& install, bool first_creates) {
  if (first_creates) EnsureDatabase(install);
  Progress progress(Backlog(install));
  ProcessTally tally;
  CycleContext cycle;
  const CycleResult result = RunLockedCycle(install, [&](StringList& files, const std::u16string& status,
                                                           const std::u16string& component) {
    ProcessAlertFiles(install, files, status, component, &cycle, &tally);
    progress.Advance(tally.stored + tally.marked + tally.left);
  });
  if (result == CycleResult::kBusy) {
    std::fprintf(stderr, "alertsummary: another collector (the service or another tool) is working on %s; "
                         "nothing was done\n", Utf8(install).c_str());
    return kExitBusy;
  }
  if (result == CycleResult::kNoLock) {
    std::fprintf(stderr, "alertsummary: the collector lock %s cannot be created or opened; nothing was done\n",
                 Utf8(CollectorLockPathOf(install)).c_str());
    return kExitFailure;
  }
  if (result == CycleResult::kNotADatabase) {
    std::fprintf(stderr, "alertsummary: %s is not an alert database; no file was touched\n",
                 Utf8(DatabasePathOf(install)).c_str());
    return kExitFailure;
  }
  std::printf("stored %llu, marked %llu, left %llu\n", static_cast<unsigned long long>(tally.stored),
              static_cast<unsigned long long>(tally.marked), static_cast<unsigned long long>(tally.left));
  std::fflush(stdout);
  return kExitOk;
}

}  // namespace

Runner AddCollect(CLI::App& app) {
  auto* sub = app.add_subcommand("collect", "Run collection cycles over an install folder, as the library's thread does");
  auto options = std::make_shared<CollectOptions>();
  AddCommonOptions(*sub, options->common);
  auto* once = sub->add_flag("--once", options->once,
                             "Run one cycle now (creating the database first when missing) and print the counts");
  auto* interval = sub->add_option("--interval", options->interval, "Seconds between cycles (default 10)")
                       ->check(CLI::PositiveNumber);
  once->excludes(interval);
  return [options]() {
    const std::u16string install = ApplyCommonOptions(options->common, ServiceLog::kWrite);
    if (options->once) return RunOnce(install, true);
    const auto pause = static_cast<uint32_t>(options->interval * 1000);
    platform::StopSignal never;  // the tool runs until it is killed, as the service's thread does
    for (;;) {
      never.WaitFor(pause);
      const int code = RunOnce(install, false);
      if (code == kExitFailure) return code;
    }
  };
}

}  // namespace asum::tool
