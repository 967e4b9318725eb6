// The result holder of the message reader: a text set and read as UTF-16,
// and readable as 8-bit text (the system's ANSI code page, or UTF-8 when the
// holder's 8-bit flag is set).
//
// One thread at a time per object. Pointers returned stay valid until the
// next change of the object. Nothing thrown escapes: when memory runs short
// the holder keeps its previous text (or reads back empty).
#pragma once

#include <string>

namespace asum::mail {

class CkString {
 public:
  CkString() = default;
  virtual ~CkString() = default;

  // A zero-terminated UTF-16 text; null sets the empty text.
  void setStringU(const char16_t* text);
  const char16_t* getStringU() const { return text_.c_str(); }
  // The text as 8-bit text in the holder's encoding. Characters the ANSI code
  // page cannot show become '?'.
  const char* getString() const;

  bool get_Utf8() const { return utf8_; }
  void put_Utf8(bool utf8) { utf8_ = utf8; }

  // For the reader: takes the text without a copy.
  void SetText(std::u16string text);
  const std::u16string& text() const { return text_; }

 private:
  std::u16string text_;
  bool utf8_ = false;
  mutable std::string narrow_;
};

}  // namespace asum::mail
