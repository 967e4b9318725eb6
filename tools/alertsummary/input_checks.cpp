#include "input_checks.h"

#include <chrono>

#include "commands.h"

namespace asum::tool {

bool IsWhenText(const std::string& text) {
  static constexpr char kLayout[] = "dddd/dd/dd dd:dd:dd";
  if (text.size() != sizeof kLayout - 1) return false;
  for (size_t i = 0; i < text.size(); ++i) {
    const bool digit = text[i] >= '0' && text[i] <= '9';
    if (kLayout[i] == 'd' ? !digit : text[i] != kLayout[i]) return false;
  }
  const auto number = [&](size_t at, size_t length) { return std::stoi(text.substr(at, length)); };
  const std::chrono::year_month_day date{std::chrono::year(number(0, 4)),
                                         std::chrono::month(static_cast<unsigned>(number(5, 2))),
                                         std::chrono::day(static_cast<unsigned>(number(8, 2)))};
  return number(0, 4) > 0 && date.ok() && number(11, 2) < 24 && number(14, 2) < 60 && number(17, 2) < 60;
}

void CheckPeriod(const CLI::Option* from_option, const std::string& from, const CLI::Option* to_option,
                 const std::string& to) {
  for (const auto& [option, value] : {std::pair{from_option, &from}, std::pair{to_option, &to}}) {
    if (option->count() > 0 && !IsWhenText(*value)) {
      throw ToolError(kExitUsage, option->get_name() + " \"" + *value +
                                      "\" is not a date and time written YYYY/MM/DD hh:mm:ss");
    }
  }
  // Both texts share one layout, so they compare as the dates they name.
  if (from_option->count() > 0 && to_option->count() > 0 && from > to) {
    throw ToolError(kExitUsage, "--from " + from + " lies after --to " + to);
  }
}

}  // namespace asum::tool
