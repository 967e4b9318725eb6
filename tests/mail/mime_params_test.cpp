#include "mail/mime_params.h"

#include <gtest/gtest.h>

namespace asum::mail {
namespace {

TEST(MimeParameter, ReadsPlainAndRfc2231Forms) {
  struct Case {
    const char* value;
    const char* name;
    const char* expected;  // null: absent
  } cases[] = {
      {"text/plain; Name=\"a;b\\\"c\"; name=second", "name", "a;b\"c"},
      {"text/plain; name=plain.txt; name*=iso-8859-1'fr'caf%E9.txt", "name", "caf\xC3\xA9.txt"},
      {"text/plain; charset*=us-ascii'en'koi8-r", "charset", "koi8-r"},
      {"text/plain; name*1=\"b c\"; name*0*=utf-8''%E2%82%AC%20; name*2*=%2Epem", "name", "\xE2\x82\xAC b c.pem"},
      {"text/plain; name*0=a; name*2=c", "name", "a"},
      {"text/plain; name*1=b; name=fallback", "name", "fallback"},
      {"text/plain; name*=100%25%zz%4", "name", "100%%zz%4"},
      {"text/plain; filename*=utf-8''x", "name", nullptr},
      {"text/plain; name", "name", nullptr},
  };
  for (const Case& c : cases) {
    const std::optional<std::string> got = Parameter(c.value, c.name);
    EXPECT_EQ(got.value_or("(absent)"), c.expected ? c.expected : "(absent)") << c.value;
  }
}

}  // namespace
}  // namespace asum::mail
