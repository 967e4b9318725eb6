// Message reader throughput (load plus the four getters) on generated alert
// messages, where the time goes, and the peak heap for one 50 MB message.
//
//   cmake --build build-mail --target bench_mail && ./build-mail/bench/bench_mail
#include <atomic>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <new>
#include <string>
#include <vector>

#include "common/utf.h"
#include "mail/ck_email.h"
#include "mail/transfer_decoding.h"

namespace {

// Live and peak heap bytes, counted by the replaced global operator new.
std::atomic<size_t> g_live{0};
std::atomic<size_t> g_peak{0};
constexpr size_t kHeader = 16;

void* CountedAlloc(size_t size) {
  void* block = std::malloc(size + kHeader);
  if (block == nullptr) throw std::bad_alloc();
  *static_cast<size_t*>(block) = size;
  const size_t live = g_live.fetch_add(size) + size;
  size_t peak = g_peak.load();
  while (live > peak && !g_peak.compare_exchange_weak(peak, live)) {
  }
  return static_cast<char*>(block) + kHeader;
}

void CountedFree(void* p) {
  if (p == nullptr) return;
  void* block = static_cast<char*>(p) - kHeader;
  g_live.fetch_sub(*static_cast<size_t*>(block));
  std::free(block);
}

}  // namespace

void* operator new(size_t size) { return CountedAlloc(size); }
void* operator new[](size_t size) { return CountedAlloc(size); }
void operator delete(void* p) noexcept { CountedFree(p); }
void operator delete[](void* p) noexcept { CountedFree(p); }
void operator delete(void* p, size_t) noexcept { CountedFree(p); }
void operator delete[](void* p, size_t) noexcept { CountedFree(p); }

namespace {

using Clock = std::chrono::steady_clock;
using asum::mail::ClsEmail;
using asum::mail::DateContext;

uint32_t g_seed = 2024;
uint32_t Next() {
  g_seed = g_seed * 1664525u + 1013904223u;
  return g_seed >> 8;
}

std::string Base64(const std::string& bytes) {
  static const char kAlphabet[] = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
  std::string out;
  size_t line = 0;
  for (size_t i = 0; i < bytes.size(); i += 3) {
    uint32_t v = static_cast<unsigned char>(bytes[i]) << 16;
    if (i + 1 < bytes.size()) v |= static_cast<unsigned char>(bytes[i + 1]) << 8;
    if (i + 2 < bytes.size()) v |= static_cast<unsigned char>(bytes[i + 2]);
    out.push_back(kAlphabet[(v >> 18) & 63]);
    out.push_back(kAlphabet[(v >> 12) & 63]);
    out.push_back(i + 1 < bytes.size() ? kAlphabet[(v >> 6) & 63] : '=');
    out.push_back(i + 2 < bytes.size() ? kAlphabet[v & 63] : '=');
    if ((line += 4) >= 76) {
      out += "\r\n";
      line = 0;
    }
  }
  return out;
}

std::string QuotedPrintable(const std::string& text) {
  std::string out;
  size_t line = 0;
  for (char c : text) {
    const auto u = static_cast<unsigned char>(c);
    if (c == '\n') {
      out += "\r\n";
      line = 0;
      continue;
    }
    if (u >= 0x80 || c == '=') {
      static const char kHex[] = "0123456789ABCDEF";
      out.push_back('=');
      out.push_back(kHex[u >> 4]);
      out.push_back(kHex[u & 15]);
      line += 3;
    } else {
      out.push_back(c);
      ++line;
    }
    if (line >= 72) {
      out += "=\r\n";
      line = 0;
    }
  }
  return out;
}

// An alert table of `rows` rows in HTML, and its plain-text twin.
void AlertBodies(int rows, std::string* html, std::string* plain) {
  *html = "<html><body><h2>Alert: Permission change detected</h2><table border=1>"
          "<tr><th>Who</th><th>Operation</th><th>Server</th><th>Object</th><th>When</th></tr>";
  *plain = "Alert: Permission change detected\n";
  for (int i = 0; i < rows; ++i) {
    const std::string who = "CORP\\user" + std::to_string(Next() % 900);
    const std::string server = "srv-" + std::to_string(Next() % 40) + ".corp.example.com";
    const std::string object = "\\\\fs01\\share\\Abteilung M\xC3\xBCller\\file" + std::to_string(Next() % 9999) + ".docx";
    *html += "<tr><td>" + who + "</td><td>Modify</td><td>" + server + "</td><td>" + object +
             "</td><td>2024-05-20 12:34:56</td></tr>";
    *plain += who + "\tModify\t" + server + "\t" + object + "\n";
  }
  *html += "</table></body></html>";
}

std::string AlertMessage(int rows, bool html_base64) {
  std::string html, plain;
  AlertBodies(rows, &html, &plain);
  std::string text =
      "From: \"Varnholt Alerts\" <alerts@corp.example.com>\r\n"
      "To: admins@corp.example.com\r\n"
      "Subject: =?utf-8?B?RW1haWwgQWxlcnQ6IFBlcm1pc3Npb24gY2hhbmdlIOKAkyBmczAx?=\r\n"
      "Date: Mon, 20 May 2024 12:34:56 +0200\r\n"
      "MIME-Version: 1.0\r\n"
      "Message-ID: <" + std::to_string(Next()) + "@corp.example.com>\r\n"
      "Content-Type: multipart/alternative;\r\n\tboundary=\"----=_Part_0_" + std::to_string(Next()) + "\"\r\n\r\n";
  const std::string boundary = text.substr(text.find("----=_Part_0_"), text.find('"', text.find("----=_Part_0_")) - text.find("----=_Part_0_"));
  text += "This is a multi-part message in MIME format.\r\n\r\n--" + boundary +
          "\r\nContent-Type: text/plain; charset=utf-8\r\nContent-Transfer-Encoding: quoted-printable\r\n\r\n" +
          QuotedPrintable(plain) + "\r\n--" + boundary + "\r\nContent-Type: text/html; charset=utf-8\r\n";
  if (html_base64) {
    text += "Content-Transfer-Encoding: base64\r\n\r\n" + Base64(html);
  } else {
    text += "Content-Transfer-Encoding: quoted-printable\r\n\r\n" + QuotedPrintable(html);
  }
  return text + "\r\n--" + boundary + "--\r\n";
}

size_t ReadAll(ClsEmail& email) {
  return email.FromAddress().size() + email.Subject().size() + email.Body().size() +
         email.LocalDate().day;
}

double Seconds(Clock::time_point a, Clock::time_point b) { return std::chrono::duration<double>(b - a).count(); }

}  // namespace

