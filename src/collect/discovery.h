// Alert folder discovery: which subfolders of the install folder are component
// folders, which files of their report folders are unprocessed alerts, and the
// collection cycle that hands each report folder's files to a processor.
//
// Runs on the processing thread (or a tool's thread). Reads names only, never
// file contents; a missing folder anywhere is skipped without a log line.
// Nothing is thrown.
#pragma once

#include <array>
#include <functional>
#include <string>
#include <vector>

namespace asum::platform {
class StopSignal;
}

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

// The folder of an executable path: the text before its last separator (empty
// when there is none).
std::u16string InstallFolderOf(const std::u16string& executable_path);

// Receives one non-empty list of alert files, its status text ("Delivered" or
// "Failed") and the component folder's name.
using AlertFileProcessor =
    std::function<void(StringList& files, const std::u16string& status, const std::u16string& component)>;

// One collection cycle over `install_folder`. A stop request (when given) is
// looked at before each report folder: no folder is listed after it.
void RunCollectionCycle(const std::u16string& install_folder, const AlertFileProcessor& process,
                        const platform::StopSignal* stop = nullptr);

}  // namespace asum
