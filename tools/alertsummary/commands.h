// The subcommands of the alertsummary tool. Each registers its options on the
// CLI11 app and returns the process exit code when run.
#pragma once

#include <CLI/CLI.hpp>
#include <filesystem>
#include <functional>
#include <stdexcept>
#include <string>

#include "platform/platform.h"

namespace asum::tool {

// Exit codes, for scripts.
inline constexpr int kExitOk = 0;
inline constexpr int kExitFailure = 1;
inline constexpr int kExitUsage = 2;
inline constexpr int kExitFound = 3;  // audit: something missing or stored twice (with --fix: left unmended)
inline constexpr int kExitBusy = 4;   // another collector holds the install folder

// Ends a subcommand with one line on stderr and its exit code; main catches it.
class ToolError : public std::runtime_error {
 public:
  ToolError(int code, const std::string& message) : std::runtime_error(message), code_(code) {}
  int code() const { return code_; }

 private:
  int code_;
};

using Runner = std::function<int()>;

Runner AddCollect(CLI::App& app);
Runner AddInspect(CLI::App& app);
Runner AddCount(CLI::App& app);
Runner AddReport(CLI::App& app);
Runner AddPurge(CLI::App& app);
Runner AddStatus(CLI::App& app);
Runner AddAudit(CLI::App& app);
Runner AddOptimize(CLI::App& app);

// Options every subcommand has.
struct CommonOptions {
  std::string install_dir = ".";
  std::string log_dir;        // empty: the library's fixed log folder, or none for readers
  std::string settings_root;  // Linux only: where the settings tree lies
};
void AddCommonOptions(CLI::App& sub, CommonOptions& options, bool with_install_dir = true);

// Whether a subcommand may write to the service's diagnostic log. Readers
// leave it alone unless --log-dir names a folder of the caller's choosing.
enum class ServiceLog { kWrite, kLeaveAlone };

// Applies the log and settings options; returns the absolute install folder.
// A missing install folder is a usage error (ToolError, exit 2).
std::u16string ApplyCommonOptions(const CommonOptions& options, ServiceLog log);
// The log folder the service writes to, whatever the options made of it.
std::u16string ServiceLogFolder();

// Texts as the user sees them: a path's undecodable bytes as U+FFFD, the
// form the library stores and logs.
std::string Utf8(const std::u16string& text);
std::u16string Utf16(const std::string& text);
// A path as the library's platform layer spells it, so a Linux name that is
// not UTF-8 still names its file.
std::u16string PathText(const std::filesystem::path& path);

// Takes the install folder's collector lock without waiting: ToolError with
// exit 4 when another collector holds it, exit 1 when it cannot be had at all
// (a read-only install folder), saying why.
platform::FileLock TakeCollectorLock(const std::u16string& install, const std::u16string& lock_path);

// A "YYYY/MM/DD hh:mm:ss" pair in the range text the host passes.
std::u16string RangeText(const std::string& from, const std::string& to);

}  // namespace asum::tool
