// Helpers shared by the test programs: temporary folders, files, a log of the test's own.
#pragma once

#include <string>
#include <vector>

#include "platform/platform.h"

namespace asum::test {

// A fresh temporary folder, removed with all it holds when the object goes.
class TempDir {
 public:
  TempDir();
  ~TempDir();
  TempDir(const TempDir&) = delete;
  TempDir& operator=(const TempDir&) = delete;

  const std::u16string& path() const { return path_; }
  // `relative` may use '\' between elements.
  std::u16string Join(const std::u16string& relative) const;

 private:
  std::u16string path_;
};

// Creates every missing folder of `path`.
void MakeFolders(const std::u16string& path);
// Writes a file (creating its folders); fails the current test on error.
void WriteText(const std::u16string& path, const std::string& bytes);
std::string ReadText(const std::u16string& path);
void RemoveTree(const std::u16string& path);
// Names in a folder, sorted.
std::vector<std::u16string> ListNames(const std::u16string& folder);

// Points the diagnostic log at a temporary folder for the object's lifetime.
class CapturedLog {
 public:
  CapturedLog();
  ~CapturedLog();
  // The messages written so far, without timestamps, in order.
  std::vector<std::u16string> Messages() const;
  std::u16string folder() const { return dir_.path(); }

 private:
  TempDir dir_;
  std::u16string previous_;
};

std::string Narrow(std::u16string_view text);  // UTF-8, for messages
std::u16string U16(const std::string& utf8);

}  // namespace asum::test
