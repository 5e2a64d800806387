#include "secure/SecureBuffer.h"

#include <crypto++/misc.h>

#include "owutils/Exceptions.h"
#include "platform/Errors.h"
#include "platform/Text.h"

namespace secure {

SecureBuffer::SecureBuffer(size_t size) : m_pData(new BYTE[size == 0 ? 1 : size]()), m_size(size) {}

SecureBuffer::~SecureBuffer() { Wipe(m_pData.get(), m_size); }

void Wipe(void* data, size_t size) noexcept {
  if (data != nullptr && size != 0) CryptoPP::SecureWipeBuffer(static_cast<BYTE*>(data), size);
}

std::string StrictUtf8(const char16_t* text, size_t length) {
  std::string out;
  if (length == 0) return out;
  const int units = static_cast<int>(length);
  int needed = Platform::WideCharToMultiByte(Platform::kCodePageUtf8, Platform::kWcErrInvalidChars, text, units,
                                             nullptr, 0, nullptr, nullptr);
  if (needed > 0) {
    out.resize(static_cast<size_t>(needed));
    needed = Platform::WideCharToMultiByte(Platform::kCodePageUtf8, Platform::kWcErrInvalidChars, text, units,
                                           out.data(), needed, nullptr, nullptr);
  }
  if (needed <= 0) {
    const DWORD error = Platform::GetLastError();
    Wipe(out.data(), out.size());
    THROW_AT(LumoException::Win32ErrorCode(u"WideCharToMultiByte", static_cast<int>(error)));
  }
  return out;
}

CString WideFromUtf8(const char* text) {
  const int needed = Platform::MultiByteToWideChar(Platform::kCodePageUtf8, 0, text, -1, nullptr, 0);
  if (needed <= 1) return CString();
  std::u16string wide(static_cast<size_t>(needed), u'\0');
  Platform::MultiByteToWideChar(Platform::kCodePageUtf8, 0, text, -1, wide.data(), needed);
  wide.resize(static_cast<size_t>(needed - 1));
  return CString(std::move(wide));
}

}  // namespace secure
