// Lumo::String, the library's UTF-16 string, and its companions.
//
// Lumo::String is std::u16string plus the operations every part of the library relies on:
// strict UTF-8 conversion both ways, conversion through the C library's current locale,
// printf-style formatting over UTF-16, string resources, trimming, case-insensitive comparison
// and splitting. Lengths and positions count 16-bit units.
//
//   Lumo::String s(u"  report  ");
//   s.Trim(nullptr);                          // "report"
//   s.AppendFormat(u" %d of %s", 3, u"five"); // "report 3 of five"
//   Lumo::CharArrayHolder utf8 = s.ToUtf8();  // owned, NUL-terminated UTF-8
//
// StringList holds several strings (from a multi-string, a Split, or element by element);
// WhitespaceTokenizer cuts a text into words and separator tokens for line wrapping.
//
// Failures are exceptions of the library's framework (owutils/Exceptions.h).
#pragma once

#include <cstdarg>
#include <cstddef>
#include <string>
#include <vector>

#include "owutils/Export.h"
#include "owutils/WinTypes.h"

namespace Lumo {

// Owns one heap array of narrow text (with its terminating NUL). Movable, not copyable.
class OWUTILS_API CharArrayHolder {
 public:
  CharArrayHolder() noexcept = default;
  explicit CharArrayHolder(char* array) noexcept : m_pArray(array) {}
  CharArrayHolder(CharArrayHolder&& other) noexcept : m_pArray(other.Release()) {}
  CharArrayHolder& operator=(CharArrayHolder&& other) noexcept;
  CharArrayHolder(const CharArrayHolder&) = delete;
  CharArrayHolder& operator=(const CharArrayHolder&) = delete;
  ~CharArrayHolder() { delete[] m_pArray; }

  // Releases the array held so far, then takes ownership of `array`.
  void Reset(char* array = nullptr) noexcept;
  // Gives up ownership without releasing.
  char* Release() noexcept;

  char* Get() const noexcept { return m_pArray; }
  operator const char*() const noexcept { return m_pArray; }

 private:
  char* m_pArray = nullptr;
};

class StringList;

class OWUTILS_API String : public std::u16string {
 public:
  using std::u16string::u16string;

  String() = default;
  // Copies up to the terminator; a null pointer gives an empty string.
  String(const char16_t* text);  // NOLINT(google-explicit-constructor): used as a value type
  // Converts strict UTF-8; raises LumoStringNarrowToWideFailed for invalid input.
  explicit String(const char* utf8);
  String(const std::u16string& text) : std::u16string(text) {}  // NOLINT
  String(std::u16string&& text) noexcept : std::u16string(std::move(text)) {}  // NOLINT

  String(const String&) = default;
  String(String&&) noexcept = default;
  String& operator=(const String&) = default;
  String& operator=(String&&) noexcept = default;
  String& operator=(const char16_t* text);

  // --- Conversions -------------------------------------------------------------------------
  // Replaces the contents with strict UTF-8 `text` (null gives empty). Invalid sequences raise
  // LumoStringNarrowToWideFailed caused by Win32ErrorCode("MultiByteToWideChar", 1113); the
  // string is then empty.
  void AssignUtf8(const char* text);
  // Replaces the contents with `text` converted through the C library's current locale.
  // Never raises: unconvertible input leaves the string empty.
  void AssignAnsi(const char* text);
  // UTF-8 form; raises LumoStringWideToNarrow (caused by Win32ErrorCode for
  // "WideCharToMultiByte") when the string holds an unpaired surrogate.
  CharArrayHolder ToUtf8() const;
  // Narrow form in the C library's current locale; raises LumoStringWideToNarrow.
  CharArrayHolder ToAnsi() const;

