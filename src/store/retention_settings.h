// The retention settings: string values under HKEY_LOCAL_MACHINE at
// "software\Varnholt Suite\Varnholt Suite\<setting>", each setting a key of
// its own holding a value of the same name. Reading a setting creates any
// missing key below "software" on the way (read and write access); a value of
// another type is read as text made of its bytes.
//
// Goes through the platform's settings methods (the registry on Windows, a
// folder tree on Linux). Callable from any thread; a key that cannot be opened
// or a missing value gives the default. Nothing is thrown.
#pragma once

#include <string>

#include "platform/platform.h"

namespace asum {

inline constexpr char16_t kRetentionEnabledSetting[] = u"Sch_Retention";
inline constexpr char16_t kRetentionEnabledDefault[] = u"FALSE";
inline constexpr char16_t kRetentionDaysSetting[] = u"Sch_Retention_Val";
inline constexpr char16_t kRetentionDaysDefault[] = u"15 Days";

// "software" opened, then "Varnholt Suite" twice opened or created; the third
// key, or null. The caller closes it.
platform::SettingsKey GetSuiteRegistryKey();
// The setting's key below the suite key, opened or created; or null.
platform::SettingsKey GetSettingKey(const std::u16string& setting_key);
std::u16string GetSettingString(const std::u16string& setting_key, const std::u16string& value_name,
                                const std::u16string& default_value);
// The setting's key and value carry the same name.
std::u16string GetRetentionSetting(const std::u16string& name, const std::u16string& default_value);

// The same setting for a reader that must change nothing (the support tool's
// status): every key on the way is opened for reading alone and none is
// created; a missing key or value gives the default.
std::u16string ReadRetentionSetting(const std::u16string& name, const std::u16string& default_value);

}  // namespace asum
