// CString, the wide string class of the exported interface.
#include "owutils/CString.h"

#include <algorithm>
#include <cwctype>
#include <memory>

#include "Strings/Formatter.h"
#include "owutils/tstring.h"

namespace {

using Traits = std::char_traits<char16_t>;

size_t Clamp(int value, size_t limit) {
  if (value < 0) return 0;
  return std::min(static_cast<size_t>(value), limit);
}

const char16_t* OrEmpty(const char16_t* text) { return text != nullptr ? text : u""; }

}  // namespace

CString::CString(const char16_t* text) : m_str(OrEmpty(text)) {}

CString::CString(const char16_t* text, int length) {
  if (text != nullptr && length > 0) m_str.assign(text, static_cast<size_t>(length));
}

CString::CString(char16_t c, int repeat) {
  if (repeat > 0) m_str.assign(static_cast<size_t>(repeat), c);
}

char16_t CString::GetAt(int index) const {
  return index >= 0 && static_cast<size_t>(index) < m_str.size() ? m_str[static_cast<size_t>(index)] : u'\0';
}

void CString::SetAt(int index, char16_t c) {
  if (index >= 0 && static_cast<size_t>(index) < m_str.size()) m_str[static_cast<size_t>(index)] = c;
}

char16_t* CString::GetBuffer(int minLength) {
  if (minLength > 0 && static_cast<size_t>(minLength) > m_str.size()) m_str.resize(static_cast<size_t>(minLength));
  return m_str.data();
}

void CString::ReleaseBuffer(int newLength) {
  size_t length = newLength < 0 ? Traits::length(m_str.c_str()) : Clamp(newLength, m_str.size());
  m_str.resize(length);
}

CString& CString::operator=(const char16_t* text) {
  m_str = OrEmpty(text);
  return *this;
}

CString& CString::operator=(char16_t c) {
  m_str.assign(1, c);
  return *this;
}

CString& CString::operator+=(const CString& other) {
  m_str += other.m_str;
  return *this;
}

CString& CString::operator+=(const char16_t* text) {
  m_str += OrEmpty(text);
  return *this;
}

CString& CString::operator+=(char16_t c) {
  m_str.push_back(c);
  return *this;
}

void CString::Append(const char16_t* text) { m_str += OrEmpty(text); }

void CString::Append(const char16_t* text, int length) {
  if (text != nullptr && length > 0) m_str.append(text, static_cast<size_t>(length));
}

void CString::FormatV(const char16_t* format, va_list args) {
  m_str.clear();
  AppendFormatV(format, args);
}

void CString::AppendFormatV(const char16_t* format, va_list args) {
  if (format == nullptr) return;
  char16_t small[256];
  va_list first;
  va_copy(first, args);
  int length = Lumo::detail::FormatUtf16(small, 256, format, first);
  va_end(first);
  if (length < 0) return;
  if (length < 256) {
    m_str.append(small, static_cast<size_t>(length));
    return;
  }
  std::unique_ptr<char16_t[]> large(new char16_t[static_cast<size_t>(length) + 1]);
  va_list second;
  va_copy(second, args);
  Lumo::detail::FormatUtf16(large.get(), static_cast<size_t>(length) + 1, format, second);
  va_end(second);
  m_str.append(large.get(), static_cast<size_t>(length));
}

void CString::Format(const char16_t* format, ...) {
  va_list args;
  va_start(args, format);
  FormatV(format, args);
  va_end(args);
}

void CString::AppendFormat(const char16_t* format, ...) {
  va_list args;
  va_start(args, format);
  AppendFormatV(format, args);
  va_end(args);
}

CString CString::Left(int count) const { return CString(m_str.substr(0, Clamp(count, m_str.size()))); }

CString CString::Right(int count) const {
  size_t n = Clamp(count, m_str.size());
  return CString(m_str.substr(m_str.size() - n));
}

CString CString::Mid(int first) const { return CString(m_str.substr(Clamp(first, m_str.size()))); }

CString CString::Mid(int first, int count) const {
  size_t start = Clamp(first, m_str.size());
  return CString(m_str.substr(start, Clamp(count, m_str.size() - start)));
}

int CString::Find(char16_t c, int start) const {
  if (start < 0 || static_cast<size_t>(start) > m_str.size()) return -1;
  size_t pos = m_str.find(c, static_cast<size_t>(start));
  return pos == std::u16string::npos ? -1 : static_cast<int>(pos);
}

