// Platform service: debugger output and message boxes.
//
// OutputDebugStringW has no debugger to talk to on POSIX: the text is dropped unless the
// environment variable OWUTILS_DEBUG_OUTPUT names "stderr" or a file path to append to (UTF-8).
// A message box writes its caption and text to standard error and answers IDOK. Tests capture
// both through SetDebugOutputHook.
#pragma once

#include <functional>
#include <string>

#include "owutils/WinTypes.h"

namespace Platform {

void OutputDebugStringW(const char16_t* text) noexcept;

constexpr UINT kMbIconHand = 0x10;
constexpr UINT kMbSystemModal = 0x1000;
constexpr int kIdOk = 1;
int MessageBoxW(HWND owner, const char16_t* text, const char16_t* caption, UINT type) noexcept;
// There are no windows here: every handle is denied.
BOOL IsWindow(HWND window) noexcept;

// Receives what OutputDebugStringW and MessageBoxW produce (kind "debug" or "messagebox"),
// instead of the normal destination; an empty function restores it. Process-wide; for tests.
using OutputHook = std::function<void(const char* kind, const std::u16string& text)>;
void SetOutputHook(OutputHook hook);

}  // namespace Platform
