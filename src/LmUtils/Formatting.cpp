// Size and time texts, days in a month, message texts.
#include "owutils/LmFormat.h"

#include <string>

#include "LmUtils/ResourceState.h"
#include "owutils/LmResources.h"
#include "platform/Locale.h"
#include "platform/Messages.h"

namespace {

constexpr std::int64_t kGigabyteThreshold = 0x3CCCCCCC;  // 0.95 * 2^30, rounded down
constexpr std::int64_t kMegabyteThreshold = 0xF3333;     // 0.95 * 2^20, rounded down
constexpr int kTextBufferSize = 128;
constexpr size_t kMessageBufferSize = 4096;

}  // namespace

CString FormatSize(std::int64_t bytes) {
  // Single precision on purpose: the texts must come out exactly as they always have.
  const float size = static_cast<float>(static_cast<double>(bytes));
  CString text;
  if (bytes > kGigabyteThreshold) {
    const float gigabytes = size * (1.0f / 1073741824.0f);
    text.Format(u"%.2f GB", static_cast<double>(gigabytes));
  } else if (bytes > kMegabyteThreshold) {
    const float megabytes = size * (1.0f / 1048576.0f);
    text.Format(u"%.2f MB", static_cast<double>(megabytes));
  } else {
    std::int64_t kilobytes = bytes / 1024;
    if (bytes > 0) ++kilobytes;
    text.Format(u"%d KB", static_cast<int>(static_cast<std::uint32_t>(kilobytes)));
  }
  return text;
}

CString FormatTime(std::int64_t time) {
  CString text;
  if (time == 0) return text;
  SYSTEMTIME local{};
  if (!Platform::LocalTimeFromUnixTime(time, local)) return text;
  char16_t buffer[kTextBufferSize];
  if (Platform::GetDateFormatW(Platform::kLocaleUserDefault, Platform::kDateShortDate, &local,
                               nullptr, buffer, kTextBufferSize) > 0) {
    text = buffer;
  }
  text += u" ";
  if (Platform::GetTimeFormatW(Platform::kLocaleUserDefault, 0, &local, nullptr, buffer,
                               kTextBufferSize) > 0) {
    text += buffer;
  }
  return text;
}

int GetLastDayOfMonth(int month, int year) {
  switch (month) {
    case 1: case 3: case 5: case 7: case 8: case 10: case 12:
      return 31;
    case 2: {
      // Gregorian rule: centuries are leap years only when divisible by 400 (1900 and 2100 are
      // not, 2000 is).
      const bool leap = (year % 4 == 0 && year % 100 != 0) || year % 400 == 0;
      return leap ? 29 : 28;
    }
    default:
      return 30;
  }
}

void GetErrorMessage(DWORD code, CString& text) {
  text.Empty();
  if (!LoadMessageResources()) return;
  // The message table of the module first, then the system's texts; inserts stay as written.
  char16_t buffer[kMessageBufferSize];
  DWORD length = Platform::FormatMessageW(
      FORMAT_MESSAGE_FROM_HMODULE | FORMAT_MESSAGE_FROM_SYSTEM | FORMAT_MESSAGE_IGNORE_INSERTS,
      LmUtils::g_hMessageResources, code, 0, buffer, kMessageBufferSize, nullptr);
  if (length == 0) return;
  std::u16string message(buffer, length);
  std::u16string joined;
  joined.reserve(message.size());
  for (char16_t c : message) {
    if (c != u'\r' && c != u'\n') joined += c;
  }
  text = CString(std::move(joined));
}
