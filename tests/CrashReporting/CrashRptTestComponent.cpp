// A stand-in crash-reporting component for the tests. It exports the five calls the library
// looks up and records every call, one line each, in the file named by the environment variable
// OWTEST_CRASHRPT_LOG (UTF-8; nothing is recorded without it). Its answers are set by the
// environment too:
//   OWTEST_CRASHRPT_INSTALL_RESULT   crInstallW's result (default 0, installed)
//   OWTEST_CRASHRPT_ERROR            crGetLastErrorMsgW's text (default "no error")
//   OWTEST_CRASHRPT_PROPERTY_RESULT  crAddPropertyW's result (default 0, added)
// Built with OWTEST_CRASHRPT_WITHOUT_ADD_PROPERTY it lacks crAddPropertyW, as a broken
// component would.
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>

#include "owutils/LmCrashReporting.h"

#define OWTEST_EXPORT extern "C" __attribute__((visibility("default")))

namespace {

std::string Utf8(const char16_t* text) {
  if (text == nullptr) return "(null)";
  std::string out;
  for (const char16_t* p = text; *p != 0; ++p) {
    char32_t c = *p;
    if (c >= 0xD800 && c <= 0xDBFF && p[1] >= 0xDC00 && p[1] <= 0xDFFF) {
      c = 0x10000 + ((c - 0xD800) << 10) + (p[1] - 0xDC00);
      ++p;
    }
    if (c < 0x80) {
      out += static_cast<char>(c);
    } else if (c < 0x800) {
      out += static_cast<char>(0xC0 | (c >> 6));
      out += static_cast<char>(0x80 | (c & 0x3F));
    } else if (c < 0x10000) {
      out += static_cast<char>(0xE0 | (c >> 12));
      out += static_cast<char>(0x80 | ((c >> 6) & 0x3F));
      out += static_cast<char>(0x80 | (c & 0x3F));
    } else {
      out += static_cast<char>(0xF0 | (c >> 18));
      out += static_cast<char>(0x80 | ((c >> 12) & 0x3F));
      out += static_cast<char>(0x80 | ((c >> 6) & 0x3F));
      out += static_cast<char>(0x80 | (c & 0x3F));
    }
  }
  return out;
}

void Record(const std::string& line) {
  const char* path = std::getenv("OWTEST_CRASHRPT_LOG");
  if (path == nullptr) return;
  if (std::FILE* file = std::fopen(path, "a")) {
    std::fputs(line.c_str(), file);
    std::fputc('\n', file);
    std::fclose(file);
  }
}

int EnvInt(const char* name) {
  const char* value = std::getenv(name);
  return value != nullptr ? std::atoi(value) : 0;
}

bool AllZero(const void* data, size_t size) {
  const auto* bytes = static_cast<const unsigned char*>(data);
  for (size_t i = 0; i < size; ++i) {
    if (bytes[i] != 0) return false;
  }
  return true;
}

}  // namespace

OWTEST_EXPORT int crInstallW(const LmCrashInstallInfo* info) {
  if (info == nullptr) {
    Record("crInstallW (null)");
    return 1;
  }
  char numbers[256];
  std::snprintf(numbers, sizeof numbers, " callback=%s prio=%d,%d,%d,%d,%d flags=0x%X dump=%lu",
                info->pfnCrashCallback != nullptr ? "set" : "null", static_cast<int>(info->uPriorities[0]),
                static_cast<int>(info->uPriorities[1]), static_cast<int>(info->uPriorities[2]),
                static_cast<int>(info->uPriorities[3]), static_cast<int>(info->uPriorities[4]),
                static_cast<unsigned>(info->dwFlags), static_cast<unsigned long>(info->uMiniDumpType));
  // The fields the library leaves alone must all be zero.
  const bool othersZero = info->pszEmailTo == nullptr && info->pszEmailSubject == nullptr &&
                          info->pszCrashSenderPath == nullptr && info->pszPrivacyPolicyURL == nullptr &&
                          info->pszDebugHelpDLL == nullptr && info->pszErrorReportSaveDir == nullptr &&
                          info->pszRestartCmdLine == nullptr && AllZero(info->apvReserved, sizeof info->apvReserved);
  Record("crInstallW cb=" + std::to_string(info->cb) + " app=" + Utf8(info->pszAppName) +
         " version=" + Utf8(info->pszAppVersion) + " url=" + Utf8(info->pszUrl) + numbers +
         " others=" + (othersZero ? "zero" : "SET") + " lang=" + Utf8(info->pszLangFilePath));
  if (info->pfnCrashCallback != nullptr) {
    // Shows that the callback arrived unchanged: the tests' callback answers a known value.
    Record("callback=" + std::to_string(info->pfnCrashCallback(nullptr)));
  }
  return EnvInt("OWTEST_CRASHRPT_INSTALL_RESULT");
}

OWTEST_EXPORT int crUninstall() {
  Record("crUninstall");
  return 0;
}

OWTEST_EXPORT int crAddFile2W(const char16_t* file, const char16_t* destinationName, const char16_t* description,
                              DWORD flags) {
  Record("crAddFile2W file=" + Utf8(file) + " dest=" + Utf8(destinationName) + " desc=" + Utf8(description) +
         " flags=" + std::to_string(flags));
  return 0;
}

#ifndef OWTEST_CRASHRPT_WITHOUT_ADD_PROPERTY
OWTEST_EXPORT int crAddPropertyW(const char16_t* name, const char16_t* value) {
  Record("crAddPropertyW name=" + Utf8(name) + " value=" + Utf8(value));
  return EnvInt("OWTEST_CRASHRPT_PROPERTY_RESULT");
}
#endif

OWTEST_EXPORT int crGetLastErrorMsgW(char16_t* buffer, UINT size) {
  Record("crGetLastErrorMsgW size=" + std::to_string(size));
  const char* text = std::getenv("OWTEST_CRASHRPT_ERROR");
  if (text == nullptr) text = "no error";
  if (buffer == nullptr || size == 0) return -1;
  // ASCII only: the tests' error texts.
  UINT i = 0;
  for (; text[i] != 0 && i + 1 < size; ++i) buffer[i] = static_cast<unsigned char>(text[i]);
  buffer[i] = 0;
  return static_cast<int>(i);
}
