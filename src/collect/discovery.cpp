#include "collect/discovery.h"

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

}  // namespace asum
