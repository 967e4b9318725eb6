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
namespace {

// Test programs never write into the service's own log folder: the
// end-to-end tests switch it on and read it, and a cycle run by a test program
// beside them would add its lines. A test that reads the log captures it.
const bool kServiceLogOff = [] {
  platform::SetLogFolder(u"");
  return true;
}();

// Dates in the tests are written for UTC; a program run by hand, outside
// ctest, must not read them in the machine's own zone.
const bool kZoneIsUtc = [] {
#ifdef _WIN32
  _putenv_s("TZ", "UTC");
  _tzset();
#else
  setenv("TZ", "UTC", 1);
  tzset();
#endif
  return true;
}();

fs::path ToPath(const std::u16string& p) { return fs::path(p); }
std::u16string FromPath(const fs::path& p) { return p.u16string(); }

}  // namespace

std::string Narrow(std::u16string_view text) { return Utf16ToUtf8(text); }
std::u16string U16(const std::string& utf8) { return Utf8ToUtf16(utf8); }

TempDir::TempDir() {
  static std::atomic<int> counter{0};
  const auto stamp = std::chrono::steady_clock::now().time_since_epoch().count();
  fs::path p = fs::temp_directory_path() /
               ("asum-" + std::to_string(stamp) + "-" + std::to_string(counter.fetch_add(1)));
  fs::create_directories(p);
  path_ = FromPath(fs::canonical(p));
}

TempDir::~TempDir() { RemoveTree(path_); }

std::u16string TempDir::Join(const std::u16string& relative) const {
  return path_ + platform::kPathSeparator + platform::NativeSeparators(relative);
}

void MakeFolders(const std::u16string& path) {
  std::error_code ec;
  fs::create_directories(ToPath(path), ec);
}

void WriteText(const std::u16string& path, const std::string& bytes) {
  MakeFolders(FromPath(ToPath(path).parent_path()));
  std::ofstream out(ToPath(path), std::ios::binary | std::ios::trunc);
  out.write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
  ASSERT_TRUE(out.good()) << "cannot write " << Narrow(path);
}

std::string ReadText(const std::u16string& path) {
  std::ifstream in(ToPath(path), std::ios::binary);
  return std::string(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
}

void RemoveTree(const std::u16string& path) {
  std::error_code ec;
  // Read-only folders left by a test would stop the removal.
  for (auto it = fs::recursive_directory_iterator(ToPath(path), ec); !ec && it != fs::recursive_directory_iterator();
       it.increment(ec)) {
    fs::permissions(it->path(), fs::perms::owner_all, fs::perm_options::add, ec);
  }
  fs::remove_all(ToPath(path), ec);
}

std::vector<std::u16string> ListNames(const std::u16string& folder) {
  std::vector<std::u16string> names;
  std::error_code ec;
  for (const auto& entry : fs::directory_iterator(ToPath(folder), ec)) names.push_back(entry.path().filename().u16string());
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
    const std::string line = text.substr(pos, end - pos);
    const size_t tab = line.find('\t');
    const std::string message = tab == std::string::npos ? line : line.substr(tab + 1);
    std::u16string wide(message.begin(), message.end());
    for (char16_t& c : wide) c = static_cast<char16_t>(static_cast<unsigned char>(c));  // bytes are Latin-1
    messages.push_back(wide);
    pos = end + 2;
  }
  return messages;
}

}  // namespace asum::test
