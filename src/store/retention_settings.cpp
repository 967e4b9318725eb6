#include "store/retention_settings.h"

namespace asum {

using platform::Env;
using platform::SettingsKey;

SettingsKey GetSuiteRegistryKey() {
  Env& env = platform::Current();
  SettingsKey software = env.OpenKey(Env::LocalMachine(), u"software");
  if (software == nullptr) return nullptr;
  SettingsKey vendor = env.CreateKey(software, u"Varnholt Suite");
  SettingsKey suite = vendor != nullptr ? env.CreateKey(vendor, u"Varnholt Suite") : nullptr;
  if (vendor != nullptr) env.CloseKey(vendor);
  env.CloseKey(software);
  return suite;
}

SettingsKey GetSettingKey(const std::u16string& setting_key) {
  Env& env = platform::Current();
  SettingsKey suite = GetSuiteRegistryKey();
  if (suite == nullptr) return nullptr;
  SettingsKey key = env.CreateKey(suite, setting_key);
  env.CloseKey(suite);
  return key;
}

std::u16string GetSettingString(const std::u16string& setting_key, const std::u16string& value_name,
                                const std::u16string& default_value) {
  SettingsKey key = GetSettingKey(setting_key);
  if (key == nullptr) return default_value;
  std::optional<std::u16string> value = platform::Current().QueryStringValue(key, value_name);
  platform::Current().CloseKey(key);
  return value ? *value : default_value;
}

std::u16string GetRetentionSetting(const std::u16string& name, const std::u16string& default_value) {
  return GetSettingString(name, name, default_value);
}

std::u16string ReadRetentionSetting(const std::u16string& name, const std::u16string& default_value) {
  Env& env = platform::Current();
  SettingsKey key = Env::LocalMachine();
  for (const std::u16string& step : {std::u16string(u"software"), std::u16string(u"Varnholt Suite"),
                                     std::u16string(u"Varnholt Suite"), name}) {
    SettingsKey next = env.OpenKeyForReading(key, step);
    env.CloseKey(key);
    key = next;
    if (key == nullptr) return default_value;
  }
  std::optional<std::u16string> value = env.QueryStringValue(key, name);
  env.CloseKey(key);
  return value ? *value : default_value;
}

}  // namespace asum
