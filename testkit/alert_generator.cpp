#include "alert_generator.h"

#include <algorithm>
#include <cstdio>
#include <random>
#include <vector>

namespace asum::gen {
namespace {

const char* const kUsers[] = {"CORP\\jsmith", "CORP\\adoe", "CORP\\mkowalski", "CORP\\lgarcia", "CORP\\svc_backup",
                              "CORP\\Administrator", "CORP\\ochen", "corp\\JSMITH"};
const char* const kOperations[] = {"Modified", "Deleted", "Created", "Moved", "Permission changed", "Read"};
const char* const kServers[] = {"FS01", "FS02", "DC01", "DC02", "EXCH01", "SQL01", "SP01"};
const char* const kObjects[] = {"\\\\FS01\\Finance\\Q3 budget.xlsx", "\\\\FS02\\HR\\Salaries 2024.docx",
                                "CN=Domain Admins,CN=Users,DC=corp,DC=local", "\\\\FS01\\Legal\\Contracts",
                                "OU=Workstations,DC=corp,DC=local", "dbo.Customers"};

std::string Base64(const std::string& in, bool wrap = true) {
  static const char* t = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
  std::string out;
  size_t line = 0;
  for (size_t i = 0; i < in.size(); i += 3) {
    const uint32_t n = (static_cast<unsigned char>(in[i]) << 16) |
                       (i + 1 < in.size() ? static_cast<unsigned char>(in[i + 1]) << 8 : 0) |
                       (i + 2 < in.size() ? static_cast<unsigned char>(in[i + 2]) : 0);
    out += t[(n >> 18) & 63];
    out += t[(n >> 12) & 63];
    out += i + 1 < in.size() ? t[(n >> 6) & 63] : '=';
    out += i + 2 < in.size() ? t[n & 63] : '=';
    if (wrap && (line += 4) >= 76) {
      out += "\r\n";
      line = 0;
    }
  }
  return wrap ? out + "\r\n" : out;
}

std::string QuotedPrintable(const std::string& in) {
  std::string out;
  size_t line = 0;
  for (char ch : in) {
    const auto c = static_cast<unsigned char>(ch);
    std::string piece;
    if (c == '\n') {
      out += "\r\n";
      line = 0;
      continue;
    }
    if (c == '\r') continue;
    if ((c >= 33 && c <= 126 && c != '=') || c == ' ') {
      piece = std::string(1, static_cast<char>(c));
    } else {
      char hex[4];
      std::snprintf(hex, sizeof hex, "=%02X", c);
      piece = hex;
    }
    if (line + piece.size() > 75) {
      out += "=\r\n";
      line = 0;
    }
    out += piece;
    line += piece.size();
  }
  return out + "\r\n";
}

// Names written as numeric character references, as the service writes them
// in some cells.
std::string NumericReferences(const std::string& text) {
  std::string out;
  for (unsigned char c : text) out += "&#" + std::to_string(c) + ";";
  return out;
}

struct Table {
  std::vector<std::string> headers;
  std::vector<std::vector<std::string>> rows;
};

std::string TableHtml(const Table& t) {
  std::string html = "<table border=\"1\" cellpadding=\"3\">\r\n<thead><tr>";
  for (const auto& h : t.headers) html += "<th>" + h + "</th>";
  html += "</tr></thead>\r\n<tbody>\r\n";
  for (const auto& row : t.rows) {
    html += "<tr>";
    for (const auto& cell : row) html += "<td>" + cell + "</td>";
    html += "</tr>\r\n";
  }
  return html + "</tbody>\r\n</table>\r\n";
}

std::string Page(const std::string& inner) {
  return "<html><head><meta http-equiv=\"Content-Type\" content=\"text/html; charset=utf-8\"></head>\r\n"
         "<body style=\"font-family:Segoe UI,Arial\">\r\n" +
         inner + "<p>This message was generated automatically. Do not reply.</p>\r\n</body></html>\r\n";
}

std::string DateHeader(std::mt19937& rng, uint32_t index) {
  static const char* days[] = {"Sun", "Mon", "Tue", "Wed", "Thu", "Fri", "Sat"};
  static const char* months[] = {"Jan", "Feb", "Mar", "Apr", "May", "Jun", "Jul", "Aug", "Sep", "Oct", "Nov", "Dec"};
  static const char* zones[] = {"+0000", "-0500", "+0100", "+0530", "-0800", "GMT"};
  const int month = static_cast<int>(rng() % 12), day = 1 + static_cast<int>(rng() % 28);
  char text[80];
  std::snprintf(text, sizeof text, "%s, %d %s 2026 %02d:%02d:%02d %s", days[(day + month) % 7], day, months[month],
                static_cast<int>(rng() % 24), static_cast<int>(rng() % 60), static_cast<int>(rng() % 60),
                zones[index % 6]);
  return text;
}

// Subject encodings: plain, RFC 2047 base64 in UTF-8, quoted-printable in Latin-1.
std::string EncodeSubject(const std::string& utf8, uint32_t index) {
  if (index % 5 == 1) {
    // Words of at most 45 bytes, never splitting a character, on folded lines.
    std::string out;
    size_t pos = 0;
    while (pos < utf8.size()) {
      size_t end = std::min(utf8.size(), pos + 45);
      while (end < utf8.size() && (static_cast<unsigned char>(utf8[end]) & 0xC0) == 0x80) --end;
      if (!out.empty()) out += "\r\n ";
      out += "=?UTF-8?B?" + Base64(utf8.substr(pos, end - pos), false) + "?=";
      pos = end;
    }
    return out;
  }
  if (index % 5 == 3) {
    // Latin-1 bytes: the generated texts use no character beyond U+00FF.
    std::string latin1;
    for (size_t i = 0; i < utf8.size(); ++i) {
      const auto c = static_cast<unsigned char>(utf8[i]);
      if ((c == 0xC2 || c == 0xC3) && i + 1 < utf8.size()) {
        latin1 += static_cast<char>(((c & 0x03) << 6) | (static_cast<unsigned char>(utf8[++i]) & 0x3F));
      } else {
        latin1 += static_cast<char>(c);
      }
    }
    std::string q;
    for (unsigned char c : latin1) {
      if (c == ' ') {
        q += '_';
      } else if (c >= 33 && c <= 126 && c != '?' && c != '=' && c != '_' && c != '"') {
        q += static_cast<char>(c);
      } else {
        char hex[4];
        std::snprintf(hex, sizeof hex, "=%02X", c);
        q += hex;
      }
    }
    return "=?iso-8859-1?Q?" + q + "?=";
  }
  return utf8;
}

}  // namespace

int RowsForSize(size_t bytes) { return bytes < 3000 ? 1 : static_cast<int>((bytes - 2500) / 260); }

GeneratedAlert GenerateAlert(uint32_t seed, uint32_t index, int rows, bool predefined_folder) {
  std::mt19937 rng(seed * 7919u + index);
  GeneratedAlert alert;
  // Callers often place files round-robin over a few folders; mixing the
  // index keeps every folder from getting one kind and one encoding only.
  const uint32_t mix = index + index / 6 + index / 36;
  const uint32_t variant = mix / 2;
  if (predefined_folder) {
    alert.kind = mix % 3 == 2 ? AlertKind::kDataLeakage : AlertKind::kPredefined;
  } else {
    static const AlertKind kinds[] = {AlertKind::kThreshold, AlertKind::kEmail, AlertKind::kScript};
    alert.kind = kinds[mix % 3];
  }
  const std::string server = kServers[rng() % 7];
  std::string subject, html, plain;

  auto activity_rows = [&](Table& t, bool with_component) {
    for (int r = 0; r < rows; ++r) {
      std::vector<std::string> row;
      const std::string user = kUsers[rng() % 8];
      row.push_back(r % 4 == 3 ? NumericReferences(user) : user);
      row.push_back(kOperations[rng() % 6]);
      row.push_back(kServers[rng() % 7]);
      if (with_component) row.push_back(r % 2 ? "File Server" : "Active Directory");
      row.push_back(kObjects[rng() % 6]);
      row.push_back("2026/06/" + std::to_string(10 + r % 18) + " 09:0" + std::to_string(r % 10) + ":00");
      t.rows.push_back(row);
    }
  };

  switch (alert.kind) {
    case AlertKind::kThreshold: {
      subject = "Threshold Alert: File Server Change \"Mass deletion of files\" (" + server +
                "(File Server)\\File Server Changes\\Daily)";
      Table t{{"Who", "Operation", "Server Name", "Object", "When"}, {}};
      activity_rows(t, false);
      html = Page("<p>More than 50 changes within 10 minutes were detected on <b>File Server(s).</b></p>\r\n" +
                  TableHtml(t));
      break;
    }
    case AlertKind::kEmail: {
      subject = "Email Alert: Group Membership Change \"Privileged group changed\" (" + server +
                "(Active Directory)\\All Environment Changes\\Hourly)";
      Table t{{"Who", "Operation", "Server Name", "Component Name", "Object", "When"}, {}};
      activity_rows(t, true);
      html = Page("<p>Changes were detected in <b>Active Directory.</b></p>\r\n" + TableHtml(t));
      break;
    }
    case AlertKind::kScript: {
      subject = "Script Execution Alert: Account Unlock \"Unlock locked accounts\" (" + server +
                "\\Account Lockout Report\\Daily)";
      const std::string who = kUsers[rng() % 8];
      std::string inner = "<p><b>Component Name  :</b>Active Directory</p>\r\n"
                          "<p><b>Report Name  :</b>Account Lockout Report</p>\r\n"
                          "<p><b>Who  :</b>" + NumericReferences(who) + "</p>\r\n";
      for (int r = 0; r < rows; ++r) inner += "<p>Script output line " + std::to_string(r) + ": account unlocked.</p>\r\n";
      html = Page(inner);
      break;
    }
    case AlertKind::kPredefined: {
      subject = "Account Lockout Alert:  \"Account Lockout Report\"";
      Table t{{"Who", "Operation", "Server", "Object", "When"}, {}};
      activity_rows(t, false);
      html = Page("<p>User accounts were locked out on <b>Domain Controller(s).</b></p>\r\n" + TableHtml(t));
      break;
    }
    case AlertKind::kDataLeakage: {
      subject = "Data Leakage Alert: Potential Data Leakage!";
      Table t{{"Recipient", "Attachment", "Size", "When"}, {}};
      for (int r = 0; r < rows; ++r) {
        t.rows.push_back({"partner" + std::to_string(r) + "@example.org", "Customer list " + std::to_string(r) + ".xlsx",
                          std::to_string(100 + r) + " KB", "2026/06/11 09:05:03"});
      }
      html = Page("<p>A mailbox sent many attachments to outside recipients.</p>\r\n" + TableHtml(t));
      break;
    }
  }
  if (variant % 4 == 3) subject += " r\xC3\xA9sum\xC3\xA9";  // non-ASCII text in the subject
  plain = "This alert is best read as HTML.\r\n" + subject + "\r\n";

  std::string m;
  m += "From: \"Alert Service\" <alerts@corp.example>\r\n";
  m += "To: security-team@corp.example\r\n";
  m += "Subject: " + EncodeSubject(subject, mix) + "\r\n";
  m += "Date: " + DateHeader(rng, index) + "\r\n";
  m += "Message-ID: <" + std::to_string(seed) + "." + std::to_string(index) + "@corp.example>\r\n";
  m += "MIME-Version: 1.0\r\n";
  const std::string boundary = "----=_NextPart_" + std::to_string(seed) + "_" + std::to_string(index);
  switch (mix % 4) {
    case 0:  // HTML only, quoted-printable
      m += "Content-Type: text/html; charset=\"utf-8\"\r\nContent-Transfer-Encoding: quoted-printable\r\n\r\n";
      m += QuotedPrintable(html);
      break;
    case 1:  // alternative, HTML in base64
    case 2:  // alternative, HTML in quoted-printable
      m += "Content-Type: multipart/alternative; boundary=\"" + boundary + "\"\r\n\r\n";
      m += "This is a multi-part message in MIME format.\r\n\r\n--" + boundary + "\r\n";
      m += "Content-Type: text/plain; charset=\"utf-8\"\r\nContent-Transfer-Encoding: 7bit\r\n\r\n" + plain + "\r\n";
      m += "--" + boundary + "\r\nContent-Type: text/html; charset=\"utf-8\"\r\n";
      if (mix % 4 == 1) {
        m += "Content-Transfer-Encoding: base64\r\n\r\n" + Base64(html);
      } else {
        m += "Content-Transfer-Encoding: quoted-printable\r\n\r\n" + QuotedPrintable(html);
      }
      m += "\r\n--" + boundary + "--\r\n";
      break;
    default: {  // mixed: alternative plus a CSV attachment
      const std::string inner = boundary + "_alt";
      m += "Content-Type: multipart/mixed; boundary=\"" + boundary + "\"\r\n\r\n--" + boundary + "\r\n";
      m += "Content-Type: multipart/alternative; boundary=\"" + inner + "\"\r\n\r\n--" + inner + "\r\n";
      m += "Content-Type: text/plain; charset=\"utf-8\"\r\n\r\n" + plain + "\r\n--" + inner + "\r\n";
      m += "Content-Type: text/html; charset=\"utf-8\"\r\nContent-Transfer-Encoding: base64\r\n\r\n" + Base64(html);
      m += "\r\n--" + inner + "--\r\n\r\n--" + boundary + "\r\n";
      m += "Content-Type: text/csv; name=\"details.csv\"\r\nContent-Disposition: attachment; filename=\"details.csv\"\r\n"
           "Content-Transfer-Encoding: base64\r\n\r\n" +
           Base64("Who,Operation\r\nCORP\\jsmith,Deleted\r\n") + "\r\n--" + boundary + "--\r\n";
      break;
    }
  }
  char name[48];
  std::snprintf(name, sizeof name, "Alert_%06u.eml", index);
  alert.file_name = name;
  alert.bytes = std::move(m);
  return alert;
}

}  // namespace asum::gen
