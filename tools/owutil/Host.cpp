// The three host services owutil needs that the library does not offer: whether standard error
// is a terminal (for the progress display) and reading and setting environment variables (for
// the demo's sandbox). Kept here, alone, so that the rest of the tool stays free of system
// headers.
#include <cstdlib>
#include <string>

#if defined(_WIN32)
#include <io.h>
#else
#include <unistd.h>
#endif

namespace owutil {

bool StderrIsTerminal() {
#if defined(_WIN32)
  return _isatty(2) != 0;
#else
  return isatty(2) != 0;
#endif
}

bool SetEnvironmentVariable(const char* name, const std::string& value) {
#if defined(_WIN32)
  return _putenv_s(name, value.c_str()) == 0;
#else
  return setenv(name, value.c_str(), 1) == 0;
#endif
}

std::string GetEnvironmentVariable(const char* name) {
  const char* value = std::getenv(name);
  return value != nullptr ? std::string(value) : std::string();
}

}  // namespace owutil
