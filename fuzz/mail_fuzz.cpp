// Loads arbitrary bytes as a message and reads everything the reader answers.
#include <cstddef>
#include <cstdint>
#include <string>

#include "mail/cls_email.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  // The first byte picks the machine's offset so the daylight rule runs too.
  const int32_t bias = size > 0 ? (static_cast<int32_t>(data[0]) - 128) * 6 : 0;
  const asum::mail::DateContext context{bias, asum::platform::SystemTime{2012, 7, 0, 1, 12, 0, 0, 0}};
  asum::mail::ClsEmail email;
  email.LoadEmlFromMemory(std::string(reinterpret_cast<const char*>(data), size), context);
  (void)email.FromAddress();
  (void)email.Subject();
  (void)email.Body();
  (void)email.LocalDate();
  email.Clear();
  return 0;
}
