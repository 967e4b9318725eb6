// A bar on stderr while a long piece of work goes through many files; only on
// a terminal, so piped output stays clean.
#pragma once

#include <cstdint>
#include <cstdio>

#include "platform/platform.h"

namespace asum::tool {

class Progress {
 public:
  explicit Progress(uint64_t total) : total_(total), enabled_(total > 0 && platform::StderrIsTerminal()) {}
  Progress(const Progress&) = delete;
  Progress& operator=(const Progress&) = delete;
  ~Progress() {
    if (enabled_) std::fprintf(stderr, "\n");
  }

  void Advance(uint64_t done) {
    if (!enabled_) return;
    const int width = 40;
    const int filled = static_cast<int>(width * done / total_);
    std::fprintf(stderr, "\r[%.*s%*s] %llu/%llu files", filled, "########################################",
                 width - filled, "", static_cast<unsigned long long>(done), static_cast<unsigned long long>(total_));
    std::fflush(stderr);
  }

 private:
  uint64_t total_;
  bool enabled_;
};

}  // namespace asum::tool
