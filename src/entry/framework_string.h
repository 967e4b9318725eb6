// The host's string objects, as `_GetAlertCount` receives them on Windows.
//
// The alerting service is built with the Windows application framework and
// passes its reference-counted string objects by value. Such an object is one
// pointer to its characters (UTF-16, zero-terminated), and the characters are
// preceded by the framework's string header:
//
//   manager pointer | data length (int) | allocated length (int) | reference count (32-bit)
//
// 16 bytes on x86; 24 on x64, where the header is padded to the pointer's
// alignment. The manager is an object whose first member points to its table
// of virtual functions: Allocate, Free, Reallocate, GetNilString, Clone. The
// string class has a user-written copy constructor and destructor, so under
// the Microsoft calling conventions:
//   x86: the caller builds each copy in the stack's argument area; the callee
//        sees the character pointer itself.
//   x64: the caller passes the address of a temporary copy; the callee sees a
//        pointer to an object whose one member is the character pointer.
// On both the callee destroys its by-value parameters, exactly once: the
// reference count is decremented, and when it falls to 0 or below the
// manager's Free is called with the header's address. A negative count on
// entry marks a locked buffer, which is left alone.
//
// Any thread. Reading never writes; Release touches only the header it is
// given and calls the host's manager.
#pragma once

#include <cstdint>
#include <string>

namespace asum::framework {

struct StringHeader {
  void* manager;
  int32_t data_length;
  int32_t alloc_length;
  int32_t refs;
};
static_assert(sizeof(void*) != 8 || sizeof(StringHeader) == 24, "x64 header is 24 bytes");
static_assert(sizeof(void*) != 4 || sizeof(StringHeader) == 16, "x86 header is 16 bytes");

#if defined(_WIN32) && defined(__i386__)
#define ASUM_THISCALL __attribute__((thiscall))
#else
#define ASUM_THISCALL
#endif

// The manager's Free, a member function: `this` in ECX on x86.
using FreeFunction = void(ASUM_THISCALL*)(void* self, StringHeader* data);
inline constexpr int kFreeSlot = 1;

// The parameter as the callee sees it on this architecture.
#if UINTPTR_MAX > 0xFFFFFFFFu
using StringArg = char16_t* const*;  // address of the caller's temporary object
#else
using StringArg = char16_t*;  // the object itself: its character pointer
#endif

// The characters of an argument; null for a null argument or a null object.
char16_t* CharactersOf(StringArg arg);
// The text up to its terminating zero (empty for null).
std::u16string TextOf(StringArg arg);
// Destroys the by-value parameter as the framework's destructor would.
void Release(StringArg arg);

}  // namespace asum::framework
