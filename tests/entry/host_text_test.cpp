#include "entry/host_text.h"

#include <gtest/gtest.h>

#include "store/setting_db_management.h"
#include "support/test_support.h"

namespace asum {
namespace {

TEST(HostText, ReadsWideTextsOfThisPlatform) {
  EXPECT_EQ(HostText(nullptr), u"");
  EXPECT_EQ(HostText(L""), u"");
  EXPECT_EQ(HostText(L"Email Alert"), u"Email Alert");
  EXPECT_EQ(HostText(L"caf\u00e9 \U0001F600"), u"caf\u00e9 \U0001F600");
}

// The host of this test lives in a folder of its own.
class HostIn : public platform::Env {
 public:
  explicit HostIn(std::u16string exe) : exe_(std::move(exe)) {}
  std::u16string ExecutablePath() override { return exe_; }

 private:
  std::u16string exe_;
};

// The count export's body hands the filter and the range on in that order.
TEST(GetAlertCountForHost, PassesTheFilterThenTheRange) {
  test::TempDir dir;
  HostIn host(dir.Join(u"host.exe"));
  platform::ScopedEnv scope(&host);
  CSettingDBManagement store;
  ASSERT_TRUE(store.OpenDB(DatabasePathOf(dir.path())));
  AlertRow row;
  row.alert_action = u"Email Alert";
  row.when = u"2024/03/05 10:00:00";
  ASSERT_TRUE(store.FillDatainDB(row));
  store.CloseDB();
  const wchar_t* range = L"<FROM>2024/03/01 00:00:00</FROM><TO>2024/03/31 23:59:59</TO>";
  EXPECT_EQ(GetAlertCountForHost(L"Email Alert", range), 1);
  EXPECT_EQ(GetAlertCountForHost(range, L"Email Alert"), 0);
}

}  // namespace
}  // namespace asum
