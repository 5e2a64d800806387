// CString: the wide string class of the library's exported interface.
//
// Paths and most exported text arguments and results are CString values. It is a small UTF-16
// value class with the members client code of the Windows class library is used to (IsEmpty,
// GetLength, Left, Mid, Find, Format...), so the same call sites build on every platform.
// Positions and lengths are 16-bit units; an out-of-range position is clamped, as there.
#pragma once

#include <cstdarg>
#include <string>

#include "owutils/Export.h"
#include "owutils/WinTypes.h"

class OWUTILS_API CString {
 public:
  CString() = default;
  CString(const char16_t* text);  // NOLINT: null gives an empty string
  CString(const char16_t* text, int length);
  CString(char16_t c, int repeat = 1);
  CString(const std::u16string& text) : m_str(text) {}  // NOLINT
  CString(std::u16string&& text) noexcept : m_str(std::move(text)) {}  // NOLINT

  // --- Size and access -----------------------------------------------------------------------
  int GetLength() const noexcept { return static_cast<int>(m_str.size()); }
  bool IsEmpty() const noexcept { return m_str.empty(); }
  void Empty() noexcept { m_str.clear(); }
  const char16_t* GetString() const noexcept { return m_str.c_str(); }
  operator const char16_t*() const noexcept { return m_str.c_str(); }  // NOLINT
  const std::u16string& str() const noexcept { return m_str; }
  char16_t GetAt(int index) const;
  void SetAt(int index, char16_t c);
  char16_t operator[](int index) const { return GetAt(index); }

  // A writable buffer of at least `minLength` units; call ReleaseBuffer after writing.
  char16_t* GetBuffer(int minLength = 0);
  // Ends a GetBuffer: the length becomes `newLength`, or the position of the first NUL when -1.
  void ReleaseBuffer(int newLength = -1);

  // --- Assignment and concatenation ----------------------------------------------------------
  CString& operator=(const char16_t* text);
  CString& operator=(char16_t c);
  CString& operator+=(const CString& other);
  CString& operator+=(const char16_t* text);
  CString& operator+=(char16_t c);
  void Append(const char16_t* text);
  void Append(const char16_t* text, int length);
  void AppendChar(char16_t c) { m_str.push_back(c); }

  // printf-style formatting with the conventions of Lumo::String::Format (owutils/tstring.h),
  // without its length limit.
  void Format(const char16_t* format, ...);
  void AppendFormat(const char16_t* format, ...);
  void FormatV(const char16_t* format, va_list args);
  void AppendFormatV(const char16_t* format, va_list args);

  // --- Substrings and search -----------------------------------------------------------------
  CString Left(int count) const;
  CString Right(int count) const;
  CString Mid(int first) const;
  CString Mid(int first, int count) const;
  // Position of the first occurrence at or after `start`, or -1.
  int Find(char16_t c, int start = 0) const;
  int Find(const char16_t* text, int start = 0) const;
  int FindOneOf(const char16_t* chars) const;
  int ReverseFind(char16_t c) const;

  // --- Editing -------------------------------------------------------------------------------
  int Replace(char16_t from, char16_t to);
  int Replace(const char16_t* from, const char16_t* to);
  int Remove(char16_t c);
  int Insert(int index, char16_t c);
  int Insert(int index, const char16_t* text);
  int Delete(int index, int count = 1);
  CString& Trim();
  CString& Trim(char16_t c);
  CString& Trim(const char16_t* chars);
  CString& TrimLeft();
  CString& TrimLeft(char16_t c);
  CString& TrimLeft(const char16_t* chars);
  CString& TrimRight();
  CString& TrimRight(char16_t c);
  CString& TrimRight(const char16_t* chars);
  CString& MakeUpper();
  CString& MakeLower();

  // --- Comparison ----------------------------------------------------------------------------
  int Compare(const char16_t* other) const;
  // By the C library's case rules, like Lumo::String::CompareNoCase.
  int CompareNoCase(const char16_t* other) const;

  friend bool operator==(const CString& a, const CString& b) { return a.m_str == b.m_str; }
  friend bool operator==(const CString& a, const char16_t* b) { return a.Compare(b) == 0; }
  friend bool operator==(const char16_t* a, const CString& b) { return b.Compare(a) == 0; }
  friend bool operator!=(const CString& a, const CString& b) { return !(a == b); }
  friend bool operator!=(const CString& a, const char16_t* b) { return !(a == b); }
  friend bool operator<(const CString& a, const CString& b) { return a.m_str < b.m_str; }

  friend CString operator+(const CString& a, const CString& b);
  friend CString operator+(const CString& a, const char16_t* b);
  friend CString operator+(const char16_t* a, const CString& b);
  friend CString operator+(const CString& a, char16_t b);

 private:
  std::u16string m_str;
};
