#include "mail/ck_email.h"

namespace asum::mail {

CkEmail::CkEmail() : impl_(new ClsEmail()) {}

CkEmail::~CkEmail() {
  if (owns_impl_) delete impl_;
}

bool CkEmail::LoadEml(const std::u16string& path) { return impl_->LoadEml(path); }

void CkEmail::get_FromAddress(CkString& out) {
  try {
    out.SetText(impl_->FromAddress());
  } catch (...) {
    out.SetText({});
  }
}

void CkEmail::get_Subject(CkString& out) {
  try {
    out.SetText(impl_->Subject());
  } catch (...) {
    out.SetText({});
  }
}

void CkEmail::get_Body(CkString& out) {
  try {
    out.SetText(impl_->Body());
  } catch (...) {
    out.SetText({});
  }
}

void CkEmail::get_LocalDate(platform::SystemTime& out) {
  try {
    out = impl_->LocalDate();
  } catch (...) {
    out = platform::Current().LocalNow();
  }
}

void CkEmail::Clear() {
  try {
    impl_->Clear();
  } catch (...) {
  }
}

}  // namespace asum::mail