int main() {
  // 200 messages from about 5 to 50 KB, half with base64 HTML, half with
  // quoted-printable HTML.
  std::vector<std::string> messages;
  size_t total = 0;
  for (int i = 0; i < 200; ++i) {
    messages.push_back(AlertMessage(12 + (i * 7) % 120, i % 2 == 0));
    total += messages.back().size();
  }
  const DateContext context{0, asum::platform::SystemTime{2024, 5, 1, 20, 12, 0, 0, 0}};
  const int rounds = 20;
  volatile size_t sink = 0;
  double load_s = 0, get_s = 0;
  for (int r = 0; r < rounds; ++r) {
    for (const std::string& m : messages) {
      ClsEmail email;
      const auto t0 = Clock::now();
      email.LoadEmlFromMemory(m, context);
      const auto t1 = Clock::now();
      sink = sink + ReadAll(email);
      const auto t2 = Clock::now();
      load_s += Seconds(t0, t1);
      get_s += Seconds(t1, t2);
    }
  }
  const double mb = static_cast<double>(total) * rounds / 1e6;
  const double n = static_cast<double>(messages.size()) * rounds;
  std::printf("messages: %zu, %.1f KB average\n", messages.size(), total / 1024.0 / messages.size());
  std::printf("load + 4 getters: %.1f MB/s, %.0f messages/s\n", mb / (load_s + get_s), n / (load_s + get_s));
  std::printf("  load %.0f%%, getters %.0f%%\n", 100 * load_s / (load_s + get_s), 100 * get_s / (load_s + get_s));
  std::printf("SUMMARY mail | reader + 4 getters, MB/s | %.1f\n", mb / (load_s + get_s));

  // The pieces side by side on the same bytes, as a share of one pass.
  std::string encoded;
  for (const std::string& m : messages) encoded += m;
  auto time_of = [&](auto&& fn) {
    const auto t0 = Clock::now();
    for (int r = 0; r < 5; ++r) sink = sink + fn();
    return Seconds(t0, Clock::now()) / 5;
  };
  const double t_copy = time_of([&] { return std::string(encoded).size(); });
  const double t_b64 = time_of([&] { return asum::mail::DecodeBase64(encoded).size(); });
  const double t_qp = time_of([&] { return asum::mail::DecodeQuotedPrintable(encoded).size(); });
  const double t_u16 = time_of([&] { return asum::Utf8ToUtf16(encoded).size(); });
  const double t_all = (load_s + get_s) / rounds;
  std::printf("per pass over all messages: reader %.2f ms; copy %.2f ms (%.2fx), base64 %.2f ms (%.2fx), "
              "quoted-printable %.2f ms (%.2fx), UTF-8 to UTF-16 %.2f ms (%.2fx)\n",
              t_all * 1e3, t_copy * 1e3, t_copy / t_all, t_b64 * 1e3, t_b64 / t_all, t_qp * 1e3, t_qp / t_all,
              t_u16 * 1e3, t_u16 / t_all);

  // Peak heap for one 50 MB message, loaded from a file, with the getters.
  {
    std::string big = AlertMessage(160000, true);
    const std::filesystem::path path = std::filesystem::temp_directory_path() / "bench_mail_big.eml";
    const std::u16string wide_path = asum::Utf8ToUtf16(reinterpret_cast<const char*>(path.u8string().c_str()));
    asum::platform::Current().WriteFile(wide_path, big);
    const size_t size = big.size();
    std::string().swap(big);
    const size_t base = g_live.load();
    g_peak.store(base);
    const auto t0 = Clock::now();
    size_t got = 0;
    {
      asum::mail::CkEmail email;
      email.LoadEml(wide_path);
      asum::mail::CkString s;
      email.get_FromAddress(s);
      email.get_Subject(s);
      email.get_Body(s);
      got = s.text().size();
      asum::platform::SystemTime date;
      email.get_LocalDate(date);
    }
    const double secs = Seconds(t0, Clock::now());
    std::filesystem::remove(path);
    std::printf("one %.1f MB message: peak heap %.2fx its size, %.2f s, body %.1f M characters\n", size / 1e6,
                static_cast<double>(g_peak.load() - base) / size, secs, got / 1e6);
    std::printf("SUMMARY mail | peak heap / size, one %.0f MB message | %.2f\n", size / 1e6,
                static_cast<double>(g_peak.load() - base) / size);
  }
  return sink == 42 ? 1 : 0;
}