  // --- Formatting ----------------------------------------------------------------------------
  // printf-style formatting over UTF-16 with the conversions of the Windows runtime: %s and %c
  // take UTF-16 (char16_t* / char16_t), %hs and %hc narrow UTF-8; %d, %i, %u, %x, %X, %o take
  // 32-bit values, also with the `l` modifier (long is 32 bits in this vocabulary: pass DWORD
  // and LONG); %I, %z and %t take pointer-sized values, %I64 and %ll 64-bit ones; %p, %e, %f,
  // %g, %a, %%; flags, widths, precisions and `*`.
  //
  // Text up to 1023 units is built on the stack; up to 8191 units in one heap buffer of 8192;
  // longer text raises BufferTooSmall(8192) and leaves the string as it was. A null format
  // raises PreconditionFailed0("format != NULL").
  void Format(const char16_t* format, ...);
  void AppendFormat(const char16_t* format, ...);
  void FormatV(const char16_t* format, va_list args);
  void AppendFormatV(const char16_t* format, va_list args);

  // --- Resources -----------------------------------------------------------------------------
  // Replaces the contents with string resource `id` of `module` (null: the main program).
  // A missing or empty resource raises LumoStringResourceNotFound; the string is then empty.
  void LoadString(UINT id, HINSTANCE module);

  // --- Editing and comparison ----------------------------------------------------------------
  // Removes every unit found in `chars` from both ends; null means u" \t\n\r".
  String& Trim(const char16_t* chars);
  // Case-insensitive comparison by the C library's case rules: negative, zero or positive.
  int CompareNoCase(const char16_t* other) const;
  // Cuts at each occurrence of the whole `delimiter`, into at most `maxCount` elements. With
  // `cutLast` false the last permitted element keeps the unsplit rest; with true the rest is
  // dropped. An empty delimiter does not cut: the whole string is the one element.
  StringList Split(const String& delimiter, size_t maxCount, bool cutLast) const;
};

class OWUTILS_API StringList : public std::vector<String> {
 public:
  StringList() = default;
  // Takes the strings of a multi-string ("x\0y\0\0"); null or an empty first string: empty.
  explicit StringList(const char16_t* multiString);
  StringList(std::initializer_list<String> items) : std::vector<String>(items) {}

  void AssignMultiString(const char16_t* multiString);

  // Range-checked access; an index at or beyond the size raises LumoException::STLException
  // carrying "invalid vector<T> subscript".
  String GetAt(size_t index) const;
  String& operator[](size_t index);
  const String& operator[](size_t index) const;

  // Joins the elements (last to first when `reverse`), with `separator` between them (none
  // when null).
  String Join(const char16_t* separator, bool reverse) const;
};

// Cuts a text into words and separator tokens. Each blank, tab, carriage return or line feed
// is a token of its own; the characters between them form the word tokens.
//   "ab  c\n" gives "ab", " ", " ", "c", "\n".
// A separator token's first unit is the separator; only that unit is meaningful.
class OWUTILS_API WhitespaceTokenizer {
 public:
  static constexpr const char16_t* kSeparators = u" \t\r\n";

  explicit WhitespaceTokenizer(const char16_t* text);
  ~WhitespaceTokenizer();
  WhitespaceTokenizer(const WhitespaceTokenizer&) = delete;
  WhitespaceTokenizer& operator=(const WhitespaceTokenizer&) = delete;

  size_t GetTokenCount() const noexcept { return m_nTokens; }
  // The token at `index`, or null at or beyond the token count.
  const char16_t* GetToken(size_t index) const noexcept;
  static bool IsSeparator(char16_t c) noexcept;

  class Cursor {
   public:
    explicit Cursor(const WhitespaceTokenizer& tokenizer) noexcept : m_tokenizer(tokenizer) {}
    // The token at the position, then advances; null at the end.
    const char16_t* Next() noexcept;
    // Steps back one and returns that token; null at position 0.
    const char16_t* Previous() noexcept;
    size_t GetPosition() const noexcept { return m_position; }

   private:
    const WhitespaceTokenizer& m_tokenizer;
    size_t m_position = 0;
  };

 private:
  char16_t* m_pText = nullptr;
  const char16_t** m_ppTokens = nullptr;
  size_t m_nTokens = 0;
};

}  // namespace Lumo
