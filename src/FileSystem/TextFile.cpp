// A small read-only text file.
#include "FileSystem/TextFile.h"

#include "platform/Errors.h"
#include "platform/Files.h"
#include "platform/Text.h"

namespace FileSystemInternal {

bool TextFile::Open(const CString& path) {
  Close();
  m_hFile = Platform::CreateFileW(path, GENERIC_READ, FILE_SHARE_READ | FILE_SHARE_WRITE, nullptr, OPEN_EXISTING,
                                  FILE_ATTRIBUTE_NORMAL, nullptr);
  if (m_hFile == INVALID_HANDLE_VALUE) return false;
  m_buffer.resize(1 << 16);
  SeekToBegin();
  return true;
}

void TextFile::SeekToBegin() {
  if (m_hFile == INVALID_HANDLE_VALUE) return;
  LARGE_INTEGER zero{};
  Platform::SetFilePointerEx(m_hFile, zero, nullptr, FILE_BEGIN);
  m_position = m_end = 0;
  m_bEof = m_bFailed = false;
  m_bAtStart = true;
}

bool TextFile::Fill() {
  if (m_bEof || m_bFailed) return false;
  DWORD read = 0;
  if (!Platform::ReadFile(m_hFile, m_buffer.data(), static_cast<DWORD>(m_buffer.size()), &read, nullptr)) {
    m_bFailed = true;
    return false;
  }
  m_position = 0;
  m_end = read;
  if (read == 0) m_bEof = true;
  return read > 0;
}

bool TextFile::ReadString(CString& line) {
  line.Empty();
  if (m_hFile == INVALID_HANDLE_VALUE) return false;
  std::string bytes;
  bool any = false;
  for (;;) {
    if (m_position == m_end && !Fill()) break;
    any = true;
    const char* start = m_buffer.data() + m_position;
    const char* stop = start + (m_end - m_position);
    const char* newline = start;
    while (newline < stop && *newline != '\n') ++newline;
    bytes.append(start, newline);
    m_position += static_cast<size_t>(newline - start);
    if (newline < stop) {
      ++m_position;  // the '\n'
      break;
    }
  }
  if (m_bFailed || !any) return false;
  if (!bytes.empty() && bytes.back() == '\r') bytes.pop_back();
  if (m_bAtStart) {
    m_bAtStart = false;
    if (bytes.compare(0, 3, "\xEF\xBB\xBF") == 0) bytes.erase(0, 3);
  }
  if (!bytes.empty()) {
    int n = Platform::MultiByteToWideChar(Platform::kCodePageUtf8, 0, bytes.data(), static_cast<int>(bytes.size()),
                                          nullptr, 0);
    if (n > 0) {
      char16_t* out = line.GetBuffer(n);
      Platform::MultiByteToWideChar(Platform::kCodePageUtf8, 0, bytes.data(), static_cast<int>(bytes.size()), out, n);
      line.ReleaseBuffer(n);
    }
  }
  return true;
}

void TextFile::Close() {
  if (m_hFile != INVALID_HANDLE_VALUE) Platform::CloseHandle(m_hFile);
  m_hFile = INVALID_HANDLE_VALUE;
}

}  // namespace FileSystemInternal
