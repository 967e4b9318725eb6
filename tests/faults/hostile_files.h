// Hostile alert files, written at test time: malformed MIME, huge headers,
// deep nesting, binary junk, odd names, empty files, a folder with an alert's
// name, and (outside quick runs) a 100 MB message. Each comes with the end it
// must reach in a cycle.
#pragma once

#include <string>
#include <vector>

namespace asum::test {

enum class Expect {
  kStored,  // one row, PROC_ name
  kMarked,  // PROC_ name, no row
  kLeft,    // keeps its name (not loadable, or not an alert file at all)
};

struct HostileFile {
  std::u16string name;
  std::string bytes;
  Expect expect;
  bool is_folder = false;  // created as a folder of that name, bytes unused
};

// The hostile set; `huge` adds the 100 MB message.
std::vector<HostileFile> HostileFiles(bool huge);

// A well-formed script alert that the processing stores.
std::string PlainAlert(const std::string& who);

}  // namespace asum::test
