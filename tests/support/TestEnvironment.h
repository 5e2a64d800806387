// Test support: every test program runs hermetically. Before the first test, the library's
// state directory, drive map and debugger output are pointed into a fresh temporary folder,
// so no test touches the user's files, registry store or event log.
#pragma once

#include <string>

namespace OwTest {

// The temporary folder of this test program (removed at exit).
const std::string& SandboxDirectory();

// A fresh, empty folder below the sandbox for one test.
std::string MakeTempDirectory(const std::string& prefix = "t");

// UTF-8 <-> UTF-16 for assertions and messages.
std::string Narrow(const std::u16string& text);
std::u16string Widen(const std::string& text);

}  // namespace OwTest
