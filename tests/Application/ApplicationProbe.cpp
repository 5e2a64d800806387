// A host program for the Application tests: prints, one per line, what the library reports
// about its own module and the command line (UTF-8).
#include <cstdio>
#include <string>

#include "owutils/Application.h"
#include "owutils/Exceptions.h"

namespace {
void Print(const CString& text) {
  std::string out;
  for (char16_t c : text.str()) out += c < 0x80 ? static_cast<char>(c) : '?';
  std::printf("%s\n", out.c_str());
}
}  // namespace

int main() {
  try {
    Print(Application::GetModuleLongDirectory(nullptr));
    Print(Application::GetModuleLongName(nullptr));
    Print(Application::GetModulePath(nullptr));
    Print(Application::GetCommandLineArguments());
    return 0;
  } catch (LumoException::Exception& e) {
    Print(e.ToString());
    return 1;
  }
}
