// Alert folder discovery: which subfolders of the install folder are component
// folders and which files of their report folders are unprocessed alerts. The
// cycle that walks them is in cycle.h.
//
// Runs on the processing thread (or a tool's thread). Reads names only, never
// file contents; a missing folder anywhere is skipped without a log line.
// Nothing is thrown.
#pragma once

#include <array>
#include <string>
#include <vector>

namespace asum {

using StringList = std::vector<std::u16string>;

// The platform's directory search refuses patterns of this many characters or
// more; the folder is then read as empty.
inline constexpr size_t kMaxSearchPattern = 260;

// The component folders a cycle visits by name when they exist, in this order,
// after those found through marker files.
inline constexpr std::array<const char16_t*, 4> kFixedComponentFolders = {
    u"Activity Outside of Business Hours_Alert",
    u"All Environment Changes",
    u"Predefine Alerts",
    u"Anomaly Alerts",
};

// Appends the name of every direct subfolder of `folder` that holds a marker
// file ("info.dat", "info_SP.dat", "info_SS.dat", "<name>.dat", "info_FSA.dat").
void GetComponentFolders(const std::u16string& folder, StringList& components);

// Appends the full path of every file of `report_folder` that matches "*.eml*"
// and whose path does not contain "PROC_".
void GetDomainFolders(const std::u16string& report_folder, StringList& files);

}  // namespace asum
