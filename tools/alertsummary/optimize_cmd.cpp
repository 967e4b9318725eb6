// optimize: the one index on "When", added or removed on request.
#include <cstdio>
#include <memory>

#include "commands.h"
#include "install_view.h"
#include "platform/platform.h"
#include "store/busy_budget.h"
#include "store/when_index.h"

namespace asum::tool {
namespace {

struct OptimizeOptions {
  CommonOptions common;
  bool undo = false;
};

}  // namespace

Runner AddOptimize(CLI::App& app) {
  auto* sub = app.add_subcommand(
      "optimize",
      "Add an index on \"When\" so that counts and purges over years of alerts read only their date range. A "
      "deliberate opt-in: the table the library creates has no index, and other programs may expect it so; nothing "
      "else in the database changes. Runs under the collector lock.");
  auto options = std::make_shared<OptimizeOptions>();
  AddCommonOptions(*sub, options->common);
  sub->add_flag("--undo", options->undo, "Remove the index again");
  return [options]() {
    const std::u16string install = ApplyCommonOptions(options->common, ServiceLog::kLeaveAlone);
    const InstallPaths paths = PathsOf(install);
    {
      CDbSQLite probe;
      OpenForReading(probe, paths.database);
      if (!HasAlertTable(probe)) throw ToolError(kExitFailure, Utf8(paths.database) + " holds no alert table");
    }
    platform::Env& env = platform::Current();
    platform::FileLock lock = TakeCollectorLock(install, paths.lock);
    BusyBudget budget(kQueryBusyTimeoutMs);
    CDbSQLite db;
    db.SetBusyBudget(&budget);
    bool had = false, done = false;
    if (db.Open(paths.database)) {
      had = HasWhenIndex(db);
      done = options->undo ? DropWhenIndex(db) : CreateWhenIndex(db);
    }
    db.Close();
    env.UnlockFile(lock);
    if (!done) throw ToolError(kExitFailure, "could not change " + Utf8(paths.database) + " (locked or read-only)");
    const std::string index = Utf8(kWhenIndexName);
    const char* name = index.c_str();
    if (options->undo) {
      std::printf(had ? "removed the index %s\n" : "there was no index %s; nothing changed\n", name);
    } else {
      std::printf(had ? "the index %s on \"When\" was already there; nothing changed\n"
                      : "added the index %s on \"When\"\n",
                  name);
    }
    return kExitOk;
  };
}

}  // namespace asum::tool
