#include "support/test_support.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <cstdlib>
#include <ctime>
#include <filesystem>
#include <fstream>

#include "common/utf.h"

namespace fs = std::filesystem;

namespace asum::test {

// Test programs never write into the service's own log folder: the end-to-end
// tests switch it on and read it. Dates in the tests are written for UTC; a
// program run by hand, outside ctest, must not read them in the machine's zone.
const bool kSetUp = [] {
  platform::SetLogFolder(u"");
#ifdef _WIN32
  _putenv_s("TZ", "UTC");
  _tzset();
#else
  setenv("TZ", "UTC", 1);
  tzset();
#endif
  return true;
}();

std::string Narrow(std::u16string_view text) { return Utf16ToUtf8(text); }
std::u16string U16(const std::string& utf8) { return Utf8ToUtf16(utf8); }

TempDir::TempDir() {
  static std::atomic<int> counter{0};
  const auto stamp = std::chrono::steady_clock::now().time_since_epoch().count();
  fs::path p = fs::temp_directory_path() /
               ("asum-" + std::to_string(stamp) + "-" + std::to_string(counter.fetch_add(1)));
  fs::create_directories(p);
  path_ = fs::canonical(p).u16string();
}

TempDir::~TempDir() { RemoveTree(path_); }

std::u16string TempDir::Join(const std::u16string& relative) const {
  return path_ + platform::kPathSeparator + platform::NativeSeparators(relative);
}

void MakeFolders(const std::u16string& path) {
  std::error_code ec;
  fs::create_directories(fs::path(path), ec);
}

void WriteText(const std::u16string& path, const std::string& bytes) {
  MakeFolders(fs::path(path).parent_path().u16string());
  std::ofstream out(fs::path(path), std::ios::binary | std::ios::trunc);
  out.write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
  ASSERT_TRUE(out.good()) << "cannot write " << Narrow(path);
}

std::string ReadText(const std::u16string& path) {
  std::ifstream in(fs::path(path), std::ios::binary);
  return std::string(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
}

void RemoveTree(const std::u16string& path) {
  std::error_code ec;
  // Read-only folders left by a test would stop the removal.
  for (auto it = fs::recursive_directory_iterator(fs::path(path), ec); !ec && it != fs::recursive_directory_iterator();
       it.increment(ec)) {
    fs::permissions(it->path(), fs::perms::owner_all, fs::perm_options::add, ec);
  }
  fs::remove_all(fs::path(path), ec);
}

std::vector<std::u16string> ListNames(const std::u16string& folder) {
  std::vector<std::u16string> names;
  std::error_code ec;
  for (const auto& e : fs::directory_iterator(fs::path(folder), ec)) names.push_back(e.path().filename().u16string());
  std::sort(names.begin(), names.end());
  return names;
}

CapturedLog::CapturedLog() : previous_(platform::LogFolder()) { platform::SetLogFolder(dir_.path()); }
CapturedLog::~CapturedLog() { platform::SetLogFolder(previous_); }

std::vector<std::u16string> CapturedLog::Messages() const {
  const std::string text = ReadText(dir_.Join(u"ErrorLog.txt"));
  std::vector<std::u16string> messages;
  size_t pos = 0;
  while (pos < text.size()) {
    size_t end = text.find("\r\n", pos);
    if (end == std::string::npos) end = text.size();
    const size_t tab = text.find('\t', pos);
    std::u16string& message = messages.emplace_back();
    // Past the timestamp's tab; the bytes are Latin-1.
    for (size_t i = tab < end ? tab + 1 : pos; i < end; ++i) message += static_cast<unsigned char>(text[i]);
    pos = end + 2;
  }
  return messages;
}

}  // namespace asum::test
