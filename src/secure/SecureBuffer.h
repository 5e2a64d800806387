// Scratch buffers of the security unit: zero-filled on creation, wiped when released, so that
// key bytes and plaintext do not linger in freed memory.
#pragma once

#include <cstddef>
#include <memory>
#include <string>

#include "owutils/CString.h"
#include "owutils/WinTypes.h"

namespace secure {

class SecureBuffer {
 public:
  explicit SecureBuffer(size_t size);
  ~SecureBuffer();
  SecureBuffer(const SecureBuffer&) = delete;
  SecureBuffer& operator=(const SecureBuffer&) = delete;

  BYTE* get() const noexcept { return m_pData.get(); }
  char* chars() const noexcept { return reinterpret_cast<char*>(m_pData.get()); }
  size_t size() const noexcept { return m_size; }

 private:
  std::unique_ptr<BYTE[]> m_pData;
  size_t m_size;
};

// Overwrites `size` bytes with zeros in a way the compiler keeps.
void Wipe(void* data, size_t size) noexcept;

// UTF-8 of `text` without a terminator. Text that is not valid UTF-16 (an unpaired surrogate)
// throws Win32ErrorCode for "WideCharToMultiByte" with ERROR_NO_UNICODE_TRANSLATION rather than
// being altered: two different texts must never turn into the same bytes.
std::string StrictUtf8(const char16_t* text, size_t length);

// Wide text of zero-terminated UTF-8; bytes that are not UTF-8 become U+FFFD.
CString WideFromUtf8(const char* text);

}  // namespace secure
