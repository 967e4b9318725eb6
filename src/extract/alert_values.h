// The alert field values that the subject classification writes and the
// alert file processing compares against, in one place.
#pragma once

#include <string_view>

namespace asum {

inline constexpr std::u16string_view kEmailAlert = u"Email Alert";
inline constexpr std::u16string_view kScriptAlert = u"Script Alert";
inline constexpr std::u16string_view kDataLeakage = u"Potential Data Leakage";

}  // namespace asum
