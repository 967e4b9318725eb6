// The alerting service's side of `_GetAlertCount` on Windows: string objects
// of the application framework's layout, with a string manager of the host's
// own that counts Free calls and checks what it is given, and the call made
// exactly as the framework host makes it on this architecture.
#pragma once

#include <windows.h>

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

namespace host {

struct Header {
  void* manager;
  int32_t data_length;
  int32_t alloc_length;
  int32_t refs;
};

#if defined(__i386__)
#define HOST_THISCALL __attribute__((thiscall))
#else
#define HOST_THISCALL
#endif

struct Manager;
void HOST_THISCALL ManagerFree(Manager* self, Header* data);
void* HOST_THISCALL ManagerUnexpected(Manager* self);

// First member: the table of virtual functions, in the framework's order.
struct Manager {
  void* const* table;
  int frees = 0;
  int bad_frees = 0;
  std::vector<Header*> expected;  // headers that may be freed, each once
  Manager();
};

inline void* const kTable[] = {
    reinterpret_cast<void*>(&ManagerUnexpected),  // Allocate
    reinterpret_cast<void*>(&ManagerFree),        // Free
    reinterpret_cast<void*>(&ManagerUnexpected),  // Reallocate
    reinterpret_cast<void*>(&ManagerUnexpected),  // GetNilString
    reinterpret_cast<void*>(&ManagerUnexpected),  // Clone
};

inline Manager::Manager() : table(kTable) {}

inline Manager* g_manager = nullptr;

inline void HOST_THISCALL ManagerFree(Manager* self, Header* data) {
  if (self != g_manager) {
    std::fprintf(stderr, "Free called with a wrong this\n");
    ++g_manager->bad_frees;
    return;
  }
  ++self->frees;
  for (auto& h : self->expected) {
    if (h == data) {
      h = nullptr;
      std::free(data);
      return;
    }
  }
  std::fprintf(stderr, "Free called with a header that is not ours to free\n");
  ++self->bad_frees;
}

inline void* HOST_THISCALL ManagerUnexpected(Manager*) {
  std::fprintf(stderr, "the library called a string manager function other than Free\n");
  std::exit(6);
}

// A string buffer: header, characters, terminating zero.
inline wchar_t* NewString(Manager& m, const std::wstring& text, int32_t refs) {
  auto* h = static_cast<Header*>(std::malloc(sizeof(Header) + (text.size() + 1) * sizeof(wchar_t)));
  h->manager = &m;
  h->data_length = static_cast<int32_t>(text.size());
  h->alloc_length = static_cast<int32_t>(text.size());
  h->refs = refs;
  auto* chars = reinterpret_cast<wchar_t*>(h + 1);
  std::memcpy(chars, text.c_str(), (text.size() + 1) * sizeof(wchar_t));
  m.expected.push_back(h);
  return chars;
}

inline Header* HeaderOf(wchar_t* chars) { return reinterpret_cast<Header*>(chars) - 1; }

// The call as the framework host compiles it: the by-value objects are built
// by the caller (x86: in the argument area, which holds just the character
// pointer; x64: as temporaries whose addresses are passed) and destroyed by
// the callee. `filter` and `range` are the objects' character pointers, their
// reference counts already as the copies leave them.
#if defined(_WIN64)
using CountFn = int (*)(wchar_t* const*, wchar_t* const*);
inline int CallCount(void* fn, wchar_t* filter, wchar_t* range) {
  wchar_t* const filter_object = filter;
  wchar_t* const range_object = range;
  return reinterpret_cast<CountFn>(fn)(&filter_object, &range_object);
}
inline int CallCountNullObject(void* fn, wchar_t* range) {
  wchar_t* const range_object = range;
  return reinterpret_cast<CountFn>(fn)(nullptr, &range_object);
}
#else
using CountFn = int(__cdecl*)(wchar_t*, wchar_t*);
inline int CallCount(void* fn, wchar_t* filter, wchar_t* range) {
  return reinterpret_cast<CountFn>(fn)(filter, range);
}
inline int CallCountNullObject(void* fn, wchar_t* range) { return reinterpret_cast<CountFn>(fn)(nullptr, range); }
#endif

}  // namespace host
