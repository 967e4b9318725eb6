// The one seam between the library and the operating system.
//
// Everything above src/platform/ reaches files, folders, clocks, code pages,
// settings and threads only through `Env`. Two backends define its methods:
// win32/ (the Windows facilities) and posix/ (Linux equivalents). Each method is
// defined in exactly one file of each backend.
//
// Paths are UTF-16 texts. The core builds them with `kPathSeparator`; the
// Windows backend hands them to the wide-character API unchanged, the POSIX
// backend converts them to UTF-8. A POSIX name that is not UTF-8 comes back with
// each undecodable byte as a lone surrogate and goes out as that byte again
// (common/utf.h, BytesToNativeName), so every listed file can be opened and
// renamed; show such paths only through DisplayText. On POSIX a backslash is an
// ordinary character of a name.
//
// Thread safety: every method may be called from any thread at once. `Current()`
// is read without a lock; tests swap it only while no library thread runs.
//
// Failure injection: tests derive from `Env`, override the methods whose
// failure they want to provoke, and install the object with `ScopedEnv`. The
// base methods are the real ones, so an override can also wrap them.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace asum::platform {

#ifdef _WIN32
inline constexpr char16_t kPathSeparator = u'\\';
#else
inline constexpr char16_t kPathSeparator = u'/';
#endif

// Converts the backslashes of a path written the Windows way
// ("\AlertReports\Outbox") into the separator of this platform. Only for literals of the core,
// never for texts that came from outside.
std::u16string NativeSeparators(std::u16string path);

// A calendar time in the layout of the Windows SYSTEMTIME record.
struct SystemTime {
  uint16_t year = 0;
  uint16_t month = 0;
  uint16_t day_of_week = 0;
  uint16_t day = 0;
  uint16_t hour = 0;
  uint16_t minute = 0;
  uint16_t second = 0;
  uint16_t milliseconds = 0;
  bool operator==(const SystemTime&) const = default;
};

struct DirEntry {
  std::u16string name;       // last path element
  std::u16string full_path;  // folder, separator, name
  bool is_folder = false;
};

// The outcome of a file operation, classified where the caller decides on it.
enum class FileStatus {
  kOk,
  kNotFound,
  kAlreadyExists,
  kAccessDenied,
  kSharingViolation,  // another opener holds the file (Windows share modes)
  kDiskFull,
  kTooLarge,          // more bytes than the caller allowed
  kIsFolder,
  kOther,
};

struct FileResult {
  FileStatus status = FileStatus::kOk;
  uint32_t os_error = 0;  // GetLastError() or errno; 0 when not from the OS
  bool ok() const { return status == FileStatus::kOk; }
  // For log lines: the status in words and the OS code, e.g. "access denied (5)".
  std::u16string Describe() const;
};

// A started thread; null means none.
using ThreadHandle = void*;

// A held file lock; null means none.
using FileLock = void*;

// An opened settings key (a registry key on Windows, a folder on POSIX). Null
// means "none".
using SettingsKey = void*;

class Env {
 public:
  Env() = default;
  Env(const Env&) = delete;
  Env& operator=(const Env&) = delete;
  virtual ~Env() = default;

  // The real backend. Never destroyed, so it may be used during process exit.
  static Env& Default();

  // --- Host process -------------------------------------------------------
  // Full path of the host executable (not of this library). On Windows read
  // with GetModuleFileNameW(NULL) into 1000 characters, so a longer path comes
  // back cut; on Linux from /proc/self/exe.
  virtual std::u16string ExecutablePath();

