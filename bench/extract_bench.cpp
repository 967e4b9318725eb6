// Extraction time against body size: an alert table of 1, 4 and 16 times a
// base number of rows, plus two hostile bodies (many table closings before one
// opening; rows that never close a cell), each read the way the alert file
// processing reads a body: component, then one table scan per field name.
// Time must grow linearly: each quadrupling about 4x, each doubling about 2x.
//
//   bench_extract [base_rows]     (default 2000)
#include <algorithm>
#include <chrono>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <string>

#include "extract/body_fields.h"
#include "extract/html_table.h"
#include "extract/subject.h"
#include "platform/platform.h"

namespace {

using asum::ParseHtmlBodyAndGetFieldData;

std::u16string Number(int n) {
  const std::string text = std::to_string(n);
  return std::u16string(text.begin(), text.end());
}

std::u16string AlertBody(int rows) {
  std::u16string body =
      u"<html><body><p>An alert was raised on <b>File Server(s).</b></p>"
      u"<table><tr><th>Who</th><th>Operation</th><th>Server Name</th><th>File Server</th>"
      u"<th>Object</th><th>When</th></tr><tbody>";
  for (int i = 0; i < rows; ++i) {
    body += u"<tr><td>CORP\\user" + Number(i % 37) + u"</td><td>Delete</td><td>SRV" + Number(i % 5) +
            u"</td><td>&#70;&#83;&#" + Number(48 + i % 10) + u";</td><td><p>&nbsp;</p></td><td>2024/05/0" +
            Number(1 + i % 9) + u" 10:00:00</td></tr>";
  }
  return body + u"</tbody></table></body></html>";
}

std::u16string ClosingsBody(int rows) {
  std::u16string body;
  for (int i = 0; i < rows * 10; ++i) body += u"</table></th></tr>";
  return body + u"<table";
}

std::u16string OpenCellsBody(int rows) {
  std::u16string body = u"<table><tbody>";
  for (int i = 0; i < rows * 10; ++i) body += u"<tr><td>never closed <p>&nbsp;</p>&#";
  return body + u"</td></tr>";
}

double Seconds(const std::u16string& body) {
  const auto start = std::chrono::steady_clock::now();
  std::size_t sink = 0;
  std::u16string action, threshold, type, name, component, server, category;
  asum::GetSomeInfoFromScriptSubject(
      u"Email Alert: File Access \"Deleted Files\" (FS01(File Server)\\Reports\\Deletions\\x)", action,
      threshold, type, name, component, server, category);
  sink += asum::ParseHtmlBodyToGetComponentInfo(body, action).size();
  for (const char16_t* field : {u"Server", u"Component Name", u"Server Name", u"Who", u"Operation"}) {
    sink += ParseHtmlBodyAndGetFieldData(body, field).size();
  }
  const auto end = std::chrono::steady_clock::now();
  if (sink == 1) std::puts("");  // keeps the work observable
  return std::chrono::duration<double>(end - start).count();
}

// Best of a few runs: the machines are shared and noisy.
double BestSeconds(const std::u16string& body) {
  double best = 1e9;
  for (int run = 0; run < 3; ++run) best = std::min(best, Seconds(body));
  return best;
}

void Series(const char* title, std::u16string (*make)(int), int base) {
  double times[3];
  const int factors[3] = {1, 4, 16};
  std::printf("%s\n", title);
  for (int i = 0; i < 3; ++i) {
    const std::u16string body = make(base * factors[i]);
    times[i] = BestSeconds(body);
    std::printf("  %2dx  %9zu code units  %9.3f ms\n", factors[i], body.size(), times[i] * 1e3);
  }
  const double r4 = times[1] / times[0];
  const double r16 = times[2] / times[1];
  std::printf("  ratio 4x/1x = %.2f, 16x/4x = %.2f (linear: 4.00); per doubling %.2f and %.2f\n", r4, r16,
              std::sqrt(r4), std::sqrt(r16));
  std::printf("SUMMARY extract | %s: time 16x/4x (linear 4.00) | %.2f\n", title, r16);
}

}  // namespace

int main(int argc, char** argv) {
  // The diagnostic log stays off: its folder does not exist.
  asum::platform::SetLogFolder(u"no-such-folder-for-the-bench");
  const int base = argc > 1 ? std::max(1, std::atoi(argv[1])) : 2000;
  std::printf("base: %d rows\n", base);
  Series("alert table", AlertBody, base);
  Series("closings before one opening", ClosingsBody, base);
  Series("cells never closed", OpenCellsBody, base);
  return 0;
}
