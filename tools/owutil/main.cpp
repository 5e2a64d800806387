// owutil: the command-line face of the OWUtils library.
#include <cstdio>
#include <cstring>
#include <string>

#include "owutils/Exceptions.h"
#include "owutils/tstring.h"

namespace {

std::string Utf8(const Lumo::String& text) { return std::string(text.ToUtf8().Get()); }

int Demo() {
  std::printf("OWUtils demo\n");
  Lumo::String text;
  text.Format(u"%s formats UTF-16 text: %d units, %.2f%%, 0x%08lX", u"Lumo::String", 42, 99.5, 0xBEEFu);
  std::printf("  strings     : %s\n", Utf8(text).c_str());
  try {
    try {
      PRECONDITION(text.empty());
    } catch (LumoException::Exception& e) {
      THROW_AT(UnableToOpenFile(u"C:\\data\\report.txt", e));
    }
  } catch (LumoException::Exception& e) {
    std::printf("  exceptions  : %s (root cause %s)\n", Utf8(e.GetMessage()).c_str(), Utf8(e.GetRootCauseId()).c_str());
    std::printf("%s", Utf8(e.ToString()).c_str());
  }
  return 0;
}

void Usage(FILE* out) {
  std::fprintf(out,
               "usage: owutil <command>\n"
               "commands:\n"
               "  demo    run the library's main job end to end and print each step\n");
}

}  // namespace

int main(int argc, char** argv) {
  if (argc >= 2 && std::strcmp(argv[1], "demo") == 0) return Demo();
  if (argc >= 2 && (std::strcmp(argv[1], "--help") == 0 || std::strcmp(argv[1], "-h") == 0)) {
    Usage(stdout);
    return 0;
  }
  Usage(stderr);
  return 2;
}
