// Reads a decimal number the way the C runtime's wcstol reads it in base 10,
// with a 32-bit long: leading white space, an optional sign, then digits up to
// the first other character. No digits give 0; a value beyond the 32-bit range
// gives the nearest limit. Pure and thread-safe.
#pragma once

#include <cstdint>
#include <string_view>

namespace asum {

int32_t WcstolDecimal(std::u16string_view text);

}  // namespace asum
