#include "entry/framework_string.h"

#include <atomic>

namespace asum::framework {

char16_t* CharactersOf(StringArg arg) {
#if UINTPTR_MAX > 0xFFFFFFFFu
  return arg == nullptr ? nullptr : *arg;
#else
  return arg;
#endif
}

std::u16string TextOf(StringArg arg) {
  const char16_t* chars = CharactersOf(arg);
  return chars == nullptr ? std::u16string() : std::u16string(chars);
}

void Release(StringArg arg) {
  char16_t* chars = CharactersOf(arg);
  if (chars == nullptr) return;
  auto* header = reinterpret_cast<StringHeader*>(chars) - 1;
  std::atomic_ref<int32_t> refs(header->refs);
  if (refs.load() < 0) return;  // a locked buffer belongs to its holder
  if (refs.fetch_sub(1) - 1 > 0) return;
  void* manager = header->manager;
  if (manager == nullptr) return;
  auto* table = *static_cast<FreeFunction**>(manager);
  table[kFreeSlot](manager, header);
}

}  // namespace asum::framework
