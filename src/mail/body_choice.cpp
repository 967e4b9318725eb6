#include "mail/body_choice.h"

#include "mail/email2.h"
#include "mail/text_util.h"

namespace asum::mail {
namespace {

bool IsMultipart(const MimePart& part) { return StartsWithNoCase(part.content_type, "multipart/"); }

// An alternative is a text part, not an attachment and without sub-parts.
const MimePart* HtmlAlternative(const MimePart& alternative) {
  if (!EqualsNoCase(alternative.content_type, "multipart/alternative")) return nullptr;
  for (const MimePart& sub : alternative.parts) {
    if (!sub.parts.empty() || IsAttachment(sub) || !StartsWithNoCase(sub.content_type, "text/")) continue;
    if (EqualsNoCase(sub.content_type, "text/html")) return &sub;
  }
  return nullptr;
}

bool IsMediaType(const MimePart& part) {
  const std::string_view type = part.content_type;
  return StartsWithNoCase(type, "application") || StartsWithNoCase(type, "image") ||
         StartsWithNoCase(type, "video") || StartsWithNoCase(type, "audio");
}

}  // namespace

bool IsAttachment(const MimePart& part) {
  const std::string_view type = part.content_type;
  if (StartsWithNoCase(type, "multipart/")) return false;
  const bool disposition_attachment = EqualsNoCase(TrimBlanks(part.disposition), "attachment");
  if (EqualsNoCase(type, "message/rfc822")) {
    return disposition_attachment && EndsWithNoCase(part.file_name, ".mht");
  }
  if (disposition_attachment) return true;
  if (!part.file_name.empty() && EqualsNoCase(TrimBlanks(part.transfer_encoding), "base64")) return true;
  if (EndsWithNoCase(part.file_name, ".pem")) return true;
  // Matched with case, as the original rule reads.
  return type == "application/edifact" || type == "application/smil";
}

const std::string* MainBody(const MimePart& start) {
  const MimePart* part = &start;
  // Each step goes one level down, so the loop ends within the tree's depth.
  for (;;) {
    if (part->parts.empty()) return IsMediaType(*part) ? nullptr : &part->body;
    if (IsMultipart(*part)) {
      const MimePart* next = &part->parts[0];
      if (IsAttachment(*next) && part->parts.size() > 1 && !IsAttachment(part->parts[1])) {
        next = &part->parts[1];
      }
      part = next;
      continue;
    }
    for (const MimePart& sub : part->parts) {
      if (sub.parts.empty() && !IsAttachment(sub)) return &sub.body;
    }
    part = &part->parts[0];
  }
}

const std::string* ChooseBody(const MimePart& root) {
  if (EqualsNoCase(root.content_type, "text/html")) return &root.body;
  const MimePart* html = HtmlAlternative(root);
  if (html == nullptr && (EqualsNoCase(root.content_type, "multipart/mixed") ||
                          EqualsNoCase(root.content_type, "multipart/related"))) {
    for (const MimePart& sub : root.parts) {
      if ((html = HtmlAlternative(sub)) != nullptr) break;
    }
  }
  if (html != nullptr) return MainBody(*html);
  return MainBody(root);
}

}  // namespace asum::mail
