// The subcommands of the alertsummary tool. Each registers its options on the
// CLI11 app and returns the process exit code when run.
#pragma once

#include <CLI/CLI.hpp>
#include <filesystem>
#include <functional>
#include <string>

namespace asum::tool {

// Exit codes, for scripts.
inline constexpr int kExitOk = 0;
inline constexpr int kExitFailure = 1;
inline constexpr int kExitUsage = 2;
inline constexpr int kExitBusy = 4;  // another collector holds the install folder

using Runner = std::function<int()>;

Runner AddCollect(CLI::App& app);
Runner AddInspect(CLI::App& app);
Runner AddCount(CLI::App& app);
Runner AddReport(CLI::App& app);
Runner AddPurge(CLI::App& app);

// Options every subcommand has.
struct CommonOptions {
  std::string install_dir = ".";
  std::string log_dir;        // empty: the library's fixed log folder
  std::string settings_root;  // Linux only: where the settings tree lies
};
void AddCommonOptions(CLI::App& sub, CommonOptions& options, bool with_install_dir = true);
// Applies the log and settings options; returns the absolute install folder.
std::u16string ApplyCommonOptions(const CommonOptions& options);

// Texts as the user sees them: a path's undecodable bytes as U+FFFD, the
// form the library stores and logs.
std::string Utf8(const std::u16string& text);
std::u16string Utf16(const std::string& text);
// A path as the library's platform layer spells it, so a Linux name that is
// not UTF-8 still names its file.
std::u16string PathText(const std::filesystem::path& path);

// A "YYYY/MM/DD hh:mm:ss" pair in the range text the host passes.
std::u16string RangeText(const std::string& from, const std::string& to);

}  // namespace asum::tool
