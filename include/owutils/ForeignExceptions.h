// Stand-ins for the exception types of the Windows class library and of COM support.
//
// LumoException::MFCException and LumoException::COMException wrap these. On POSIX nothing else
// throws them; client code that ports class-library or COM code derives from them so that the
// wrappers keep working.
#pragma once

#include <string>

#include "owutils/Export.h"
#include "owutils/WinTypes.h"

// The class library's exception root: gives its error text into a caller's buffer.
class OWUTILS_API CException {
 public:
  virtual ~CException() = default;
  // Writes at most maxChars-1 units of the error text and a terminator; false when no text.
  virtual BOOL GetErrorMessage(char16_t* buffer, UINT maxChars, UINT* helpContext) const;
};

// The class library's file exception: an error cause, the native error and the file name.
class OWUTILS_API CFileException : public CException {
 public:
  CFileException(int cause, LONG osError, const char16_t* fileName);
  BOOL GetErrorMessage(char16_t* buffer, UINT maxChars, UINT* helpContext) const override;

  int m_cause;
  LONG m_lOsError;
  std::u16string m_strFileName;
};

// COM support's error object: an HRESULT with description, message and source texts.
class OWUTILS_API ComError {
 public:
  explicit ComError(HRESULT hr, std::u16string description = {}, std::u16string source = {});
  HRESULT Error() const noexcept { return m_hr; }
  const std::u16string& Description() const noexcept { return m_description; }
  // The system text of the HRESULT, or "Unknown error 0x%08lX" without one.
  std::u16string ErrorMessage() const;
  const std::u16string& Source() const noexcept { return m_source; }

 private:
  HRESULT m_hr;
  std::u16string m_description;
  std::u16string m_source;
};
