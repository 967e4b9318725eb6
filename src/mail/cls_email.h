// The message reader's implementation object: loads one message into an
// Email2 and answers sender address, subject, body and local date.
//
// One thread at a time per object; objects share nothing. Nothing thrown
// escapes: a load that fails (unreadable file, memory short) returns false
// and keeps the previous message; the getters never fail and give empty
// texts for what the message lacks.
#pragma once

#include <cstdint>
#include <memory>
#include <string>

#include "mail/date_parser.h"
#include "mail/email2.h"
#include "platform/platform.h"

namespace asum::mail {

// Files above this size are refused (the whole file is held in memory, and
// an alert message is a few kilobytes).
inline constexpr uint64_t kMaxMessageFileBytes = 128ull << 20;

class ClsEmail {
 public:
  ClsEmail();
  virtual ~ClsEmail();
  ClsEmail(const ClsEmail&) = delete;
  ClsEmail& operator=(const ClsEmail&) = delete;

  // Reads the file through platform::Current().ReadFile and loads it with the
  // machine's date facts (CurrentDateContext).
  bool LoadEml(const std::u16string& path);
  // How the last LoadEml's read of its file went (ok when the file was read,
  // whatever the parse gave).
  const platform::FileResult& last_read() const { return last_read_; }
  // Loads a message held in memory; the bytes are consumed, so their memory
  // is given back as soon as the parsed parts hold what they need.
  bool LoadEmlFromMemory(std::string bytes, const DateContext& context);

  std::u16string FromAddress() const;
  std::u16string Subject() const;
  std::u16string Body() const;
  // Through platform::Current() (current UTC time, time-zone rules).
  platform::SystemTime LocalDate() const;
  void Clear();

  const Email2& message() const { return *message_; }

 private:
  std::unique_ptr<Email2> message_;
  platform::FileResult last_read_;
};

// Parses `bytes` into a new message; throws only std::bad_alloc.
std::unique_ptr<Email2> ParseMessage(std::string bytes, const DateContext& context);

}  // namespace asum::mail
