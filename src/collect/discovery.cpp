#include "collect/discovery.h"

#include "common/utf.h"
#include "log/log.h"
#include "platform/platform.h"

namespace asum {
namespace {

using platform::NativeSeparators;

bool HasMarkerFile(platform::Env& env, const std::u16string& path, const std::u16string& name) {
  const std::u16string markers[] = {
      path + NativeSeparators(u"\\info.dat"),
      path + NativeSeparators(u"\\info_SP.dat"),
      path + NativeSeparators(u"\\info_SS.dat"),
      path + platform::kPathSeparator + name + u".dat",
      path + NativeSeparators(u"\\info_FSA.dat"),
  };
  for (const std::u16string& marker : markers) {
    if (env.PathExists(marker)) return true;
  }
  return false;
}

// The framework's directory search refuses a pattern that does not fit its
// fixed buffer.
bool PatternFits(const std::u16string& folder, const std::u16string& wildcard) {
  return folder.size() + 1 + wildcard.size() < kMaxSearchPattern;
}

std::vector<platform::DirEntry> Search(const std::u16string& folder, const std::u16string& wildcard) {
  std::vector<platform::DirEntry> entries;
  if (PatternFits(folder, wildcard)) platform::Current().ListFolder(folder, wildcard, &entries);
  return entries;
}

void WalkReportFolder(const std::u16string& report_folder, const char16_t* status,
                      const std::u16string& component, StringList& files,
                      const AlertFileProcessor& process) {
  files.clear();
  GetDomainFolders(report_folder, files);
  WriteLog(u"After calling GetDomainFolders Function: " + report_folder + u" path contains " +
           DecimalText(static_cast<int64_t>(files.size())) + u" file(s).");
  if (!files.empty()) process(files, status, component);
}

}  // namespace

void GetComponentFolders(const std::u16string& folder, StringList& components) {
  if (folder.empty()) return;
  platform::Env& env = platform::Current();
  for (const platform::DirEntry& entry : Search(folder, u"*.*")) {
    if (entry.is_folder && HasMarkerFile(env, entry.full_path, entry.name)) {
      components.push_back(entry.name);
    }
  }
}

void GetDomainFolders(const std::u16string& report_folder, StringList& files) {
  WriteLog(u"Inside GetDomainFolders function");
  if (report_folder.empty()) return;
  // "PROC_" anywhere in the full path skips the file. The separator between
  // folder and name is no part of "PROC_", so a folder that holds it hides
  // every file, and otherwise the listing tests each name as it reads it.
  const std::u16string wildcard = u"*.eml*";
  if (report_folder.find(u"PROC_") != std::u16string::npos || !PatternFits(report_folder, wildcard)) return;
  platform::Current().ListFiles(report_folder, wildcard, "PROC_", &files);
}

std::u16string InstallFolderOf(const std::u16string& executable_path) {
  const size_t cut = executable_path.rfind(platform::kPathSeparator);
  return cut == std::u16string::npos ? std::u16string() : executable_path.substr(0, cut);
}

void RunCollectionCycle(const std::u16string& install_folder, const AlertFileProcessor& process,
                        const platform::StopSignal* stop) {
  const auto stopped = [stop] { return stop != nullptr && stop->Requested(); };
  platform::Env& env = platform::Current();
  StringList components;
  GetComponentFolders(install_folder, components);
  for (const char16_t* name : kFixedComponentFolders) {
    if (!env.PathExists(install_folder + platform::kPathSeparator + name)) continue;
    components.push_back(name);
    if (std::u16string(name) == u"Anomaly Alerts") {
      WriteLog(u"Anomaly Alerts");
      WriteLog(install_folder);
    }
  }
  WriteLog(u"After calling GetDomainFolders Function: " + install_folder + u" path contains " +
           DecimalText(static_cast<int64_t>(components.size())) + u" Component(s).");

  StringList files;
  for (const std::u16string& name : components) {
    const std::u16string component = install_folder + platform::kPathSeparator + name;
    if (!env.PathExists(component + NativeSeparators(u"\\AlertReports"))) continue;
    const std::u16string sent = component + NativeSeparators(u"\\AlertReports\\Sent items");
    if (stopped()) return;
    if (env.PathExists(sent)) WalkReportFolder(sent, u"Delivered", name, files, process);
    const std::u16string outbox = component + NativeSeparators(u"\\AlertReports\\Outbox");
    if (stopped()) return;
    if (env.PathExists(outbox)) WalkReportFolder(outbox, u"Failed", name, files, process);
  }
}

}  // namespace asum
