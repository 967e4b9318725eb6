// Checks of the values people type, made before anything is read or written:
// a value that fails is a usage error (ToolError, exit 2) naming the option.
#pragma once

#include <CLI/CLI.hpp>
#include <string>

namespace asum::tool {

// True for "YYYY/MM/DD hh:mm:ss" naming a real date and time (the layout of
// the "When" text, four-digit year, leap days included).
bool IsWhenText(const std::string& text);

// The bounds of a period as given: each option, when given, must be a real
// "When" text, and --from may not lie after --to. Unset options keep their
// defaults, which need not be dates.
void CheckPeriod(const CLI::Option* from_option, const std::string& from, const CLI::Option* to_option,
                 const std::string& to);

}  // namespace asum::tool
