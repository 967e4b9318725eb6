// Undoes the content-transfer-encodings base64 and quoted-printable.
//
// Pure and thread-safe. Never fails: invalid input is decoded as far as it
// makes sense (characters outside the base64 alphabet are skipped, a '=' in
// quoted-printable that starts no valid escape stays as it is). Output is
// never larger than the input.
#pragma once

#include <string>
#include <string_view>

namespace asum::mail {

std::string DecodeBase64(std::string_view text);
std::string DecodeQuotedPrintable(std::string_view text);

// base64, quoted-printable, or (7bit, 8bit, binary, anything unknown) the
// bytes unchanged. `encoding` is matched without regard to case.
std::string DecodeTransfer(std::string_view text, std::string_view encoding);

}  // namespace asum::mail