  // --- Files and folders --------------------------------------------------
  // True when the path names a file or a folder.
  virtual bool PathExists(const std::u16string& path);
  // Lists the entries of `folder` whose names match `wildcard` ('*' and '?',
  // ASCII letter case ignored, "*.*" matches every name, as the Windows
  // directory search does), skipping "." and "..". Returns false when the
  // search cannot start (missing folder, no permission); `out` is then empty.
  virtual bool ListFolder(const std::u16string& folder, const std::u16string& wildcard,
                          std::vector<DirEntry>* out);
  // Appends to `out` the full path (folder, separator, name) of every file of
  // `folder`, folders left out, whose name matches `wildcard` as ListFolder
  // matches and does not contain `skip` (ASCII, compared with case; empty
  // skips nothing), in the order the search returns them. Each name is
  // decided on as it is read, and a path is built only for a name that stays:
  // a folder of many skipped files costs little more than reading their names.
  // Returns false, appending nothing, when the search cannot start.
  virtual bool ListFiles(const std::u16string& folder, const std::u16string& wildcard, std::string_view skip,
                         std::vector<std::u16string>* out);
  // One level; fails when the folder exists.
  virtual FileResult CreateFolder(const std::u16string& path);
  // Renames without replacing (MoveFileW): an existing target gives
  // kAlreadyExists. (No method here bears a name that <windows.h> turns into
  // a macro, so files that include it see the same class.)
  virtual FileResult RenameNoReplace(const std::u16string& from, const std::u16string& to);
  virtual FileResult RemoveFile(const std::u16string& path);  // DeleteFileW
  // The size of a file in bytes, without opening it. A folder gives kIsFolder.
  virtual FileResult FileSize(const std::u16string& path, uint64_t* size);
  // Reads a whole file. On Windows the file is opened with FILE_SHARE_READ only,
  // so a file that a writer still holds open fails with kSharingViolation and is
  // read in a later cycle. POSIX has no share modes: a file being written is
  // read as far as it is written. More than `max_bytes` gives kTooLarge.
  virtual FileResult ReadFile(const std::u16string& path, std::string* bytes, uint64_t max_bytes);
  // Writes `bytes` into a new file, replacing an old one (tests and tools).
  virtual FileResult WriteFile(const std::u16string& path, std::string_view bytes);

  // The diagnostic log's write: opens `path` for exclusive use (creating it
  // when missing), empties it first when it holds `size_limit` bytes or more,
  // appends `line` and closes it. Returns false, writing nothing, when another
  // writer holds the file or it cannot be opened. On POSIX the exclusion is a
  // non-blocking flock, and a symbolic link is never followed.
  virtual bool AppendExclusive(const std::u16string& path, std::string_view line,
                               uint64_t size_limit);

  // Creates `path` when missing and locks it for this holder alone, without
  // waiting (LockFileEx on Windows, flock on POSIX). Null when another holder
  // has it (`failure` then says kSharingViolation) or when the file cannot be
  // created or opened (`failure` says why: access denied, a folder, ...).
  virtual FileLock TryLockFile(const std::u16string& path, FileResult* failure);
  virtual void UnlockFile(FileLock lock);
  // Whether another holder has the lock that TryLockFile takes, asked without
  // waiting and without changing anything: an existing file is opened for
  // reading, locked and released at once; a missing file is free and is not
  // created. A file that cannot be opened counts as held, as in TryLockFile.
  virtual bool FileLockHeld(const std::u16string& path);

  // --- Clocks and time zone ----------------------------------------------
  virtual SystemTime LocalNow();
  virtual SystemTime UtcNow();
  // The machine's current offset as Windows states it: minutes to add to local
  // time to get UTC (positive west of Greenwich), daylight bias included while
  // daylight time is in effect.
  virtual int32_t CurrentBiasMinutes();
  // UTC to local time with the machine's current rules. Empty when the time
  // cannot be converted.
  virtual std::optional<SystemTime> UtcToLocal(const SystemTime& utc);
  // The log's timestamp for a local time: the user's short date, a blank and
  // the time with seconds. On POSIX the user's locale is the one the
  // environment names (LC_ALL, LC_TIME, LANG), in the C form when this machine
  // has no such locale. Empty when the time cannot be rendered.
  virtual std::u16string TimestampText(const SystemTime& local);
  // OLE Automation dates (days since 1899-12-30, time as the fraction).
  virtual std::optional<double> SystemTimeToVariantTime(const SystemTime& st);
  virtual std::optional<SystemTime> VariantTimeToSystemTime(double date);

  // --- Code pages ---------------------------------------------------------
  // What DecodeCodePage does with bytes that are no text of the code page: an
  // invalid or truncated sequence, or a byte or pair the code page leaves
  // undefined.
  enum class InvalidBytes {
    kFail,     // no text at all, so the caller can try another code page
    kReplace,  // each becomes U+FFFD (Windows: the code page's own default)
  };
  // Decodes 8-bit text of a Windows code page number (1252, 65001, 932, ...),
  // reading every byte as Windows does: the POSIX backend sets the few bytes
  // where its converter reads a single-byte code page otherwise (Windows reads
  // the bytes that 874 and 1250-1258 leave undefined as U+0080-U+009F). Empty
  // when this machine cannot convert that code page, and with kFail when the
  // bytes are no text of it. Windows refuses kFail for a few code pages (the
  // ISO-2022 ones, UTF-7): those give nothing with it.
  virtual std::optional<std::u16string> DecodeCodePage(uint32_t code_page, std::string_view bytes,
                                                       InvalidBytes invalid);
  // The system's ANSI code page (GetACP on Windows, 1252 on POSIX).
  virtual uint32_t AnsiCodePage();

