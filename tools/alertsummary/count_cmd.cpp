#include <cstdio>
#include <memory>

#include "collect/cycle.h"
#include "commands.h"
#include "platform/platform.h"
#include "store/alert_count.h"
#include "store/database_probe.h"

namespace asum::tool {
namespace {

struct CountOptions {
  CommonOptions common;
  std::string filter;
  std::string from;
  std::string to = "9999/99/99 99:99:99";
  std::string range;
};

}  // namespace

Runner AddCount(CLI::App& app) {
  auto* sub = app.add_subcommand("count", "Print the number of stored alerts that _GetAlertCount would return");
  auto options = std::make_shared<CountOptions>();
  AddCommonOptions(*sub, options->common);
  sub->add_option("--filter", options->filter,
                  "Alert Action (text holding \"Email Alert\" or \"Script Alert\") or Alert Type to match, LIKE %TEXT%");
  auto* from = sub->add_option("--from", options->from, "Lower bound of \"When\", \"YYYY/MM/DD hh:mm:ss\" (inclusive)");
  auto* to = sub->add_option("--to", options->to, "Upper bound of \"When\", \"YYYY/MM/DD hh:mm:ss\" (inclusive)");
  auto* range = sub->add_option("--range", options->range, "The raw range text as the host passes it");
  range->excludes(from)->excludes(to);
  return [options, range]() {
    const std::u16string install = ApplyCommonOptions(options->common);
    const std::u16string db_path = DatabasePathOf(install);
    if (platform::Current().PathExists(db_path) && !IsDatabaseFile(db_path)) {
      std::fprintf(stderr, "alertsummary: %s is not an alert database\n", Utf8(db_path).c_str());
      return kExitFailure;
    }
    const std::u16string range_text = range->count() > 0 ? Utf16(options->range) : RangeText(options->from, options->to);
    std::printf("%d\n", CountAlerts(install, Utf16(options->filter), range_text));
    return kExitOk;
  };
}

}  // namespace asum::tool
