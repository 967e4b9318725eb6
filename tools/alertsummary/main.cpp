// alertsummary: the command-line tool for the people who run and support the
// alerting service. It links the library's core directly and works on an
// install folder given with --install-dir (default: the current folder).
#include <cstdio>
#include <filesystem>
#include <utility>
#include <vector>

#include "commands.h"
#include "common/utf.h"
#include "platform/platform.h"

namespace asum::tool {
namespace {

std::u16string g_service_log_folder;

}  // namespace

std::string Utf8(const std::u16string& text) { return Utf16ToUtf8(DisplayText(text)); }
std::u16string Utf16(const std::string& text) { return Utf8ToUtf16(text); }

std::u16string PathText(const std::filesystem::path& path) {
#ifdef _WIN32
  return path.u16string();
#else
  return BytesToNativeName(path.native());
#endif
}

std::u16string RangeText(const std::string& from, const std::string& to) {
  return Utf16("<FROM>" + from + "</FROM><TO>" + to + "</TO>");
}

void AddCommonOptions(CLI::App& sub, CommonOptions& options, bool with_install_dir) {
  if (with_install_dir) {
    sub.add_option("--install-dir", options.install_dir, "The service's install folder (default: the current folder)");
  }
  sub.add_option("--log-dir", options.log_dir, "Write the diagnostic log into this folder");
  sub.add_option("--settings-root", options.settings_root,
                 "Linux: the folder standing for HKEY_LOCAL_MACHINE in the settings tree");
}

std::u16string ServiceLogFolder() { return g_service_log_folder; }

platform::FileLock TakeCollectorLock(const std::u16string& install, const std::u16string& lock_path) {
  platform::FileResult failure;
  platform::FileLock lock = platform::Current().TryLockFile(lock_path, &failure);
  if (lock != nullptr) return lock;
  if (failure.status == platform::FileStatus::kSharingViolation) {
    throw ToolError(kExitBusy, "another collector (the service or another tool) is working on " + Utf8(install) +
                                   "; nothing was done");
  }
  throw ToolError(kExitFailure, "the collector lock " + Utf8(lock_path) + " cannot be had: " +
                                    Utf16ToUtf8(failure.Describe()) + "; nothing was done");
}

std::u16string ApplyCommonOptions(const CommonOptions& options, ServiceLog log) {
  namespace fs = std::filesystem;
  if (!options.log_dir.empty()) {
    platform::SetLogFolder(PathText(fs::absolute(fs::path(options.log_dir))));
  } else if (log == ServiceLog::kLeaveAlone) {
    platform::SetLogFolder(u"");
  }
  if (!options.settings_root.empty()) {
    platform::SetSettingsRoot(PathText(fs::absolute(fs::path(options.settings_root))));
  }
  std::u16string install = PathText(fs::absolute(fs::path(options.install_dir)).lexically_normal());
  while (install.size() > 1 && install.back() == platform::kPathSeparator) install.pop_back();
  std::error_code error;
  if (!fs::is_directory(fs::absolute(fs::path(options.install_dir)), error)) {
    throw ToolError(kExitUsage, "install folder " + Utf8(install) + " does not exist");
  }
  return install;
}

}  // namespace asum::tool

int main(int argc, char** argv) {
  using namespace asum::tool;
  g_service_log_folder = asum::platform::LogFolder();
  CLI::App app{"Summarises the alert e-mails an alerting service saved: collects them into the alert database, "
               "inspects single files, counts, reports, checks and purges stored alerts."};
  app.require_subcommand(1);
  // Paths such as /srv/x must never read as Windows-style options.
  app.allow_windows_style_options(false);
  app.set_help_all_flag("--help-all", "Help for every subcommand");
  using Adder = Runner (*)(CLI::App&);
  std::vector<std::pair<CLI::App*, Runner>> subcommands;
  for (Adder add : {AddCollect, AddInspect, AddCount, AddReport, AddPurge, AddStatus, AddAudit, AddOptimize}) {
    Runner runner = add(app);
    const auto all = app.get_subcommands(std::function<bool(CLI::App*)>());
    subcommands.emplace_back(all.back(), std::move(runner));
  }
  try {
    app.parse(argc, argv);
  } catch (const CLI::ParseError& e) {
    if (e.get_exit_code() == 0) return app.exit(e);
    // One line naming the problem, for people and for scripts alike.
    std::fprintf(stderr, "alertsummary: %s\n", e.what());
    return kExitUsage;
  }
  CLI::App* chosen = app.get_subcommands().front();
  try {
    for (auto& [sub, runner] : subcommands) {
      if (sub == chosen) return runner();
    }
  } catch (const ToolError& e) {
    std::fprintf(stderr, "alertsummary: %s\n", e.what());
    return e.code();
  } catch (const std::exception& e) {
    std::fprintf(stderr, "alertsummary: %s\n", e.what());
    return kExitFailure;
  }
  return kExitUsage;
}
