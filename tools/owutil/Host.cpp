// The host services owutil needs beside the library's own work: whether standard error is a
// terminal (for the progress display) and the environment variables of the demo's sandbox.
#include <string>

#include "Cli.h"
#include "owutils/Environment.h"

namespace owutil {

bool StderrIsTerminal() { return Platform::IsConsoleStream(STD_ERROR_HANDLE) != FALSE; }

bool SetEnvironmentVariable(const char* name, const std::string& value) {
  return Platform::SetEnvironmentVariableW(Wide(name, "NAME").c_str(), Wide(value, "VALUE").c_str()) != FALSE;
}

std::string GetEnvironmentVariable(const char* name) {
  const Lumo::String wideName = Wide(name, "NAME");
  const DWORD size = Platform::GetEnvironmentVariableW(wideName.c_str(), nullptr, 0);
  if (size == 0) return std::string();
  Lumo::String value(size, u'\0');
  const DWORD length = Platform::GetEnvironmentVariableW(wideName.c_str(), value.data(), size);
  value.resize(length < size ? length : 0);
  return Utf8(value);
}

}  // namespace owutil
