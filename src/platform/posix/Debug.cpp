// POSIX backend: debugger output and message boxes go to standard error, a file, or nowhere.
#include "platform/Debug.h"

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <mutex>
#include <string>

#include "platform/posix/NativeText.h"

namespace Platform {
namespace {

std::mutex g_outputMutex;
OutputHook& Hook() {
  static OutputHook hook;
  return hook;
}

void WriteTo(const char* destination, const std::string& text) {
  if (std::strcmp(destination, "stderr") == 0) {
    std::fwrite(text.data(), 1, text.size(), stderr);
    std::fflush(stderr);
    return;
  }
  if (FILE* f = std::fopen(destination, "ae")) {
    std::fwrite(text.data(), 1, text.size(), f);
    std::fclose(f);
  }
}

}  // namespace

void OutputDebugStringW(const char16_t* text) noexcept {
  try {
    std::lock_guard<std::mutex> lock(g_outputMutex);
    if (Hook()) {
      Hook()("debug", text == nullptr ? std::u16string() : std::u16string(text));
      return;
    }
    const char* destination = std::getenv("OWUTILS_DEBUG_OUTPUT");
    if (destination == nullptr || *destination == 0) return;
    WriteTo(destination, Posix::ToUtf8(text));
  } catch (...) {
    // Debugger output is best effort: it never fails its caller.
  }
}

int MessageBoxW(HWND, const char16_t* text, const char16_t* caption, UINT) noexcept {
  try {
    std::lock_guard<std::mutex> lock(g_outputMutex);
    std::u16string whole = caption == nullptr ? u"" : caption;
    if (!whole.empty()) whole += u": ";
    if (text != nullptr) whole += text;
    if (Hook()) {
      Hook()("messagebox", whole);
      return kIdOk;
    }
    std::string line = Posix::ToUtf8(whole);
    line.push_back('\n');
    WriteTo("stderr", line);
  } catch (...) {
  }
  return kIdOk;
}

BOOL IsWindow(HWND) noexcept { return FALSE; }

void SetOutputHook(OutputHook hook) {
  std::lock_guard<std::mutex> lock(g_outputMutex);
  Hook() = std::move(hook);
}

}  // namespace Platform
