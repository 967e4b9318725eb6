#include <cstdio>
#include <memory>

#include "commands.h"
#include "platform/platform.h"
#include "store/retention.h"
#include "store/retention_settings.h"

namespace asum::tool {

Runner AddPurge(CLI::App& app) {
  auto* sub = app.add_subcommand("purge", "Run the retention purge as _RunRetentionProc runs it");
  auto options = std::make_shared<CommonOptions>();
  AddCommonOptions(*sub, *options);
  return [options]() {
    const std::u16string install = ApplyCommonOptions(*options, ServiceLog::kWrite);
    const std::u16string enabled = GetRetentionSetting(u"Sch_Retention", u"FALSE");
    if (enabled != u"TRUE") {
      std::printf("retention is off (Sch_Retention is \"%s\"); nothing deleted\n", Utf8(enabled).c_str());
      return kExitOk;
    }
    const std::u16string value = GetRetentionSetting(u"Sch_Retention_Val", u"15 Days");
    const std::u16string cutoff = CutoffText(platform::Current().LocalNow(), RetentionDays(value));
    const int result = DeleteOldAlerts(install, cutoff);
    if (result != 1) {
      std::fprintf(stderr, "alertsummary: the purge failed (database missing, locked or unreadable)\n");
      return kExitFailure;
    }
    std::printf("deleted the alerts stamped at or before %s (Sch_Retention_Val \"%s\")\n", Utf8(cutoff).c_str(),
                Utf8(value).c_str());
    return kExitOk;
  };
}

}  // namespace asum::tool
