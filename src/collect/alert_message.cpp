#include "collect/alert_message.h"

#include "mail/ck_email.h"

namespace asum {

bool LoadAlertMessage(const std::u16string& path, AlertMessage* message) {
  mail::CkEmail email;
  if (!email.LoadEml(path)) return false;
  // Read back as zero-terminated texts, as the reader's callers always have.
  mail::CkString text;
  email.get_FromAddress(text);
  message->sender = text.getStringU();
  email.get_Subject(text);
  message->subject = text.getStringU();
  email.get_Body(text);
  message->body = text.getStringU();
  email.get_LocalDate(message->local_date);
  email.Clear();
  return true;
}

}  // namespace asum
