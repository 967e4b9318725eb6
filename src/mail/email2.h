// The parsed message: header fields, From mailbox, UTC date and MIME part
// tree, as the message reader (ClsEmail) builds it at load.
//
// A plain value owned by one ClsEmail and used by one thread at a time. The
// part tree is at most kMaxPartDepth deep, so destroying it recurses only
// that far.
#pragma once

#include <optional>
#include <string>
#include <vector>

#include "mail/header_block.h"
#include "mail/rfc822_address.h"
#include "platform/platform.h"

namespace asum::mail {

struct MimePart {
  std::string content_type;       // main value as written, "text/html"; empty when absent
  std::string disposition;        // main value of Content-Disposition
  std::string file_name;          // Content-Disposition filename, else Content-Type name
  std::string transfer_encoding;  // as written
  std::string body;               // transfer encoding undone; text parts in UTF-8
  std::vector<MimePart> parts;
};

struct Email2 {
  std::vector<HeaderField> fields;
  std::optional<Rfc822Address> from;
  platform::SystemTime date;  // UTC; all zero when absent or unreadable
  MimePart root;
};

}  // namespace asum::mail
