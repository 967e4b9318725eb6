// The parts of the platform layer that are the same on every backend.
#include <atomic>
#include <chrono>
#include <condition_variable>
#include <mutex>

#include "common/utf.h"
#include "platform/platform.h"

namespace asum::platform {
namespace {

std::atomic<Env*> g_current{nullptr};

// Leaked on purpose: a detached thread may read them while the process exits.
std::u16string* g_log_folder = nullptr;
std::u16string* g_settings_root = nullptr;
// Made on first use, so a caller's static initializer may already use it.
std::mutex& LocationsMutex() {
  static std::mutex* mutex = new std::mutex;
  return *mutex;
}

std::u16string& LogFolderSlot() {
  if (g_log_folder == nullptr) {
#ifdef _WIN32
    g_log_folder = new std::u16string(u"C:\\AlertSummaryDbg");
#else
    g_log_folder = new std::u16string(u"/var/log/AlertSummaryDbg");
#endif
  }
  return *g_log_folder;
}

std::u16string& SettingsRootSlot() {
  if (g_settings_root == nullptr) {
    g_settings_root = new std::u16string(u"/etc/AlertSummary/registry/HKEY_LOCAL_MACHINE");
  }
  return *g_settings_root;
}

const char* StatusWords(FileStatus status) {
  switch (status) {
    case FileStatus::kOk: return "success";
    case FileStatus::kNotFound: return "not found";
    case FileStatus::kAlreadyExists: return "already exists";
    case FileStatus::kAccessDenied: return "access denied";
    case FileStatus::kSharingViolation: return "in use by another process";
    case FileStatus::kDiskFull: return "disk full";
    case FileStatus::kTooLarge: return "too large";
    case FileStatus::kIsFolder: return "is a folder";
    case FileStatus::kOther: break;
  }
  return "failed";
}

}  // namespace

std::u16string NativeSeparators(std::u16string path) {
  if constexpr (kPathSeparator != u'\\') {
    for (char16_t& c : path) {
      if (c == u'\\') c = kPathSeparator;
    }
  }
  return path;
}

std::u16string FileResult::Describe() const {
  std::string text = StatusWords(status);
  if (os_error != 0) text += " (" + std::to_string(os_error) + ")";
  return AsciiToUtf16(text);
}

Env& Current() {
  Env* env = g_current.load(std::memory_order_acquire);
  return env != nullptr ? *env : Env::Default();
}

ScopedEnv::ScopedEnv(Env* env) : previous_(g_current.exchange(env)) {}
ScopedEnv::~ScopedEnv() { g_current.store(previous_); }

std::u16string LogFolder() {
  std::lock_guard<std::mutex> lock(LocationsMutex());
  return LogFolderSlot();
}

void SetLogFolder(std::u16string folder) {
  std::lock_guard<std::mutex> lock(LocationsMutex());
  LogFolderSlot() = std::move(folder);
}

std::u16string SettingsRoot() {
  std::lock_guard<std::mutex> lock(LocationsMutex());
  return SettingsRootSlot();
}

void SetSettingsRoot(std::u16string folder) {
  std::lock_guard<std::mutex> lock(LocationsMutex());
  SettingsRootSlot() = std::move(folder);
}

struct StopSignal::Impl {
  std::mutex mutex;
  std::condition_variable cv;
  bool requested = false;
};

StopSignal::StopSignal() : impl_(new Impl) {}
StopSignal::~StopSignal() { delete impl_; }

void StopSignal::Request() {
  {
    std::lock_guard<std::mutex> lock(impl_->mutex);
    impl_->requested = true;
  }
  impl_->cv.notify_all();
}

bool StopSignal::Requested() const {
  std::lock_guard<std::mutex> lock(impl_->mutex);
  return impl_->requested;
}

bool StopSignal::WaitFor(uint32_t ms) {
  std::unique_lock<std::mutex> lock(impl_->mutex);
  return impl_->cv.wait_for(lock, std::chrono::milliseconds(ms), [this] { return impl_->requested; });
}

}  // namespace asum::platform
