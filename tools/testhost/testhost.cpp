// A stand-in for the alerting service: loads the library from its own folder
// (or the path given with --library) at run time and calls the exports, one
// step per argument, printing one line per result.
//
//   testhost [--library PATH] STEP...
//   run             calls _Run and prints "run <nonzero|null>"
//   count F R       calls _GetAlertCount with filter F and range R (UTF-8
//                   arguments) and prints "count <n>"
//   retention       calls _RunRetentionProc and prints "retention <n>"
//   await F R N MS  calls _GetAlertCount every 100 ms until it gives N or MS
//                   milliseconds passed; prints "await <last count>"
//   abicheck F R NF NE   (Windows) passes the host's string objects in every
//                   situation the service creates them (copies, temporaries,
//                   the shared empty string, locked buffers, null, long and
//                   non-ASCII texts) and checks each count (NF for filter F,
//                   NE for the empty filter) and that each string is released
//                   exactly once; prints "abicheck ok"
//
// On Windows, `count` and `await` pass the filter and range as the service
// does: its own string plus the by-value copy the export destroys.
//   sleep MS        waits
//   wait            reads one line from standard input: the test feeds it a line
//                   when the condition it waits for holds (prints "wait gave up"
//                   when the input ends first)
//   unload          unloads the library
//   exit            ends the process with exit(0) at once (static teardown runs)
//
// An argument "@empty" stands for the empty text (some launchers drop empty
// arguments).
//
// Exit code 0 when every step ran, 2 on bad arguments or a library that does
// not load, 3 when an export is missing.
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <thread>
#include <algorithm>

#ifdef _WIN32
#include <windows.h>

#include "host_strings.h"
#else
#include <dlfcn.h>
#include <unistd.h>
#endif

