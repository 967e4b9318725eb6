#include "collect/when_text.h"

#include <cstdio>

#include "common/utf.h"

namespace asum {

std::u16string FormatWhen(const platform::SystemTime& local) {
  int fields[6] = {-1, -1, -1, -1, -1, -1};
  platform::Env& env = platform::Current();
  if (const auto date = env.SystemTimeToVariantTime(local)) {
    if (const auto back = env.VariantTimeToSystemTime(*date)) {
      if (back->year == local.year && back->month == local.month && back->day == local.day &&
          back->hour == local.hour && back->minute == local.minute && back->second == local.second) {
        fields[0] = back->year, fields[1] = back->month, fields[2] = back->day;
        fields[3] = back->hour, fields[4] = back->minute, fields[5] = back->second;
      }
    }
  }
  char text[96];
  std::snprintf(text, sizeof text, "%d/%02d/%02d %02d:%02d:%02d", fields[0], fields[1], fields[2], fields[3],
                fields[4], fields[5]);
  return AsciiToUtf16(text);
}

}  // namespace asum
