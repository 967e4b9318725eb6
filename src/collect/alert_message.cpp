#include "collect/alert_message.h"

#include "common/utf.h"
#include "log/log.h"
#include "mail/ck_email.h"

namespace asum {

bool LoadAlertMessage(const std::u16string& path, AlertMessage* message) {
  // The reader refuses what would not fit its memory cap, and says nothing
  // (it never logs); the size is checked here so that a file that stays
  // behind every cycle says why.
  uint64_t size = 0;
  if (platform::Current().FileSize(path, &size).ok() && size > mail::kMaxMessageFileBytes) {
    WriteLog(path + u" holds " + DecimalText(static_cast<int64_t>(size)) + u" bytes, more than the " +
             DecimalText(static_cast<int64_t>(mail::kMaxMessageFileBytes)) +
             u" an alert file may hold; it keeps its name");
    return false;
  }
  mail::CkEmail email;
  if (!email.LoadEml(path)) {
    // A file its writer still holds is the one failure worth a line: it is
    // normal, passing, and explains why a fresh alert waits a cycle.
    const platform::FileResult& read = email.impl()->last_read();
    if (read.status == platform::FileStatus::kSharingViolation) {
      WriteLog(path + u" is still being written (" + read.Describe() + u"); it is offered again next cycle");
    }
    return false;
  }
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
