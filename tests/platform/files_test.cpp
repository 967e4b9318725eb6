#include <gtest/gtest.h>

#ifdef _WIN32
#include <windows.h>
#endif

#include "platform/platform.h"
#include "support/test_support.h"

namespace asum {
namespace {

using platform::FileStatus;

TEST(PlatformFiles, MoveNeverReplacesAndReadRefusesFolders) {
  test::TempDir dir;
  platform::Env& env = platform::Current();
  const auto a = dir.Join(u"a.eml"), b = dir.Join(u"b.eml");
  test::WriteText(a, "a");
  test::WriteText(b, "b");
  EXPECT_EQ(env.RenameNoReplace(a, b).status, FileStatus::kAlreadyExists);
  EXPECT_EQ(test::ReadText(b), "b");
  EXPECT_TRUE(env.RenameNoReplace(a, dir.Join(u"PROC_a.eml")).ok());
  EXPECT_FALSE(env.PathExists(a));

  std::string bytes;
  test::MakeFolders(dir.Join(u"folder.eml"));
  EXPECT_FALSE(env.ReadFile(dir.Join(u"folder.eml"), &bytes, 1000).ok());
  EXPECT_EQ(env.ReadFile(b, &bytes, 0).status, FileStatus::kTooLarge);
  EXPECT_EQ(env.ReadFile(dir.Join(u"missing"), &bytes, 10).status, FileStatus::kNotFound);

  uint64_t size = 7;
  EXPECT_TRUE(env.FileSize(b, &size).ok());
  EXPECT_EQ(size, 1u);
  EXPECT_EQ(env.FileSize(dir.Join(u"folder.eml"), &size).status, FileStatus::kIsFolder);
  EXPECT_EQ(env.FileSize(dir.Join(u"missing"), &size).status, FileStatus::kNotFound);
}

TEST(PlatformFiles, ListFolderMatchesWildcardsIgnoringAsciiCase) {
  test::TempDir dir;
  for (const char16_t* name : {u"a.eml", u"b.EML", u"c.emlx", u"d.txt", u"eml"}) test::WriteText(dir.Join(name), "");
  std::vector<platform::DirEntry> entries;
  ASSERT_TRUE(platform::Current().ListFolder(dir.path(), u"*.eml*", &entries));
  EXPECT_EQ(entries.size(), 3u);
  ASSERT_TRUE(platform::Current().ListFolder(dir.path(), u"*.*", &entries));
  EXPECT_EQ(entries.size(), 5u) << "*.* matches names without a dot too";
  EXPECT_FALSE(platform::Current().ListFolder(dir.Join(u"missing"), u"*.*", &entries));
}

TEST(PlatformFiles, TheCollectorLockIsExclusiveAndSaysWhyItFailed) {
  test::TempDir dir;
  platform::Env& env = platform::Current();
  platform::FileResult failure;
  platform::FileLock first = env.TryLockFile(dir.Join(u"x.lock"), &failure);
  ASSERT_NE(first, nullptr);
  EXPECT_EQ(env.TryLockFile(dir.Join(u"x.lock"), &failure), nullptr);
  EXPECT_EQ(failure.status, FileStatus::kSharingViolation);
  env.UnlockFile(first);
  platform::FileLock again = env.TryLockFile(dir.Join(u"x.lock"), &failure);
  EXPECT_NE(again, nullptr);
  env.UnlockFile(again);
  // A folder in the lock file's place cannot be opened: not a held lock.
  test::MakeFolders(dir.Join(u"folder.lock"));
  EXPECT_EQ(env.TryLockFile(dir.Join(u"folder.lock"), &failure), nullptr);
  EXPECT_FALSE(failure.ok());
  EXPECT_NE(failure.status, FileStatus::kSharingViolation);
}

#ifdef _WIN32
// The service still writing a message holds it open for writing; the reader's
// open refuses writers, so the half-written file is left for the next cycle.
TEST(PlatformFiles, AFileHeldOpenForWritingIsNotRead) {
  test::TempDir dir;
  const auto path = dir.Join(u"a.eml");
  HANDLE writer = CreateFileW(reinterpret_cast<const wchar_t*>(path.c_str()), GENERIC_WRITE,
                              FILE_SHARE_READ | FILE_SHARE_WRITE, nullptr, CREATE_ALWAYS, FILE_ATTRIBUTE_NORMAL, nullptr);
  ASSERT_NE(writer, INVALID_HANDLE_VALUE);
  std::string bytes;
  EXPECT_EQ(platform::Current().ReadFile(path, &bytes, 1000).status, FileStatus::kSharingViolation);
  CloseHandle(writer);
  EXPECT_TRUE(platform::Current().ReadFile(path, &bytes, 1000).ok());
}
#endif

}  // namespace
}  // namespace asum
