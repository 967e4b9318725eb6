// Writes the input to a file and analyses it as the processing does, once as
// a predefined alert and once as a component's alert, so the whole path from
// file bytes through the reader and every extractor to the row is covered.
// Checks what the processing relies on: an unreadable file is left, a stored
// row has a type, and the row carries the status and path it was given.
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <random>
#include <string>

#include "collect/alert_analysis.h"
#include "common/utf.h"
#include "fuzz_support.h"
#include "platform/platform.h"

namespace {

using asum::fuzz::Check;

// One file per fuzzing process, so parallel jobs never share it.
const std::filesystem::path& InputFile() {
  static const std::filesystem::path* file = [] {
    std::random_device random;
    auto* path = new std::filesystem::path(std::filesystem::temp_directory_path() /
                                           ("collect_fuzz_" + std::to_string(random()) + ".eml"));
    std::atexit([] { std::filesystem::remove(InputFile()); });
    return path;
  }();
  return *file;
}

void Analyze(const std::u16string& path, const std::u16string& status, const std::u16string& component) {
  const asum::AlertAnalysis a = asum::AnalyzeAlertFile(path, status, component);
  if (!a.loaded) {
    Check(a.outcome == asum::AlertOutcome::kLeave);
    return;
  }
  Check(a.outcome != asum::AlertOutcome::kLeave);
  Check(a.row.email_status == status && a.row.alert_path == path);
  if (a.outcome == asum::AlertOutcome::kStore) Check(!a.row.alert_type.empty());
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  asum::fuzz::KeepLogOff();
  {
    std::ofstream out(InputFile(), std::ios::binary | std::ios::trunc);
    out.write(reinterpret_cast<const char*>(data), static_cast<std::streamsize>(size));
    if (!out) std::abort();
  }
  const std::u16string path = asum::Utf8ToUtf16(InputFile().string());
  Analyze(path, u"Delivered", u"Predefine Alerts");
  Analyze(path, u"Failed", u"File Server");
  return 0;
}
