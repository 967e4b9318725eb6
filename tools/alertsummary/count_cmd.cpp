#include <cstdio>
#include <memory>

#include "commands.h"
#include "common/wide_number.h"
#include "input_checks.h"
#include "install_view.h"
#include "store/alert_count.h"

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
  auto* range = sub->add_option("--range", options->range,
                                "The raw range text as the host passes it, taken as it stands");
  range->excludes(from)->excludes(to);
  return [options, from, to, range]() {
    const std::u16string install = ApplyCommonOptions(options->common, ServiceLog::kLeaveAlone);
    CheckPeriod(from, options->from, to, options->to);
    BusyBudget budget(kQueryBusyTimeoutMs);
    CDbSQLite db;
    db.SetBusyBudget(&budget);
    OpenForReading(db, PathsOf(install).database);
    // The library's own statement, on a connection that cannot change the file.
    const std::u16string range_text = range->count() > 0 ? Utf16(options->range) : RangeText(options->from, options->to);
    const CountStatement count = BuildCountStatement(Utf16(options->filter), range_text);
    std::unique_ptr<CSqlStatement> statement = db.Statement(count.sql);
    for (size_t i = 0; i < count.params.size(); ++i) statement->BindText(static_cast<int>(i + 1), count.params[i]);
    // Every failure counts 0, as the export answers.
    const int32_t result = statement->NextRow() ? WcstolBase10(statement->ValueString(0)) : 0;
    std::printf("%d\n", result);
    return kExitOk;
  };
}

}  // namespace asum::tool
