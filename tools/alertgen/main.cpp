// alertgen: writes realistic alert messages into an install folder laid out
// as the alerting service lays it out.
//
//   alertgen DIR COUNT [--seed N] [--size BYTES] [--components N]
//
// Components "Component1".. (found by an info.dat marker) and "Predefine
// Alerts"; two of every three files go to "Sent items", the rest to "Outbox".
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <string>

#include "alert_generator.h"

namespace fs = std::filesystem;

int main(int argc, char** argv) {
  if (argc < 3) {
    std::fprintf(stderr, "usage: alertgen DIR COUNT [--seed N] [--size BYTES] [--components N]\n");
    return 2;
  }
  const fs::path dir = argv[1];
  const long count = std::strtol(argv[2], nullptr, 10);
  uint32_t seed = 1;
  size_t size = 12000;
  int components = 3;
  for (int i = 3; i + 1 < argc; i += 2) {
    if (!std::strcmp(argv[i], "--seed")) seed = static_cast<uint32_t>(std::strtoul(argv[i + 1], nullptr, 10));
    if (!std::strcmp(argv[i], "--size")) size = std::strtoul(argv[i + 1], nullptr, 10);
    if (!std::strcmp(argv[i], "--components")) components = std::atoi(argv[i + 1]);
  }
  for (int c = 1; c <= components; ++c) {
    fs::create_directories(dir / ("Component" + std::to_string(c)));
    std::ofstream(dir / ("Component" + std::to_string(c)) / "info.dat");
  }
  for (long i = 0; i < count; ++i) {
    const int slot = static_cast<int>(i % (components + 1));
    const bool predefined = slot == components;
    const fs::path component = predefined ? fs::path("Predefine Alerts") : fs::path("Component" + std::to_string(slot + 1));
    const fs::path report = dir / component / "AlertReports" / ((i / 2 + i / 12) % 3 == 2 ? "Outbox" : "Sent items");
    fs::create_directories(report);
    const auto alert = asum::gen::GenerateAlert(seed, static_cast<uint32_t>(i), asum::gen::RowsForSize(size), predefined);
    std::ofstream out(report / alert.file_name, std::ios::binary);
    out.write(alert.bytes.data(), static_cast<std::streamsize>(alert.bytes.size()));
  }
  std::printf("wrote %ld alert files under %s\n", count, dir.string().c_str());
  return 0;
}
