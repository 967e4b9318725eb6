// Chooses the body text that the reader answers (the HTML version when there
// is one) and decides which parts count as attachments for that choice.
//
// Pure and thread-safe; walks the tree without recursion. Returns the chosen
// part's UTF-8 body inside the tree (valid while the tree lives), or null
// when no part qualifies.
#pragma once

#include <string>

#include "mail/email2.h"

namespace asum::mail {

bool IsAttachment(const MimePart& part);

// The rules, first applicable wins: an HTML-only message gives its body; a
// text/html alternative (a text sub-part of a multipart/alternative at the
// top level or directly inside a multipart/mixed or multipart/related top
// level) gives its body; otherwise the main body (MainBody).
const std::string* ChooseBody(const MimePart& root);

// The main body, found from `part` downwards (see body_choice.cpp).
const std::string* MainBody(const MimePart& part);

}  // namespace asum::mail
