// Writes realistic alert messages as the alerting service saves them: the
// kinds of alert it sends (threshold, e-mail, script, predefined and
// data-leakage alerts), with HTML tables, multipart/alternative bodies,
// base64 and quoted-printable parts and encoded subjects.
//
// Deterministic: the same seed and index give the same message. Used by the
// example install folder, the benchmarks and the tests.
#pragma once

#include <cstdint>
#include <string>

namespace asum::gen {

enum class AlertKind {
  kThreshold,        // general folder, "Threshold Alert: ..."
  kEmail,            // general folder, an activity report
  kScript,           // general folder, "Script Execution Alert: ..."
  kPredefined,       // "Predefine Alerts" folder, account lockout
  kDataLeakage,      // "Predefine Alerts" folder, potential data leakage
};

struct GeneratedAlert {
  AlertKind kind;
  std::string file_name;  // e.g. "Alert_000042.eml"
  std::string bytes;      // the whole message
};

// `index` picks the kind and encodings in a fixed rotation; `rows` is the
// number of data rows of the HTML table (more rows, larger message).
GeneratedAlert GenerateAlert(uint32_t seed, uint32_t index, int rows, bool predefined_folder);

// Rows that make a message of about `bytes` bytes.
int RowsForSize(size_t bytes);

}  // namespace asum::gen
