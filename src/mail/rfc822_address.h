// A mailbox of an address field: display name and address.
//
// Pure and thread-safe. Parsing never fails loudly: a value without any
// address gives none. Linear in the value's length (comments may nest).
#pragma once

#include <optional>
#include <string>
#include <string_view>

namespace asum::mail {

struct Rfc822Address {
  std::string name;     // UTF-8, encoded words decoded, quotes removed
  std::string address;  // no angle brackets
};

// The first mailbox of `value` as written in the header (encoded words not
// yet decoded, so a decoded display name can never change the address).
// Forms: `Name <addr>`, `"Quoted, Name" <addr>`, `addr (Comment)`, `addr`,
// `<addr>`, and the same inside a group `team: Name <addr>;`. A quoted local
// part keeps its quotes in every form: `"john doe"@example.com`.
std::optional<Rfc822Address> ParseMailbox(std::string_view value);

}  // namespace asum::mail
