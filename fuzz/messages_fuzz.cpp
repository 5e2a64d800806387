// The platform's message formatter, FormatMessageW with a template from a string and inserts
// from an argument array, and ExpandEnvironmentStringsW.
//
// Every insert of the array (all 99 an insert number can name, and the width and precision
// after them) is the address of a terminated UTF-16 text, so whatever conversion the template
// asks of an insert (%1!s!, %2!hs!, %3!d!, %4!*.*s!...) reads only memory that is there.
// Properties: the text and its terminator fit in the buffer given (an exact heap array of that
// size); a buffer too small fails with ERROR_INSUFFICIENT_BUFFER, and the allocated form gives
// the same text as a large enough buffer; a template without inserts or escapes comes back as
// it stands. ExpandEnvironmentStringsW reports the size it needs and fills exactly that.
#include <memory>
#include <vector>

#include "FuzzSupport.h"
#include "platform/Errors.h"
#include "platform/Messages.h"

namespace {

constexpr size_t kInserts = 128;

std::u16string Call(DWORD flags, const std::u16string& text, const DWORD_PTR* inserts, DWORD size, DWORD& result,
                    DWORD& error) {
  std::unique_ptr<char16_t[]> buffer(new char16_t[size == 0 ? 1 : size]);
  Platform::SetLastError(ERROR_SUCCESS);
  result = Platform::FormatMessageW(flags, text.c_str(), 0, 0, buffer.get(), size,
                                    reinterpret_cast<va_list*>(const_cast<DWORD_PTR*>(inserts)));
  error = Platform::GetLastError();
  if (result == 0) return std::u16string();
  FUZZ_CHECK(result < size);
  FUZZ_CHECK(buffer[result] == 0);
  return std::u16string(buffer.get(), result);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  FuzzedDataProvider input(data, size);
  const DWORD width = input.ConsumeBool() ? 0 : input.ConsumeIntegral<uint8_t>();
  const bool ignoreInserts = input.ConsumeIntegralInRange<int>(0, 3) == 0;
  const DWORD smallSize = input.ConsumeIntegralInRange<DWORD>(1, 64);

  // The inserts: short texts, the last ones repeated.
  std::vector<std::u16string> texts;
  for (int i = 0; i < 6; ++i) texts.push_back(OwFuzz::UpToNul(OwFuzz::Latin1(input.ConsumeRandomLengthString(12))));
  std::vector<DWORD_PTR> inserts(kInserts);
  for (size_t i = 0; i < kInserts; ++i) inserts[i] = reinterpret_cast<DWORD_PTR>(texts[i % texts.size()].c_str());

  const bool ascii = input.ConsumeBool();
  const std::string bytes = input.ConsumeRemainingBytesAsString();
  const std::u16string text = OwFuzz::UpToNul(ascii ? OwFuzz::Latin1(bytes) : OwFuzz::Units(bytes));

  const DWORD flags = FORMAT_MESSAGE_FROM_STRING | FORMAT_MESSAGE_ARGUMENT_ARRAY | width |
                      (ignoreInserts ? FORMAT_MESSAGE_IGNORE_INSERTS : 0);
  DWORD result = 0, error = 0;
  const std::u16string whole = Call(flags, text, inserts.data(), 1 << 16, result, error);
  if (result == 0 && error == ERROR_INSUFFICIENT_BUFFER) return 0;  // wider than the harness looks
  if (result == 0) {
    // An empty text also gives 0, with no error.
    FUZZ_CHECK(error == ERROR_INVALID_PARAMETER || error == ERROR_SUCCESS);
  } else {
    FUZZ_CHECK(whole.size() == result);
    if (width == 0 && text.find_first_of(u"%\r\n") == std::u16string::npos) FUZZ_CHECK(whole == text);
  }

  // A small buffer: the same text when it fits, else ERROR_INSUFFICIENT_BUFFER.
  const std::u16string small = Call(flags, text, inserts.data(), smallSize, result, error);
  if (!whole.empty() && whole.size() < smallSize) FUZZ_CHECK(small == whole);
  if (!whole.empty() && whole.size() >= smallSize) FUZZ_CHECK(result == 0 && error == ERROR_INSUFFICIENT_BUFFER);

  // The allocated form.
  char16_t* allocated = nullptr;
  Platform::SetLastError(ERROR_SUCCESS);
  result = Platform::FormatMessageW(flags | FORMAT_MESSAGE_ALLOCATE_BUFFER, text.c_str(), 0, 0,
                                    reinterpret_cast<char16_t*>(&allocated), 0,
                                    reinterpret_cast<va_list*>(inserts.data()));
  if (std::getenv("OWFUZZ_DUMP") != nullptr) {
    std::fprintf(stderr, "template %zu units, text %zu units, allocated result %u\n", text.size(), whole.size(),
                 static_cast<unsigned>(result));
    for (char16_t c : whole) std::fprintf(stderr, "%04X ", static_cast<unsigned>(c));
    std::fprintf(stderr, "\n");
  }
  if (!whole.empty()) {
    FUZZ_CHECK(result == whole.size() && allocated != nullptr);
    // An insert may put a NUL into the text (%c of a value whose low 16 bits are 0).
    FUZZ_CHECK(std::u16string(allocated, result) == whole);
  }
  Platform::LocalFree(allocated);

  // Environment strings.
  const DWORD needed = Platform::ExpandEnvironmentStringsW(text.c_str(), nullptr, 0);
  if (needed > 0) {
    std::unique_ptr<char16_t[]> exact(new char16_t[needed]);
    FUZZ_CHECK(Platform::ExpandEnvironmentStringsW(text.c_str(), exact.get(), needed) == needed);
    FUZZ_CHECK(std::char_traits<char16_t>::length(exact.get()) == needed - 1);
    if (needed > 1) {
      std::unique_ptr<char16_t[]> shorter(new char16_t[needed - 1]);
      FUZZ_CHECK(Platform::ExpandEnvironmentStringsW(text.c_str(), shorter.get(), needed - 1) == needed);
    }
  }
  return 0;
}
