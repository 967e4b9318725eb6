// The message reader's facade, as alert file processing uses it: construct,
// LoadEml, get_FromAddress / get_Subject / get_Body / get_LocalDate, Clear,
// destroy; one facade per file.
//
// The reader's four classes: CkEmail (this header) is the facade callers
// hold; ClsEmail (cls_email.h) is the implementation it owns, which loads a
// file and answers the getters; Email2 (email2.h) is the parsed message the
// implementation holds; CkString (ck_string.h) is the result holder the
// getters fill. The other files of this folder are the steps of loading.
//
// One thread at a time per facade; facades share nothing. Nothing thrown
// escapes any method. LoadEml returns false (keeping the previous message)
// when the file cannot be read, is a folder, is larger than
// kMaxMessageFileBytes or memory runs short; the getters never fail.
#pragma once

#include <string>

#include "mail/ck_string.h"
#include "mail/cls_email.h"
#include "platform/platform.h"

namespace asum::mail {

class CkEmail {
 public:
  CkEmail();
  virtual ~CkEmail();
  CkEmail(const CkEmail&) = delete;
  CkEmail& operator=(const CkEmail&) = delete;

  // The path as UTF-16, so a name with any characters loads.
  bool LoadEml(const std::u16string& path);
  // The From mailbox's address (no display name, no angle brackets).
  void get_FromAddress(CkString& out);
  // The first Subject field, decoded; leading blanks beyond the first and
  // trailing blanks stay.
  void get_Subject(CkString& out);
  // The HTML body when there is one, else the main body.
  void get_Body(CkString& out);
  // The message date repaired and in local time; always a valid date.
  void get_LocalDate(platform::SystemTime& out);
  void Clear();

  bool get_Utf8() const { return utf8_; }
  ClsEmail* impl() { return impl_; }

 private:
  bool utf8_ = false;
  bool owns_impl_ = true;
  ClsEmail* impl_;
};

}  // namespace asum::mail
