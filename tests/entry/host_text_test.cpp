#include "entry/host_text.h"

#include <gtest/gtest.h>

namespace asum {
namespace {

TEST(HostText, ReadsWideTextsOfThisPlatform) {
  EXPECT_EQ(HostText(nullptr), u"");
  EXPECT_EQ(HostText(L""), u"");
  EXPECT_EQ(HostText(L"Email Alert"), u"Email Alert");
  EXPECT_EQ(HostText(L"caf\u00e9 \U0001F600"), u"caf\u00e9 \U0001F600");
}

}  // namespace
}  // namespace asum
