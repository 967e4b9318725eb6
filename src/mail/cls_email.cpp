#include "mail/cls_email.h"

#include <new>

#include "common/utf.h"
#include "mail/body_choice.h"
#include "mail/header_block.h"
#include "mail/local_date.h"
#include "mail/message_split.h"
#include "mail/mime_parser.h"
#include "mail/rfc822_address.h"
#include "mail/text_util.h"

namespace asum::mail {

std::unique_ptr<Email2> ParseMessage(std::string bytes, const DateContext& context) {
  auto message = std::make_unique<Email2>();
  std::string repaired;
  const SplitMessage split = SplitHeaderAndBody(WithoutBom(bytes), &repaired);
  if (!repaired.empty()) {
    // The views point into the repaired copy; the original is not needed.
    std::string().swap(bytes);
  }
  message->fields = ParseHeaderBlock(split.header);
  const DateParser parser(context);
  for (const HeaderField& field : message->fields) {
    if (EqualsNoCase(field.name, "Date")) parser.Parse(field.value, &message->date);
  }
  if (const HeaderField* from = FindField(message->fields, "From")) {
    message->from = ParseMailbox(from->raw_value);
  }
  ParseMimeTree(message->fields, split.has_body ? split.body : std::string_view(), &message->root);
  return message;
}

ClsEmail::ClsEmail() : message_(std::make_unique<Email2>()) {}
ClsEmail::~ClsEmail() = default;

bool ClsEmail::LoadEml(const std::u16string& path) {
  try {
    std::string bytes;
    last_read_ = platform::Current().ReadFile(path, &bytes, kMaxMessageFileBytes);
    if (!last_read_.ok()) return false;
    return LoadEmlFromMemory(std::move(bytes), CurrentDateContext());
  } catch (...) {
    return false;
  }
}

bool ClsEmail::LoadEmlFromMemory(std::string bytes, const DateContext& context) {
  try {
    message_ = ParseMessage(std::move(bytes), context);
    return true;
  } catch (...) {
    return false;
  }
}

std::u16string ClsEmail::FromAddress() const {
  if (!message_->from) return {};
  return Utf8ToUtf16(message_->from->address);
}

std::u16string ClsEmail::Subject() const {
  const HeaderField* subject = FindField(message_->fields, "Subject");
  return subject == nullptr ? std::u16string() : Utf8ToUtf16(subject->value);
}

std::u16string ClsEmail::Body() const {
  const std::string* body = ChooseBody(message_->root);
  return body == nullptr ? std::u16string() : Utf8ToUtf16(*body);
}

platform::SystemTime ClsEmail::LocalDate() const { return mail::LocalDate(message_->date, platform::Current()); }

void ClsEmail::Clear() { message_ = std::make_unique<Email2>(); }

}  // namespace asum::mail
