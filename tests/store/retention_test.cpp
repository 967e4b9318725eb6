#include "store/retention.h"

#include <filesystem>
#include <fstream>
#include <map>
#include <set>
#ifdef _WIN32
#include <windows.h>
#else
#include <fcntl.h>
#include <linux/fs.h>
#include <sys/ioctl.h>
#include <unistd.h>
#endif

#include "store/alert_count.h"
#include "store/host_queries.h"
#include "store/retention_settings.h"
#include "store_test_support.h"

namespace asum {
namespace {

using Texts = std::vector<std::u16string>;

// Keeps everyone, root too, from writing a file while it lives: read-only
// permissions, and where they do not bind, the immutable attribute (Linux) or
// a handle that shares the file for reading alone (Windows).
class UnwritableFile {
 public:
  explicit UnwritableFile(const std::u16string& path) : path_(path) {
    std::filesystem::permissions(path_, std::filesystem::perms::owner_read);
    if (!Unwritable()) locked_out_ = LockOut(true);
  }
  ~UnwritableFile() {
    if (locked_out_) LockOut(false);
    std::filesystem::permissions(path_, std::filesystem::perms::owner_all);
  }
  bool Unwritable() const { return !std::ofstream(path_, std::ios::app).good(); }

 private:
  bool LockOut(bool on) {
#ifdef _WIN32
    if (!on) return CloseHandle(handle_);
    handle_ = CreateFileW(path_.c_str(), GENERIC_READ, FILE_SHARE_READ, nullptr, OPEN_EXISTING, 0, nullptr);
    return handle_ != INVALID_HANDLE_VALUE;
#else
    const int fd = ::open(path_.c_str(), O_RDONLY);
    int flags = 0;
    bool ok = fd >= 0 && ::ioctl(fd, FS_IOC_GETFLAGS, &flags) == 0;
    flags = on ? flags | FS_IMMUTABLE_FL : flags & ~FS_IMMUTABLE_FL;
    ok = ok && ::ioctl(fd, FS_IOC_SETFLAGS, &flags) == 0;
    if (fd >= 0) ::close(fd);
    return ok;
#endif
  }
  std::filesystem::path path_;
  bool locked_out_ = false;
  void* handle_ = nullptr;
};

TEST(RetentionDays, ReadsTheNumberAsWcstolDoes) {
  const std::pair<std::u16string, int32_t> cases[] = {
      {u"15 Days", 15}, {u"30", 30}, {u"7Days", 7}, {u"1 Day", 1}, {u"-5 Days", -5}, {u"Days", 0}, {u"", 0},
      {u"  +12", 12}, {u"abc 3", 0}, {u"3 Days4 Days", 34}, {u"99999999999 Days", INT32_MAX},
  };
  for (const auto& [text, days] : cases) EXPECT_EQ(RetentionDays(text), days) << test::Narrow(text);
}

TEST(CutoffText, MidnightOfTheDayCountedBack) {
  const struct {
    platform::SystemTime now;
    int32_t days;
    std::u16string cutoff;
  } cases[] = {
      {{2024, 3, 3, 20, 13, 45}, 15, u"2024/03/05 00:00:00"}, {{2024, 3, 3, 20}, 0, u"2024/03/20 00:00:00"},
      {{2024, 3, 3, 20}, -5, u"2024/03/25 00:00:00"},         {{2024, 3, 5, 1}, 1, u"2024/02/29 00:00:00"},
      {{2023, 3, 3, 1}, 1, u"2023/02/28 00:00:00"},           {{2024, 1, 5, 5}, 10, u"2023/12/26 00:00:00"},
      {{100, 1, 6, 2}, 1, u"100/01/01 00:00:00"},             {{100, 1, 5, 1}, 1, u"-1/-1/-1 00:00:00"},
      {{9999, 12, 5, 31}, -1, u"-1/-1/-1 00:00:00"},          {{2024, 3, 3, 20}, INT32_MIN, u"-1/-1/-1 00:00:00"},
      {{2024, 0, 0, 0}, 1, u"-1/-1/-1 00:00:00"},  // a clock that gives no date
  };
  for (const auto& c : cases) EXPECT_EQ(CutoffText(c.now, c.days), c.cutoff) << c.now.year << " " << c.days;
}

// Today is 2024-03-20 13:45; the settings are a registry in memory whose keys
// are paths below HKEY_LOCAL_MACHINE ("software\Varnholt Suite"), a value at
// its key's path, "\" and its name.
class HostEnv : public platform::Env {
 public:
  std::u16string executable;
  std::set<std::u16string> keys = {u"software"};
  std::map<std::u16string, std::u16string> values;
  int open_keys = 0;

