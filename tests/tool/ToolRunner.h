// Runs the built owutil as a child process and collects what it did.
//
// The child inherits the test program's hermetic environment (state directory and drive map in
// the test's sandbox, see support/TestEnvironment.h); `env` adds or replaces variables for one
// run. Standard input is fed from `input`; standard output and error are captured separately,
// or standard error is attached to a pseudo-terminal when `stderrTerminal` is set.
#pragma once

#include <map>
#include <string>
#include <vector>

namespace OwTest {

struct ToolResult {
  int status = -1;  // exit status, or -1 when the child did not exit normally
  std::string out;
  std::string err;
};

struct ToolRun {
  std::vector<std::string> args;
  std::string input;
  std::map<std::string, std::string> env;
  bool stderrTerminal = false;
};

ToolResult RunTool(const ToolRun& run);
ToolResult RunTool(std::vector<std::string> args, std::string input = std::string());

// The test's drive map plus Z: for the whole file system, so that the library can name its own
// folder (and find its resource modules beside it) while C: stays in the sandbox.
std::map<std::string, std::string> WithLibraryDrive(std::map<std::string, std::string> env = {});

// Files in the test's own temporary folder.
std::string WriteFile(const std::string& path, const std::string& content);
std::string ReadFile(const std::string& path);

}  // namespace OwTest