  // --- Settings (HKEY_LOCAL_MACHINE) ------------------------------------------
  // The root key HKEY_LOCAL_MACHINE. Never closed.
  static SettingsKey LocalMachine();
  // RegOpenKeyExW with KEY_READ | KEY_WRITE; null when the key is missing or
  // access is refused.
  virtual SettingsKey OpenKey(SettingsKey parent, const std::u16string& name);
  // RegCreateKeyExW (non-volatile, KEY_READ | KEY_WRITE): opens or creates.
  virtual SettingsKey CreateKey(SettingsKey parent, const std::u16string& name);
  // RegOpenKeyExW with KEY_READ alone, so a process without write access to
  // the key (an unelevated one) still reads it; never creates. Null when the
  // key is missing or cannot be read.
  virtual SettingsKey OpenKeyForReading(SettingsKey parent, const std::u16string& name);
  // The value's bytes read as UTF-16 text whatever its type, ending at its first
  // zero character. Empty when the value is missing or unreadable.
  virtual std::optional<std::u16string> QueryStringValue(SettingsKey key, const std::u16string& name);
  virtual void CloseKey(SettingsKey key);

  // --- Threads ------------------------------------------------------------
  // Starts a thread running fn(arg); null when none started. The handle
  // stays valid until JoinThread returns true; a thread nobody joins simply
  // runs until the process ends.
  virtual ThreadHandle StartThread(void (*fn)(void*), void* arg);
  // Waits up to `ms` for the thread to end (not only its function: on POSIX
  // nothing of this library runs on it afterwards, so it may be unloaded).
  // True, and the handle released, when it has ended. Never call it under
  // the Windows loader lock.
  virtual bool JoinThread(ThreadHandle thread, uint32_t ms);
  // Keeps this library mapped until the process ends (Windows: the module is
  // pinned, so FreeLibrary cannot unmap code a running thread executes). POSIX
  // stops the thread at unload instead and does nothing here.
  virtual bool HoldLibraryLoaded();
};

// True when the process's standard error is a terminal (for progress bars).
bool StderrIsTerminal();

// The environment the library uses now (Env::Default() unless a test replaced it).
Env& Current();

// Installs another environment for the lifetime of the object (tests only).
class ScopedEnv {
 public:
  explicit ScopedEnv(Env* env);
  ~ScopedEnv();
  ScopedEnv(const ScopedEnv&) = delete;
  ScopedEnv& operator=(const ScopedEnv&) = delete;

 private:
  Env* previous_;
};

// Process-wide locations that the library takes as fixed but that tests and
// the command-line tool point elsewhere. Set them before starting any thread.
//
// The diagnostic log folder: "C:\AlertSummaryDbg" on Windows,
// "/var/log/AlertSummaryDbg" on Linux. An empty folder switches the log off.
std::u16string LogFolder();
void SetLogFolder(std::u16string folder);
// POSIX only: the folder that stands for HKEY_LOCAL_MACHINE (each key a folder,
// each string value a file of UTF-8 text). Default
// "/etc/AlertSummary/registry/HKEY_LOCAL_MACHINE".
std::u16string SettingsRoot();
void SetSettingsRoot(std::u16string folder);

// A stop request that a sleeping thread can wait on. Safe from any thread;
// never destroyed while a thread may wait on it (callers leak it on purpose).
class StopSignal {
 public:
  StopSignal();
  ~StopSignal();
  StopSignal(const StopSignal&) = delete;
  StopSignal& operator=(const StopSignal&) = delete;

  void Request();
  bool Requested() const;
  // Sleeps up to `ms` milliseconds; returns true at once when a stop is (or
  // becomes) requested.
  bool WaitFor(uint32_t ms);

 private:
  struct Impl;
  Impl* impl_;
};

}  // namespace asum::platform
