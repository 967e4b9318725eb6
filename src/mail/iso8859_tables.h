// ISO 8859-10 (Nordic) and ISO 8859-14 (Celtic), read by the reader itself:
// Windows has no code page for either, and both builds must read a message
// alike.
//
// Pure and thread-safe. Every byte of both is defined, so a text in one of
// them always converts.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace asum::mail {

// `bytes` as UTF-8 when `code_page` is kCodePageIso8859_10 or
// kCodePageIso8859_14 (charset_table.h); nothing for any other code page.
std::optional<std::string> Iso8859TableToUtf8(uint32_t code_page, std::string_view bytes);

}  // namespace asum::mail