  // Where the host writes a retention setting; null removes it.
  void SetSetting(const std::u16string& name, const char16_t* value) {
    const std::u16string path = u"software\\Varnholt Suite\\Varnholt Suite\\" + name + u"\\" + name;
    value ? void(values[path] = value) : void(values.erase(path));
  }
  platform::SystemTime LocalNow() override { return {2024, 3, 3, 20, 13, 45, 0, 0}; }
  std::u16string ExecutablePath() override { return executable; }
  using Key = platform::SettingsKey;
  static std::u16string Path(Key parent, const std::u16string& name) {
    return parent == LocalMachine() ? name : *static_cast<std::u16string*>(parent) + u"\\" + name;
  }
  Key OpenKey(Key parent, const std::u16string& name) override {
    return keys.count(Path(parent, name)) ? CreateKey(parent, name) : nullptr;
  }
  Key OpenKeyForReading(Key parent, const std::u16string& name) override { return OpenKey(parent, name); }
  Key CreateKey(Key parent, const std::u16string& name) override {
    return ++open_keys, new std::u16string(*keys.insert(Path(parent, name)).first);
  }
  std::optional<std::u16string> QueryStringValue(Key key, const std::u16string& name) override {
    const auto found = values.find(Path(key, name));
    return found == values.end() ? std::nullopt : std::optional(found->second);
  }
  void CloseKey(Key key) override {
    if (key != LocalMachine()) --open_keys, delete static_cast<std::u16string*>(key);
  }
};

// The host's database beside its executable, and its settings.
class RetentionTest : public ::testing::Test {
 protected:
  void SetUp() override {
    env_.executable = dir_.install() + platform::kPathSeparator + u"host.exe";
    Reset();
  }
  void Reset() {
    dir_.Create();
    test::RawConnection(dir_.db_path()).Exec("DELETE FROM AlertDB");
    std::vector<std::array<std::u16string, 3>> rows;
    for (const auto& when : kWhens) rows.push_back({u"a", u"t", when});
    dir_.Create(rows);
  }
  const Texts kWhens = {u"2024/03/04 23:59:59", u"2024/03/05 00:00:00", u"2024/03/05 00:00:01",
                        u"-1/-1/-1 -1:-1:-1",  u"2024/03/20 00:00:00", u"2024/03/20 08:00:00"};
  HostEnv env_;
  platform::ScopedEnv scoped_{&env_};
  test::StoreDir dir_;
};

// "Sch_Retention" must be exactly "TRUE"; "Sch_Retention_Val" (default
// "15 Days") counts back from today. Reading creates the keys on the way,
// and closes every key it opened.
TEST_F(RetentionTest, SettingsDecideWhatStays) {
  const auto& w = kWhens;
  const struct {
    const char16_t *on, *days;
    Texts left;
  } cases[] = {
      {u"TRUE", nullptr, {w[2], w[4], w[5]}}, {u"TRUE", u"15 Days", {w[2], w[4], w[5]}}, {u"TRUE", u"0 Days", {w[5]}},
      {u"TRUE", u"no digits", {w[5]}},        {u"TRUE", u"-5 Days", {}},
      {u"TRUE", u"99999999 Days", {w[0], w[1], w[2], w[4], w[5]}},  // cut-off -1/-1/-1 00:00:00
      {nullptr, u"-5 Days", w}, {u"", u"-5 Days", w}, {u"true", u"-5 Days", w}, {u"TRUE ", u"-5 Days", w},
  };
  for (const auto& c : cases) {
    Reset();
    env_.SetSetting(u"Sch_Retention", c.on);
    env_.SetSetting(u"Sch_Retention_Val", c.days);
    const std::string name = test::Narrow(c.on ? c.on : u"-") + " " + test::Narrow(c.days ? c.days : u"-");
    EXPECT_EQ(RunRetentionForHost(), c.left == w ? 0 : 1) << name;
    EXPECT_EQ(dir_.Column(), c.left) << name;
  }
  const std::u16string suite = u"software\\Varnholt Suite\\Varnholt Suite";
  EXPECT_EQ(env_.keys, (std::set<std::u16string>{u"software", u"software\\Varnholt Suite", suite,
                                                 suite + u"\\Sch_Retention", suite + u"\\Sch_Retention_Val"}));
  EXPECT_EQ(env_.open_keys, 0);
  env_.keys.clear();  // no "software": nothing is created, and the default leaves the purge off
  EXPECT_EQ(RunRetentionForHost(), 0);
  EXPECT_TRUE(env_.keys.empty());
}

// The support tool's status reads the settings where a person may only read:
// it finds what the purge finds, and creates no key on the way.
TEST_F(RetentionTest, ReadingForStatusCreatesNoKey) {
  const std::u16string suite = u"software\\Varnholt Suite\\Varnholt Suite";
  EXPECT_EQ(ReadRetentionSetting(u"Sch_Retention_Val", u"15 Days"), u"15 Days");
  EXPECT_EQ(env_.keys, std::set<std::u16string>{u"software"});
  env_.keys.insert({u"software\\Varnholt Suite", suite, suite + u"\\Sch_Retention_Val"});
  for (const char16_t* value : {u"30 Days", u""}) {
    env_.SetSetting(u"Sch_Retention_Val", value);
    EXPECT_EQ(ReadRetentionSetting(u"Sch_Retention_Val", u"15 Days"), value);
    EXPECT_EQ(GetRetentionSetting(u"Sch_Retention_Val", u"15 Days"), value);
  }
  EXPECT_EQ(env_.open_keys, 0);
}

// No database yet: created with its table; an empty file: given the table;
// a missing folder, a database locked past the allowance or one nobody may
// write (counted still): 0, rows kept.
TEST_F(RetentionTest, PurgeOfAnUnusableDatabaseGivesZeroAndKeepsTheRows) {
  env_.SetSetting(u"Sch_Retention", u"TRUE");
  test::StoreDir fresh, empty;
  test::WriteText(empty.db_path(), "");
  EXPECT_EQ(RunRetentionProc(fresh.install()) + RunRetentionProc(empty.install()), 2);
  EXPECT_EQ(RunRetentionProc(fresh.install() + platform::NativeSeparators(u"\\no\\such")), 0);
  test::RawConnection other(dir_.db_path());
  ASSERT_EQ(other.Exec("BEGIN EXCLUSIVE"), SQLITE_OK);
  EXPECT_EQ(RunRetentionProc(dir_.install(), 20), 0);
  other.Exec("ROLLBACK");
  EXPECT_EQ(dir_.Column().size(), kWhens.size());
  UnwritableFile file(dir_.db_path());
  if (!file.Unwritable()) {
    GTEST_SKIP() << "neither read-only permissions nor the immutable attribute keep this user from writing here "
                    "(chattr +i needs root and a file system that keeps it: ext2/3/4, XFS or Btrfs)";
  }
  EXPECT_EQ(CountAlerts(dir_.install(), u"", u"</FROM>"), 6) << "a read-only database is still counted";
  EXPECT_EQ(RunRetentionProc(dir_.install(), 20), 0);
  EXPECT_EQ(dir_.Column().size(), kWhens.size());
}

TEST_F(RetentionTest, HostQueriesUseTheDatabaseBesideTheHost) {
  EXPECT_EQ(CountForHost(u"", u"</FROM>"), 6);
  EXPECT_EQ(CountForHost(u"t", u"<TO>2024/03/05 00:00:00</FROM><TO>2024/03/20 00:00:00</TO>"), 3);
  EXPECT_EQ(CountForHost(u"</FROM>", u"t"), 0) << "swapped arguments are another request";
}

}  // namespace
}  // namespace asum