namespace {

#ifdef _WIN32
using Module = HMODULE;
std::wstring OwnFolder() {
  wchar_t buffer[1024];
  const DWORD n = GetModuleFileNameW(nullptr, buffer, 1024);
  std::wstring path(buffer, n);
  return path.substr(0, path.find_last_of(L'\\'));
}
Module Load(const std::wstring& path) { return LoadLibraryW(path.c_str()); }
void* Symbol(Module m, const char* name) { return reinterpret_cast<void*>(GetProcAddress(m, name)); }
void Unload(Module m) { FreeLibrary(m); }
std::wstring DefaultLibrary() { return OwnFolder() + L"\\AlertSummary.dll"; }
std::wstring Widen(const char* s) {
  const int n = MultiByteToWideChar(CP_UTF8, 0, s, -1, nullptr, 0);
  std::wstring w(n > 0 ? n - 1 : 0, L'\0');
  if (n > 1) MultiByteToWideChar(CP_UTF8, 0, s, -1, w.data(), n);
  return w;
}
#else
using Module = void*;
std::string OwnFolder() {
  char buffer[4096];
  const ssize_t n = readlink("/proc/self/exe", buffer, sizeof buffer - 1);
  std::string path(buffer, n > 0 ? static_cast<size_t>(n) : 0);
  return path.substr(0, path.find_last_of('/'));
}
Module Load(const std::string& path) { return dlopen(path.c_str(), RTLD_NOW | RTLD_LOCAL); }
void* Symbol(Module m, const char* name) { return dlsym(m, name); }
void Unload(Module m) { dlclose(m); }
std::string DefaultLibrary() { return OwnFolder() + "/libAlertSummary.so"; }
std::string Widen(const char* s) { return s; }
#endif

using RunFn = void* (*)();
using CountFn = int (*)(const wchar_t*, const wchar_t*);

#ifdef _WIN32
[[noreturn]] void AbiFailure(const char* what) {
  std::fprintf(stderr, "testhost: string passing failed: %s\n", what);
  std::exit(5);
}

// As the service: its own string object (count 1) and the copy for the call
// (count 2); after the call the copy is gone and the host releases its own.
int Count(void* fn, const std::wstring& filter, const std::wstring& range) {
  host::Manager& m = *host::g_manager;
  wchar_t* f = host::NewString(m, filter, 2);
  wchar_t* r = host::NewString(m, range, 2);
  const int frees = m.frees;
  const int n = host::CallCount(fn, f, r);
  if (host::HeaderOf(f)->refs != 1 || host::HeaderOf(r)->refs != 1 || m.frees != frees) {
    AbiFailure("a copy was not released exactly once");
  }
  host::HeaderOf(f)->refs = 0, host::HeaderOf(r)->refs = 0;
  std::free(host::HeaderOf(f));
  std::free(host::HeaderOf(r));
  m.expected.clear();
  return n;
}

void AbiCheck(void* fn, const std::wstring& filter, const std::wstring& range, int nf, int ne) {
  host::Manager& m = *host::g_manager;
  auto expect = [](bool ok, const char* what) {
    if (!ok) AbiFailure(what);
  };
  expect(Count(fn, filter, range) == nf, "count with copies");

  // Temporaries built in place: count 1 each, so the export frees both.
  wchar_t* f = host::NewString(m, filter, 1);
  wchar_t* r = host::NewString(m, range, 1);
  host::Header* fh = host::HeaderOf(f);
  host::Header* rh = host::HeaderOf(r);
  int frees = m.frees;
  expect(host::CallCount(fn, f, r) == nf, "count with temporaries");
  expect(m.frees == frees + 2 && m.bad_frees == 0, "temporaries freed once each with their headers");
  expect(std::find(m.expected.begin(), m.expected.end(), fh) == m.expected.end() &&
             std::find(m.expected.begin(), m.expected.end(), rh) == m.expected.end(),
         "Free got the temporaries' headers");
  m.expected.clear();

  // The shared empty string: count 2 on entry, never freed by the export.
  wchar_t* nil = host::NewString(m, L"", 2);
  r = host::NewString(m, range, 2);
  frees = m.frees;
  expect(host::CallCount(fn, nil, r) == ne, "count with the shared empty string");
  expect(host::HeaderOf(nil)->refs == 1 && m.frees == frees, "the shared empty string released, not freed");

  // A locked buffer (negative count) is the holder's: left alone.
  wchar_t* locked = host::NewString(m, filter, -1);
  r = host::NewString(m, range, 2);
  expect(host::CallCount(fn, locked, r) == nf, "count with a locked buffer");
  expect(host::HeaderOf(locked)->refs == -1 && m.frees == frees, "a locked buffer left alone");

  // Null arguments read as empty texts and are not released.
  r = host::NewString(m, range, 2);
  expect(host::CallCountNullObject(fn, r) == ne, "count with a null argument");
#if defined(_WIN64)
  {
    wchar_t* const null_member = nullptr;
    wchar_t* const range_object = host::NewString(m, range, 2);
    expect(reinterpret_cast<host::CountFn>(fn)(&null_member, &range_object) == ne, "count with a null member");
  }
#endif

  // Long and non-ASCII range texts that hold the same bounds.
  const size_t close = range.find(L"</FROM>");
  if (close != std::wstring::npos && range.size() > close + 11) {
    const std::wstring lower = range.substr(range.rfind(L'>', close) + 1, close - range.rfind(L'>', close) - 1);
    const std::wstring upper_and_tail = range.substr(close + 11);
    const std::wstring upper = upper_and_tail.substr(0, upper_and_tail.rfind(L'<'));
    const std::wstring wide_range = L"<\u00c4\u00d6\u4e2d>" + lower + L"</FROM><T\u00d6>" + upper + L"</T\u00d6>";
    expect(Count(fn, filter, wide_range) == nf, "count with a non-ASCII range");
    expect(Count(fn, filter, std::wstring(100000, L' ') + wide_range) == nf, "count with a 100000-character range");
  }
  std::printf("abicheck ok\n");
}
#else
int Count(void* fn, const std::wstring& filter, const std::wstring& range) {
  return reinterpret_cast<CountFn>(fn)(filter.c_str(), range.c_str());
}
#endif
using RetentionFn = int (*)();

#ifdef _WIN32
std::wstring HostText(const char* utf8) { return std::strcmp(utf8, "@empty") == 0 ? L"" : Widen(utf8); }
#else
// wchar_t is 32-bit here: decode UTF-8 into code points.
std::wstring HostText(const char* utf8) {
  std::wstring out;
  if (std::strcmp(utf8, "@empty") == 0) return out;
  const auto* p = reinterpret_cast<const unsigned char*>(utf8);
  while (*p) {
    unsigned c = *p++;
    int extra = c >= 0xF0 ? 3 : c >= 0xE0 ? 2 : c >= 0xC0 ? 1 : 0;
    c &= extra == 3 ? 0x07 : extra == 2 ? 0x0F : extra == 1 ? 0x1F : 0x7F;
    while (extra-- > 0 && (*p & 0xC0) == 0x80) c = (c << 6) | (*p++ & 0x3F);
    out.push_back(static_cast<wchar_t>(c));
  }
  return out;
}
#endif

void* Require(Module module, const char* name) {
  void* symbol = Symbol(module, name);
  if (symbol == nullptr) {
    std::fprintf(stderr, "testhost: %s is not exported\n", name);
    std::exit(3);
  }
  return symbol;
}

}  // namespace