int CString::Find(const char16_t* text, int start) const {
  if (text == nullptr || start < 0 || static_cast<size_t>(start) > m_str.size()) return -1;
  size_t pos = m_str.find(text, static_cast<size_t>(start));
  return pos == std::u16string::npos ? -1 : static_cast<int>(pos);
}

int CString::FindOneOf(const char16_t* chars) const {
  if (chars == nullptr) return -1;
  size_t pos = m_str.find_first_of(chars);
  return pos == std::u16string::npos ? -1 : static_cast<int>(pos);
}

int CString::ReverseFind(char16_t c) const {
  size_t pos = m_str.rfind(c);
  return pos == std::u16string::npos ? -1 : static_cast<int>(pos);
}

int CString::Replace(char16_t from, char16_t to) {
  int count = 0;
  for (char16_t& c : m_str) {
    if (c == from) {
      c = to;
      ++count;
    }
  }
  return count;
}

int CString::Replace(const char16_t* from, const char16_t* to) {
  if (from == nullptr || *from == 0) return 0;
  const std::u16string pattern(from);
  const std::u16string replacement(OrEmpty(to));
  std::u16string result;
  int count = 0;
  size_t start = 0;
  for (size_t pos; (pos = m_str.find(pattern, start)) != std::u16string::npos; start = pos + pattern.size()) {
    result.append(m_str, start, pos - start);
    result += replacement;
    ++count;
  }
  if (count != 0) {
    result.append(m_str, start, std::u16string::npos);
    m_str.swap(result);
  }
  return count;
}

int CString::Remove(char16_t c) {
  size_t before = m_str.size();
  m_str.erase(std::remove(m_str.begin(), m_str.end(), c), m_str.end());
  return static_cast<int>(before - m_str.size());
}

int CString::Insert(int index, char16_t c) {
  m_str.insert(Clamp(index, m_str.size()), 1, c);
  return GetLength();
}

int CString::Insert(int index, const char16_t* text) {
  m_str.insert(Clamp(index, m_str.size()), OrEmpty(text));
  return GetLength();
}

int CString::Delete(int index, int count) {
  size_t start = Clamp(index, m_str.size());
  m_str.erase(start, Clamp(count, m_str.size() - start));
  return GetLength();
}

CString& CString::Trim() { return TrimRight().TrimLeft(); }
CString& CString::Trim(char16_t c) { return TrimRight(c).TrimLeft(c); }
CString& CString::Trim(const char16_t* chars) { return TrimRight(chars).TrimLeft(chars); }

CString& CString::TrimLeft() {
  size_t n = 0;
  while (n < m_str.size() && std::iswspace(static_cast<wint_t>(m_str[n]))) ++n;
  m_str.erase(0, n);
  return *this;
}

CString& CString::TrimLeft(char16_t c) {
  m_str.erase(0, std::min(m_str.find_first_not_of(c), m_str.size()));
  return *this;
}

CString& CString::TrimLeft(const char16_t* chars) {
  m_str.erase(0, std::min(m_str.find_first_not_of(OrEmpty(chars)), m_str.size()));
  return *this;
}

CString& CString::TrimRight() {
  size_t n = m_str.size();
  while (n > 0 && std::iswspace(static_cast<wint_t>(m_str[n - 1]))) --n;
  m_str.resize(n);
  return *this;
}

CString& CString::TrimRight(char16_t c) {
  size_t last = m_str.find_last_not_of(c);
  m_str.resize(last == std::u16string::npos ? 0 : last + 1);
  return *this;
}

CString& CString::TrimRight(const char16_t* chars) {
  size_t last = m_str.find_last_not_of(OrEmpty(chars));
  m_str.resize(last == std::u16string::npos ? 0 : last + 1);
  return *this;
}

CString& CString::MakeUpper() {
  for (char16_t& c : m_str) c = static_cast<char16_t>(std::towupper(static_cast<wint_t>(c)));
  return *this;
}

CString& CString::MakeLower() {
  for (char16_t& c : m_str) c = static_cast<char16_t>(std::towlower(static_cast<wint_t>(c)));
  return *this;
}

int CString::Compare(const char16_t* other) const { return m_str.compare(OrEmpty(other)); }

int CString::CompareNoCase(const char16_t* other) const {
  return Lumo::String(m_str).CompareNoCase(other);
}

CString operator+(const CString& a, const CString& b) { return CString(a.m_str + b.m_str); }
CString operator+(const CString& a, const char16_t* b) { return CString(a.m_str + OrEmpty(b)); }
CString operator+(const char16_t* a, const CString& b) { return CString(OrEmpty(a) + b.m_str); }
CString operator+(const CString& a, char16_t b) { return CString(a.m_str + b); }
