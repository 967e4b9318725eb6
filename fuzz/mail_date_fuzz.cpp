// Reads arbitrary text as a Date field and repairs the result.
#include <cstddef>
#include <cstdint>
#include <string_view>

#include "mail/date_parser.h"
#include "mail/local_date.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  if (size == 0) return 0;
  const int32_t bias = (static_cast<int32_t>(data[0]) - 128) * 6;
  asum::platform::SystemTime now{static_cast<uint16_t>(2005 + data[0] % 20), 3, 0, 11, 2, 0, 0, 0};
  const asum::mail::DateParser parser(asum::mail::DateContext{bias, now});
  asum::platform::SystemTime date;
  parser.Parse(std::string_view(reinterpret_cast<const char*>(data) + 1, size - 1), &date);
  const asum::platform::SystemTime repaired = asum::mail::RepairDate(date, now);
  if (repaired.day < 1 || repaired.day > asum::mail::DaysInMonth(repaired.year, repaired.month)) __builtin_trap();
  return 0;
}
