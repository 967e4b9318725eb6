// Reads the alert fields that the subject does not carry out of an alert
// e-mail's HTML body:
//   - ParseHtmlBodyToGetComponentInfo: the component name from the body's
//     text paragraphs, found where the Alert Action ("Email Alert" or
//     "Script Alert", exact) says to look;
//   - ParseHtmlBodyAndGetFieldData: for one field name ("Server",
//     "Component Name", "Server Name", "Who", "Operation", ...) the values of
//     every data cell whose column header contains that name (case-sensitive
//     substring; an empty name matches every header), over all rows, each
//     value once, joined with ", ". For "Who" repeats are found ignoring the
//     letter case of A-Z (the first spelling met is kept); for "File Server"
//     every value is followed by "(File Server)".
//
// Both read the body without changing the caller's text,
// return a new text, and return "" when nothing is found; they never fail.
// Log lines: "Inside ParseHtmlBodyToGetComponentInfo function";
// "Inside ParseHtmlBodyAndGetFieldData function" and, once the table is read,
// "After calling "GetAllRowFromHtmlTable" function" (quotes included), besides
// the lines of the table reader. No shared state: callable from any thread.
// Work is linear in the body's length. Nothing is thrown but std::bad_alloc.
#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "extract/html_table.h"

namespace asum {

std::u16string ParseHtmlBodyToGetComponentInfo(std::u16string_view body,
                                               std::u16string_view alertAction);

std::u16string ParseHtmlBodyAndGetFieldData(std::u16string_view body,
                                            std::u16string_view fieldName);

// Several field requests over one body, each answered exactly as
// ParseHtmlBodyAndGetFieldData answers it, log lines included, but with the
// body's table read only once. The body must outlive the reader. One thread.
class BodyFieldReader {
 public:
  explicit BodyFieldReader(std::u16string_view body);
  std::u16string FieldData(std::u16string_view fieldName);

 private:
  std::u16string_view body_;
  bool parsed_ = false;
  std::vector<std::u16string> headers_;
  std::vector<CRowHtml> rows_;
};

}  // namespace asum
