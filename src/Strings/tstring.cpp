// Lumo::String, CharArrayHolder, StringList and WhitespaceTokenizer.
#include "owutils/tstring.h"

#include <cerrno>
#include <cstring>
#include <cwctype>
#include <memory>
#include <stdexcept>

#include "Strings/Formatter.h"
#include "owutils/Exceptions.h"
#include "platform/Errors.h"
#include "platform/Modules.h"
#include "platform/Text.h"

namespace Lumo {

// ---- CharArrayHolder --------------------------------------------------------------------------

CharArrayHolder& CharArrayHolder::operator=(CharArrayHolder&& other) noexcept {
  if (this != &other) Reset(other.Release());
  return *this;
}

void CharArrayHolder::Reset(char* array) noexcept {
  if (array == m_pArray) return;
  delete[] m_pArray;
  m_pArray = array;
}

char* CharArrayHolder::Release() noexcept {
  char* array = m_pArray;
  m_pArray = nullptr;
  return array;
}

// ---- String: construction ---------------------------------------------------------------------

String::String(const char16_t* text) {
  if (text != nullptr) assign(text);
}

String::String(const char* utf8) {
  CHECKPOINT_TRY
    AssignUtf8(utf8);
  CHECKPOINT_CATCH
}

String& String::operator=(const char16_t* text) {
  if (text == nullptr) {
    clear();
  } else {
    assign(text);
  }
  return *this;
}

// ---- String: conversions ----------------------------------------------------------------------

void String::AssignUtf8(const char* text) {
  clear();
  if (text == nullptr) return;
  Platform::SetLastError(ERROR_SUCCESS);
  int needed = Platform::MultiByteToWideChar(Platform::kCodePageUtf8, Platform::kMbErrInvalidChars, text, -1,
                                             nullptr, 0);
  int result = needed;
  if (needed > 0) {
    std::unique_ptr<char16_t[]> buffer(new char16_t[static_cast<size_t>(needed)]);
    result = Platform::MultiByteToWideChar(Platform::kCodePageUtf8, Platform::kMbErrInvalidChars, text, -1,
                                           buffer.get(), needed);
    if (result > 0) assign(buffer.get());
  }
  if (result == 0) {
    DWORD error = Platform::GetLastError();
    if (error != ERROR_SUCCESS) {
      THROW_AT(LumoStringNarrowToWideFailed(
          LumoException::Win32ErrorCode(u"MultiByteToWideChar", static_cast<int>(error))));
    }
  }
}

void String::AssignAnsi(const char* text) {
  clear();
  if (text == nullptr) return;
  size_t needed = 0;
  if (Platform::LocaleToWide(&needed, nullptr, 0, text) != 0 || needed == 0) return;
  std::unique_ptr<char16_t[]> buffer(new char16_t[needed]);
  if (Platform::LocaleToWide(&needed, buffer.get(), needed, text) == 0) assign(buffer.get());
}

CharArrayHolder String::ToUtf8() const {
  CharArrayHolder holder;
  try {
    Platform::SetLastError(ERROR_SUCCESS);
    int needed = Platform::WideCharToMultiByte(Platform::kCodePageUtf8, 0, c_str(), -1, nullptr, 0, nullptr, nullptr);
    int result = needed;
    if (needed > 0) {
      holder.Reset(new char[static_cast<size_t>(needed)]);
      result = Platform::WideCharToMultiByte(Platform::kCodePageUtf8, 0, c_str(), -1, holder.Get(), needed, nullptr,
                                             nullptr);
    }
    if (result == 0) {
      DWORD error = Platform::GetLastError();
      if (error != ERROR_SUCCESS) {
        THROW_AT(LumoException::Win32ErrorCode(u"WideCharToMultiByte", static_cast<int>(error)));
      }
    }
  } catch (LumoException::Exception& e) {
    holder.Reset();
    THROW_AT(LumoStringWideToNarrow(e));
  }
  return holder;
}

CharArrayHolder String::ToAnsi() const {
  CharArrayHolder holder;
  try {
    size_t needed = 0;
    int err = Platform::WideToLocale(&needed, nullptr, 0, c_str());
    ASSERTION1(err == 0, err);
    size_t numCharsConverted = needed;
    ASSERTION(numCharsConverted > 0);
    holder.Reset(new char[numCharsConverted]);
    err = Platform::WideToLocale(&needed, holder.Get(), numCharsConverted, c_str());
    ASSERTION1(err == 0, err);
  } catch (LumoException::Exception& e) {
    holder.Reset();
    THROW_AT(LumoStringWideToNarrow(e));
  }
  return holder;
}

// ---- String: formatting -----------------------------------------------------------------------

namespace {

constexpr size_t kStackUnits = 1024;
constexpr size_t kHeapUnits = 8192;

// Formats with the two-buffer rule and hands the text to `use`. Raises BufferTooSmall(8192)
// when the text needs more than 8191 units.
template <typename Use>
void FormatWithBuffers(const char16_t* format, va_list args, Use use) {
  PRECONDITION(format != NULL);
  char16_t stackBuffer[kStackUnits];
  va_list first;
  va_copy(first, args);
  int length = detail::FormatUtf16(stackBuffer, kStackUnits, format, first);
  va_end(first);
  if (length >= 0 && static_cast<size_t>(length) < kStackUnits) {
    use(stackBuffer, static_cast<size_t>(length));
    return;
  }
  std::unique_ptr<char16_t[]> heapBuffer(new char16_t[kHeapUnits]);
  va_list second;
  va_copy(second, args);
  length = detail::FormatUtf16(heapBuffer.get(), kHeapUnits, format, second);
  va_end(second);
  if (length >= 0 && static_cast<size_t>(length) < kHeapUnits) {
    use(heapBuffer.get(), static_cast<size_t>(length));
    return;
  }
  heapBuffer.reset();
  THROW_AT(LumoException::BufferTooSmall(static_cast<LONG>(kHeapUnits)));
}

}  // namespace

void String::FormatV(const char16_t* format, va_list args) {
  FormatWithBuffers(format, args, [this](const char16_t* text, size_t length) { assign(text, length); });
}

void String::AppendFormatV(const char16_t* format, va_list args) {
  FormatWithBuffers(format, args, [this](const char16_t* text, size_t length) { append(text, length); });
}

void String::Format(const char16_t* format, ...) {
  va_list args;
  va_start(args, format);
  try {
    FormatV(format, args);
  } catch (...) {
    va_end(args);
    throw;
  }
  va_end(args);
}

void String::AppendFormat(const char16_t* format, ...) {
  va_list args;
  va_start(args, format);
  try {
    AppendFormatV(format, args);
  } catch (...) {
    va_end(args);
    throw;
  }
  va_end(args);
}

// ---- String: resources, editing, comparison ---------------------------------------------------

void String::LoadString(UINT id, HINSTANCE module) {
  clear();
  try {
    if (module == nullptr) {
      module = Platform::GetModuleHandleW(nullptr);
      if (module == nullptr) THROW_AT(LumoException::Win32Error(u"GetModuleHandle"));
    }
    const char16_t* text = nullptr;
    int length = Platform::LoadStringW(module, id, reinterpret_cast<char16_t*>(&text), 0);
    if (length <= 0 || text == nullptr) THROW_AT(LumoException::Win32Error(u"LoadString"));
    assign(text, static_cast<size_t>(length));
  } catch (LumoException::Exception& e) {
    clear();
    THROW_AT(LumoStringResourceNotFound(id, e));
  }
}

String& String::Trim(const char16_t* chars) {
  const char16_t* set = chars != nullptr ? chars : u" \t\n\r";
  size_t first = find_first_not_of(set);
  if (first == npos) {
    clear();
    return *this;
  }
  erase(0, first);
  size_t last = find_last_not_of(set);
  erase(last + 1);
  return *this;
}

int String::CompareNoCase(const char16_t* other) const {
  const char16_t* a = c_str();
  const char16_t* b = other != nullptr ? other : u"";
  for (;; ++a, ++b) {
    auto ca = static_cast<wint_t>(std::towlower(static_cast<wint_t>(*a)));
    auto cb = static_cast<wint_t>(std::towlower(static_cast<wint_t>(*b)));
    if (ca != cb) return static_cast<int>(ca) - static_cast<int>(cb);
    if (*a == 0) return 0;
  }
}

StringList String::Split(const String& delimiter, size_t maxCount, bool cutLast) const {
  StringList list;
  if (maxCount == 0) return list;
  if (delimiter.empty()) {
    // Nothing to cut at: the whole string is the one element.
    list.push_back(*this);
    return list;
  }
  size_t start = 0;
  while (list.size() < maxCount) {
    size_t found = find(delimiter, start);
    bool lastPermitted = list.size() == maxCount - 1;
    if (found == npos || (lastPermitted && !cutLast)) {
      list.push_back(substr(start));
      break;
    }
    list.push_back(substr(start, found - start));
    start = found + delimiter.size();
  }
  return list;
}

// ---- StringList -------------------------------------------------------------------------------

StringList::StringList(const char16_t* multiString) { AssignMultiString(multiString); }

void StringList::AssignMultiString(const char16_t* multiString) {
  clear();
  if (multiString == nullptr) return;
  for (const char16_t* p = multiString; *p != 0;) {
    size_t length = std::char_traits<char16_t>::length(p);
    emplace_back(p, length);
    p += length + 1;
  }
}

namespace {
[[noreturn]] void ThrowSubscript() {
  THROW_AT(LumoException::STLException(std::out_of_range("invalid vector<T> subscript")));
}
}  // namespace

String StringList::GetAt(size_t index) const {
  if (index >= size()) ThrowSubscript();
  return std::vector<String>::operator[](index);
}

String& StringList::operator[](size_t index) {
  if (index >= size()) ThrowSubscript();
  return std::vector<String>::operator[](index);
}

const String& StringList::operator[](size_t index) const {
  if (index >= size()) ThrowSubscript();
  return std::vector<String>::operator[](index);
}

String StringList::Join(const char16_t* separator, bool reverse) const {
  String result;
  const size_t n = size();
  for (size_t i = 0; i < n; ++i) {
    if (i != 0 && separator != nullptr) result += separator;
    result += std::vector<String>::operator[](reverse ? n - 1 - i : i);
  }
  return result;
}

// ---- WhitespaceTokenizer ----------------------------------------------------------------------

bool WhitespaceTokenizer::IsSeparator(char16_t c) noexcept {
  return c == u' ' || c == u'\t' || c == u'\r' || c == u'\n';
}

WhitespaceTokenizer::WhitespaceTokenizer(const char16_t* text) {
  const size_t length = text != nullptr ? std::char_traits<char16_t>::length(text) : 0;
  std::unique_ptr<char16_t[]> copy(new char16_t[length + 1]);
  if (length != 0) std::char_traits<char16_t>::copy(copy.get(), text, length);
  copy[length] = 0;
  std::unique_ptr<const char16_t*[]> tokens(new const char16_t*[length + 2]);
  size_t count = 0;
  const char16_t* open = nullptr;
  for (size_t i = 0; i < length; ++i) {
    char16_t* unit = &copy[i];
    if (IsSeparator(*unit)) {
      const char16_t* separator = std::char_traits<char16_t>::find(kSeparators, 4, *unit);
      if (open != nullptr) {
        *unit = 0;
        tokens[count++] = open;
        open = nullptr;
      }
      tokens[count++] = separator;
    } else if (open == nullptr) {
      open = unit;
    }
  }
  if (open != nullptr) tokens[count++] = open;
  tokens[count] = nullptr;
  m_pText = copy.release();
  m_ppTokens = tokens.release();
  m_nTokens = count;
}

WhitespaceTokenizer::~WhitespaceTokenizer() {
  delete[] m_ppTokens;
  delete[] m_pText;
}

const char16_t* WhitespaceTokenizer::GetToken(size_t index) const noexcept {
  return index < m_nTokens ? m_ppTokens[index] : nullptr;
}

const char16_t* WhitespaceTokenizer::Cursor::Next() noexcept {
  const char16_t* token = m_tokenizer.GetToken(m_position);
  if (token != nullptr) ++m_position;
  return token;
}

const char16_t* WhitespaceTokenizer::Cursor::Previous() noexcept {
  if (m_position == 0) return nullptr;
  --m_position;
  return m_tokenizer.GetToken(m_position);
}

}  // namespace Lumo
