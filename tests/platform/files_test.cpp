#include <gtest/gtest.h>

#ifdef _WIN32
#include <windows.h>
#endif

#include <algorithm>
#include <filesystem>
#include <fstream>

#include "common/utf.h"
#include "platform/platform.h"
#include "support/test_support.h"

namespace asum {
namespace {

using platform::FileStatus;

// The status probe sees a holder, takes nothing and creates no lock file.
TEST(PlatformFiles, MoveNeverReplacesReadRefusesFoldersAndTheLockIsExclusive) {
  test::TempDir dir;
  platform::Env& env = platform::Current();
  const auto a = dir.Join(u"a.eml"), b = dir.Join(u"b.eml"), folder = dir.Join(u"folder.eml");
  test::WriteText(a, "a");
  test::WriteText(b, "b");
  test::MakeFolders(folder);
  EXPECT_EQ(env.RenameNoReplace(a, b).status, FileStatus::kAlreadyExists);
  EXPECT_TRUE(env.RenameNoReplace(a, dir.Join(u"PROC_a.eml")).ok());
  EXPECT_FALSE(env.PathExists(a));
  std::string bytes;
  uint64_t size = 7;
  EXPECT_FALSE(env.ReadFile(folder, &bytes, 1000).ok());
  EXPECT_EQ(env.ReadFile(b, &bytes, 0).status, FileStatus::kTooLarge);
  EXPECT_EQ(env.ReadFile(dir.Join(u"missing"), &bytes, 10).status, FileStatus::kNotFound);
  EXPECT_TRUE(env.FileSize(b, &size).ok() && size == 1u);
  EXPECT_EQ(env.FileSize(folder, &size).status, FileStatus::kIsFolder);
  EXPECT_EQ(env.FileSize(dir.Join(u"missing"), &size).status, FileStatus::kNotFound);

  const std::u16string lock = dir.Join(u"x.lock");
  platform::FileResult failure;
  EXPECT_FALSE(env.FileLockHeld(lock));
  EXPECT_FALSE(env.PathExists(lock));
  platform::FileLock first = env.TryLockFile(lock, &failure);
  ASSERT_NE(first, nullptr);
  EXPECT_EQ(env.TryLockFile(lock, &failure), nullptr);
  EXPECT_EQ(failure.status, FileStatus::kSharingViolation);
  EXPECT_TRUE(env.FileLockHeld(lock));
  env.UnlockFile(first);
  EXPECT_FALSE(env.FileLockHeld(lock));
  first = env.TryLockFile(lock, &failure);
  EXPECT_NE(first, nullptr) << "neither the probe nor the unlock left it taken";
  env.UnlockFile(first);
}

TEST(PlatformFiles, ListFolderMatchesWildcardsIgnoringAsciiCase) {
  test::TempDir dir;
  platform::Env& env = platform::Current();
  for (const char16_t* name :
       {u"a.eml", u"b.EML", u"c.emlx", u"d.txt", u"eml", u"PROC_e.eml", u"proc_f.eml", u"old PROC_g.eml"}) {
    test::WriteText(dir.Join(name), "");
  }
  test::MakeFolders(dir.Join(u"folder.eml"));
  std::vector<platform::DirEntry> entries;
  ASSERT_TRUE(env.ListFolder(dir.path(), u"*.*", &entries));
  EXPECT_EQ(entries.size(), 9u) << "*.* matches names without a dot too";
  EXPECT_FALSE(env.ListFolder(dir.Join(u"missing"), u"*.*", &entries));
  std::vector<std::u16string> files{u"kept"};
  ASSERT_TRUE(env.ListFiles(dir.path(), u"*.eml*", "PROC_", &files));
  std::sort(files.begin() + 1, files.end());
  EXPECT_EQ(files, (std::vector<std::u16string>{u"kept", dir.Join(u"a.eml"), dir.Join(u"b.EML"),
                                                dir.Join(u"c.emlx"), dir.Join(u"proc_f.eml")}))
      << "appends files only, and skips names holding PROC_ with case";
}

#ifndef _WIN32
// A name that is not UTF-8 is listed, read and renamed by its exact bytes, and
// shows each undecodable byte as U+FFFD; the UTF-8 form of an escape is no escape.
TEST(PlatformFiles, ANameThatIsNotUtf8GoesBackToTheSystemByteForByte) {
  test::TempDir dir;
  platform::Env& env = platform::Current();
  const std::string bytes = "caf\xe9\xf0\x9f\x98\x80\xed\xb3\xa9.eml";
  const std::filesystem::path folder(test::Narrow(dir.path()));
  std::ofstream(folder / bytes) << bytes;
  std::vector<std::u16string> files;
  ASSERT_TRUE(env.ListFiles(dir.path(), u"*.eml*", "PROC_", &files));
  ASSERT_EQ(files.size(), 1u);
  const std::u16string name = platform::NameOf(files[0]);
  EXPECT_EQ(DisplayText(name), u"caf\uFFFD\U0001F600\uFFFD\uFFFD\uFFFD.eml");
  std::string read;
  EXPECT_TRUE(env.ReadFile(files[0], &read, 100).ok() && read == bytes);
  EXPECT_TRUE(env.RenameNoReplace(files[0], dir.Join(u"PROC_" + name)).ok());
  EXPECT_TRUE(std::filesystem::exists(folder / ("PROC_" + bytes)));
}

// Linux keeps each settings key as a folder below the settings root and each
// string value as a file of UTF-8 text, which ends at its first NUL.
TEST(PlatformSettings, KeysAreFoldersAndValuesFilesOfText) {
  test::TempDir root;
  const std::u16string previous = platform::SettingsRoot();
  platform::SetSettingsRoot(root.path());
  platform::Env& env = platform::Env::Default();
  EXPECT_EQ(env.OpenKey(platform::Env::LocalMachine(), u"software"), nullptr);
  platform::SettingsKey key = env.CreateKey(platform::Env::LocalMachine(), u"software");
  ASSERT_NE(key, nullptr);
  test::WriteText(root.Join(u"software/v"), std::string("caf\xC3\xA9\0rest", 10));
  EXPECT_EQ(env.QueryStringValue(key, u"v"), u"caf\u00e9");
  EXPECT_EQ(env.QueryStringValue(key, u"missing"), std::nullopt);
  EXPECT_EQ(env.CreateKey(key, u".."), nullptr);
  env.CloseKey(key);
  platform::SetSettingsRoot(previous);
}
#endif

#ifdef _WIN32
// The service still writing a message holds it open for writing; the reader's
// open refuses writers, so the half-written file is left for the next cycle.
TEST(PlatformFiles, AFileHeldOpenForWritingIsNotRead) {
  test::TempDir dir;
  const auto path = dir.Join(u"a.eml");
  HANDLE writer = CreateFileW(reinterpret_cast<const wchar_t*>(path.c_str()), GENERIC_WRITE, FILE_SHARE_READ |
                              FILE_SHARE_WRITE, nullptr, CREATE_ALWAYS, FILE_ATTRIBUTE_NORMAL, nullptr);
  ASSERT_NE(writer, INVALID_HANDLE_VALUE);
  std::string bytes;
  EXPECT_EQ(platform::Current().ReadFile(path, &bytes, 1000).status, FileStatus::kSharingViolation);
  CloseHandle(writer);
  EXPECT_TRUE(platform::Current().ReadFile(path, &bytes, 1000).ok());
}
#endif

}  // namespace
}  // namespace asum
