#include "owutils/ForeignExceptions.h"

#include <algorithm>

#include "owutils/Exceptions.h"
#include "platform/Errors.h"

namespace {

BOOL CopyText(const std::u16string& text, char16_t* buffer, UINT maxChars) {
  if (buffer == nullptr || maxChars == 0) return FALSE;
  size_t n = std::min<size_t>(text.size(), maxChars - 1);
  text.copy(buffer, n);
  buffer[n] = 0;
  return text.empty() ? FALSE : TRUE;
}

}  // namespace

BOOL CException::GetErrorMessage(char16_t* buffer, UINT maxChars, UINT* helpContext) const {
  if (helpContext != nullptr) *helpContext = 0;
  return CopyText(u"", buffer, maxChars);
}

CFileException::CFileException(int cause, LONG osError, const char16_t* fileName)
    : m_cause(cause), m_lOsError(osError), m_strFileName(fileName != nullptr ? fileName : u"") {}

BOOL CFileException::GetErrorMessage(char16_t* buffer, UINT maxChars, UINT* helpContext) const {
  if (helpContext != nullptr) *helpContext = 0;
  Lumo::String text;
  std::u16string system;
  if (m_lOsError != 0 && Platform::GetSystemMessage(static_cast<DWORD>(m_lOsError), system)) {
    while (!system.empty() && (system.back() == u'\n' || system.back() == u'\r')) system.pop_back();
    text.Format(u"%s (%s)", system.c_str(), m_strFileName.c_str());
  } else {
    text.Format(u"A file error %d occurred for '%s'.", m_cause, m_strFileName.c_str());
  }
  return CopyText(text, buffer, maxChars);
}

ComError::ComError(HRESULT hr, std::u16string description, std::u16string source)
    : m_hr(hr), m_description(std::move(description)), m_source(std::move(source)) {}

std::u16string ComError::ErrorMessage() const {
  std::u16string system;
  if (Platform::GetSystemMessage(static_cast<DWORD>(m_hr), system)) {
    while (!system.empty() && (system.back() == u'\n' || system.back() == u'\r')) system.pop_back();
    return system;
  }
  Lumo::String text;
  text.Format(u"Unknown error 0x%08lX", static_cast<DWORD>(m_hr));
  return text;
}