int main(int argc, char** argv) {
#ifdef _WIN32
  host::Manager manager;
  host::g_manager = &manager;
#endif
  int i = 1;
  auto library = DefaultLibrary();
  if (i + 1 < argc && std::strcmp(argv[i], "--library") == 0) {
    library = Widen(argv[i + 1]);
    i += 2;
  }
  Module module = Load(library);
  if (module == nullptr) {
    std::fprintf(stderr, "testhost: cannot load the library\n");
    return 2;
  }
  for (; i < argc; ++i) {
    const std::string step = argv[i];
    if (step == "run") {
      auto run = reinterpret_cast<RunFn>(Require(module, "_Run"));
      std::printf("run %s\n", run() != nullptr ? "nonzero" : "null");
    } else if (step == "count" && i + 2 < argc) {
      void* count = Require(module, "_GetAlertCount");
      const std::wstring filter = HostText(argv[i + 1]), range = HostText(argv[i + 2]);
      i += 2;
      std::printf("count %d\n", Count(count, filter, range));
#ifdef _WIN32
    } else if (step == "abicheck" && i + 4 < argc) {
      void* count = Require(module, "_GetAlertCount");
      AbiCheck(count, HostText(argv[i + 1]), HostText(argv[i + 2]), std::atoi(argv[i + 3]), std::atoi(argv[i + 4]));
      i += 4;
#endif
    } else if (step == "await" && i + 4 < argc) {
      void* count = Require(module, "_GetAlertCount");
      const std::wstring filter = HostText(argv[i + 1]), range = HostText(argv[i + 2]);
      const int want = std::atoi(argv[i + 3]);
      const auto deadline = std::chrono::steady_clock::now() + std::chrono::milliseconds(std::atoi(argv[i + 4]));
      i += 4;
      int got = Count(count, filter, range);
      while (got != want && std::chrono::steady_clock::now() < deadline) {
        std::this_thread::sleep_for(std::chrono::milliseconds(100));
        got = Count(count, filter, range);
      }
      std::printf("await %d\n", got);
    } else if (step == "retention") {
      auto retention = reinterpret_cast<RetentionFn>(Require(module, "_RunRetentionProc"));
      std::printf("retention %d\n", retention());
    } else if (step == "sleep" && i + 1 < argc) {
      std::this_thread::sleep_for(std::chrono::milliseconds(std::atoi(argv[++i])));
    } else if (step == "wait") {
      char line[64];
      if (std::fgets(line, sizeof line, stdin) == nullptr) std::printf("wait gave up\n");
    } else if (step == "unload") {
      Unload(module);
      module = nullptr;
      std::printf("unloaded\n");
    } else if (step == "exit") {
      std::fflush(stdout);
      std::exit(0);
    } else {
      std::fprintf(stderr, "testhost: unknown step '%s'\n", step.c_str());
      return 2;
    }
    std::fflush(stdout);
  }
  return 0;
}
