// A stand-in for the alerting service: loads the library from its own folder
// (or the path given with --library) at run time and calls the exports, one
// step per argument, printing one line per result.
//
//   testhost [--library PATH] STEP...
//   run             calls _Run and prints "run <nonzero|null>"
//   sleep MS        waits
//   unload          unloads the library
//   exit            ends the process with exit(0) at once (static teardown runs)
//
// Exit code 0 when every step ran, 2 on bad arguments or a library that does
// not load, 3 when an export is missing.
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <thread>

#ifdef _WIN32
#include <windows.h>
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

}  // namespace

int main(int argc, char** argv) {
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
      auto run = reinterpret_cast<RunFn>(Symbol(module, "_Run"));
      if (run == nullptr) {
        std::fprintf(stderr, "testhost: _Run is not exported\n");
        return 3;
      }
      std::printf("run %s\n", run() != nullptr ? "nonzero" : "null");
    } else if (step == "sleep" && i + 1 < argc) {
      std::this_thread::sleep_for(std::chrono::milliseconds(std::atoi(argv[++i])));
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
