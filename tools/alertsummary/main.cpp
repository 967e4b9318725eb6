// alertsummary: the command-line tool for the people who run and support the
// alerting service. It links the library's core directly and works on an
// install folder given with --install-dir (default: the current folder).
#include <cstdio>
#include <filesystem>

#include "commands.h"
#include "common/utf.h"
#include "platform/platform.h"

namespace asum::tool {

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

std::u16string ApplyCommonOptions(const CommonOptions& options) {
  namespace fs = std::filesystem;
  if (!options.log_dir.empty()) platform::SetLogFolder(PathText(fs::absolute(fs::path(options.log_dir))));
  if (!options.settings_root.empty()) {
    platform::SetSettingsRoot(PathText(fs::absolute(fs::path(options.settings_root))));
  }
  std::u16string install = PathText(fs::absolute(fs::path(options.install_dir)).lexically_normal());
  while (install.size() > 1 && install.back() == platform::kPathSeparator) install.pop_back();
  return install;
}

}  // namespace asum::tool

int main(int argc, char** argv) {
  using namespace asum::tool;
  CLI::App app{"Summarises the alert e-mails an alerting service saved: collects them into the alert database, "
               "inspects single files, counts, reports and purges stored alerts."};
  app.require_subcommand(1);
  // Paths such as /srv/x must never read as Windows-style options.
  app.allow_windows_style_options(false);
  app.set_help_all_flag("--help-all", "Help for every subcommand");
  Runner runners[] = {AddCollect(app), AddInspect(app), AddCount(app), AddReport(app), AddPurge(app)};
  try {
    app.parse(argc, argv);
  } catch (const CLI::ParseError& e) {
    const int code = app.exit(e);
    return code == 0 ? kExitOk : kExitUsage;
  }
  const auto chosen = app.get_subcommands().front()->get_name();
  const char* names[] = {"collect", "inspect", "count", "report", "purge"};
  try {
    for (int i = 0; i < 5; ++i) {
      if (chosen == names[i]) return runners[i]();
    }
  } catch (const std::exception& e) {
    std::fprintf(stderr, "alertsummary: %s\n", e.what());
    return kExitFailure;
  }
  return kExitUsage;
}
