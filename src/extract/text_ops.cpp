#include "extract/text_ops.h"

namespace asum {

namespace {

std::ptrdiff_t Length(std::u16string_view text) {
  return static_cast<std::ptrdiff_t>(text.size());
}

}  // namespace

std::ptrdiff_t Find(std::u16string_view text, std::u16string_view marker) {
  const std::size_t pos = text.find(marker);
  return pos == std::u16string_view::npos ? -1 : static_cast<std::ptrdiff_t>(pos);
}

std::ptrdiff_t ReverseFind(std::u16string_view text, char16_t c) {
  const std::size_t pos = text.rfind(c);
  return pos == std::u16string_view::npos ? -1 : static_cast<std::ptrdiff_t>(pos);
}

std::u16string_view LeftView(std::u16string_view text, std::ptrdiff_t n) {
  if (n <= 0) return {};
  if (n >= Length(text)) return text;
  return text.substr(0, static_cast<std::size_t>(n));
}

std::u16string_view RightView(std::u16string_view text, std::ptrdiff_t n) {
  if (n <= 0) return {};
  if (n >= Length(text)) return text;
  return text.substr(text.size() - static_cast<std::size_t>(n));
}

std::u16string_view MidView(std::u16string_view text, std::ptrdiff_t i) {
  if (i <= 0) return text;
  if (i >= Length(text)) return {};
  return text.substr(static_cast<std::size_t>(i));
}

std::u16string Left(std::u16string_view text, std::ptrdiff_t n) {
  return std::u16string(LeftView(text, n));
}

std::u16string Right(std::u16string_view text, std::ptrdiff_t n) {
  return std::u16string(RightView(text, n));
}

std::u16string Mid(std::u16string_view text, std::ptrdiff_t i) {
  return std::u16string(MidView(text, i));
}

std::u16string Replace(std::u16string_view text, std::u16string_view old_text,
                       std::u16string_view new_text) {
  if (old_text.empty()) return std::u16string(text);
  std::u16string result;
  result.reserve(text.size());
  std::size_t from = 0;
  for (;;) {
    const std::size_t hit = text.find(old_text, from);
    if (hit == std::u16string_view::npos) break;
    result.append(text.substr(from, hit - from));
    result.append(new_text);
    from = hit + old_text.size();
  }
  result.append(text.substr(from));
  return result;
}

std::u16string TrimLeft(std::u16string_view text) {
  std::size_t begin = 0;
  while (begin < text.size() && IsWhiteSpace(text[begin])) ++begin;
  return std::u16string(text.substr(begin));
}

std::u16string TrimRight(std::u16string_view text) {
  std::size_t end = text.size();
  while (end > 0 && IsWhiteSpace(text[end - 1])) --end;
  return std::u16string(text.substr(0, end));
}

}  // namespace asum
