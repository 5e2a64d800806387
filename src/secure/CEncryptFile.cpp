// CEncrypt: whole files, encrypted in place, and file digests.
//
// File encryption reads a chunk, transforms its whole blocks, and writes it back where it came
// from, with one buffer of FILE_BUFFER_SIZE bytes whatever the file's size. The file is opened
// exclusively for the whole run, so no other opener reads or writes it meanwhile. Writes only
// ever cover bytes just read: the file is never truncated or extended.
#include <ctime>
#include <memory>

#include "owutils/CEncrypt.h"
#include "owutils/Exceptions.h"
#include "owutils/Paths.h"
#include "platform/Errors.h"
#include "platform/Files.h"
#include "secure/BlockTransformation.h"
#include "secure/SecureBuffer.h"

namespace {

// A platform file handle closed when the scope ends.
class ScopedFile {
 public:
  explicit ScopedFile(HANDLE handle) noexcept : m_handle(handle) {}
  ~ScopedFile() {
    if (IsOpen()) Platform::CloseHandle(m_handle);
  }
  ScopedFile(const ScopedFile&) = delete;
  ScopedFile& operator=(const ScopedFile&) = delete;
  bool IsOpen() const noexcept { return m_handle != INVALID_HANDLE_VALUE && m_handle != nullptr; }
  HANDLE Get() const noexcept { return m_handle; }

 private:
  HANDLE m_handle;
};

// The class library's file-error cause for a Win32 error.
int FileCause(DWORD error) noexcept {
  switch (error) {
    case ERROR_FILE_NOT_FOUND: return 2;       // fileNotFound
    case ERROR_PATH_NOT_FOUND: return 3;       // badPath
    case ERROR_TOO_MANY_OPEN_FILES: return 4;  // tooManyOpenFiles
    case ERROR_ACCESS_DENIED: return 5;        // accessDenied
    case ERROR_INVALID_HANDLE: return 6;       // invalidFile
    case ERROR_SHARING_VIOLATION: return 11;   // sharingViolation
    case ERROR_LOCK_VIOLATION: return 12;      // lockViolation
    case ERROR_HANDLE_DISK_FULL:
    case ERROR_DISK_FULL: return 13;           // diskFull
    default: return 1;                         // genericException
  }
}

// What the class library's file class throws when a call fails.
[[noreturn]] void ThrowFileError(const CString& file) {
  const DWORD error = Platform::GetLastError();
  throw CFileException(FileCause(error), static_cast<LONG>(error), file.GetString());
}

void Seek(HANDLE file, ULONGLONG position, const CString& name) {
  LARGE_INTEGER distance;
  distance.QuadPart = static_cast<LONGLONG>(position);
  if (!Platform::SetFilePointerEx(file, distance, nullptr, FILE_BEGIN)) ThrowFileError(name);
}

// Writes all `size` bytes or fails; a write that reports success but falls short counts as a
// failed write.
bool WriteAll(HANDLE file, const BYTE* data, DWORD size, DWORD* written) {
  *written = 0;
  if (!Platform::WriteFile(file, data, size, written, nullptr)) return false;
  if (*written != size) {
    Platform::SetLastError(ERROR_WRITE_FAULT);
    return false;
  }
  return true;
}

// Reads until `size` bytes are in or the file ends: a read may return less than asked for before
// the end, and taking that for the end would leave the rest of the file unprocessed.
bool ReadChunk(HANDLE file, BYTE* data, DWORD size, DWORD* read) {
  *read = 0;
  while (*read < size) {
    DWORD got = 0;
    if (!Platform::ReadFile(file, data + *read, size - *read, &got, nullptr)) return false;
    if (got == 0) break;
    *read += got;
  }
  return true;
}

}  // namespace

// ---- File encryption ------------------------------------------------------------------------

BOOL CEncrypt::EncryptFile(const CString& strFile) { return ProcessFile(strFile, true); }

BOOL CEncrypt::DecryptFile(const CString& strFile) { return ProcessFile(strFile, false); }

BOOL CEncrypt::ProcessFile(const CString& strFile, bool encrypt) {
  const int tryLine = __LINE__;
  try {
    PRECONDITION(!strFile.IsEmpty());
    ASSERTION(m_bInit == TRUE);
    ASSERTION2(m_bUsingEncr == TRUE && !m_strKey.IsEmpty(), m_bUsingEncr, !m_strKey.IsEmpty());
    Encryptor();
    ASSERTION2((FILE_BUFFER_SIZE % m_pEncryptPtr->BlockSize() ) == 0, FILE_BUFFER_SIZE, m_pEncryptPtr->BlockSize());

    // Share mode 0: the file stays locked against every other opener until it is closed.
    ScopedFile file(Platform::CreateFileW(strFile.GetString(), GENERIC_READ | GENERIC_WRITE, 0, nullptr, OPEN_EXISTING,
                                          FILE_ATTRIBUTE_NORMAL, nullptr));
    if (!file.IsOpen()) {
      const DWORD error = Platform::GetLastError();
      CFileException cause(FileCause(error), static_cast<LONG>(error), strFile.GetString());
      THROW_AT(LumoException::MFCException(&cause));
    }

    BlockTransformation* forward = encrypt ? Encryptor() : Decryptor();
    secure::SecureBuffer buffer(FILE_BUFFER_SIZE);
    const size_t blockSize = forward->BlockSize();
    ULONGLONG position = 0;
    DWORD read = 0;
    do {
      if (!ReadChunk(file.Get(), buffer.get(), FILE_BUFFER_SIZE, &read)) ThrowFileError(strFile);
      if (read > 0) {
        forward->ProcessBlocks(buffer.get(), read / blockSize);
        Seek(file.Get(), position, strFile);
        DWORD written = 0;
        if (!WriteAll(file.Get(), buffer.get(), read, &written)) {
          const DWORD error = Platform::GetLastError();
          if (written > 0) {
            // Put back what the failed write changed, so the chunk is either whole or untouched.
            BlockTransformation* backward = encrypt ? Decryptor() : Encryptor();
            backward->ProcessBlocks(buffer.get(), read / blockSize);
            DWORD restored = 0;
            if (Platform::SetFilePointerEx(file.Get(), LARGE_INTEGER{.QuadPart = static_cast<LONGLONG>(position)},
                                           nullptr, FILE_BEGIN)) {
              WriteAll(file.Get(), buffer.get(), written, &restored);
            }
          }
          Platform::SetLastError(error);
          ThrowFileError(strFile);
        }
        position += read;
        Seek(file.Get(), position, strFile);
      }
    } while (read == FILE_BUFFER_SIZE);
    return TRUE;
  } catch (LumoException::Exception& e) {
    LumoException::detail::ReportUnexpected(&e, OW_WIDE_FILE, __LINE__, tryLine);
  } catch (CException& e) {
    try {
      LumoException::MFCException wrapped(&e);
      LumoException::detail::ReportUnexpected(&wrapped, OW_WIDE_FILE, __LINE__, tryLine);
    } catch (...) {
      LumoException::detail::ReportUnexpected(nullptr, OW_WIDE_FILE, __LINE__, tryLine);
    }
  } catch (...) {
    LumoException::detail::ReportUnexpected(nullptr, OW_WIDE_FILE, __LINE__, tryLine);
  }
  return FALSE;
}

// ---- File digests -----------------------------------------------------------------------------

void CEncrypt::CloseDigestFile() noexcept {
  if (m_hFile != INVALID_HANDLE_VALUE && m_hFile != nullptr) Platform::CloseHandle(m_hFile);
  m_hFile = INVALID_HANDLE_VALUE;
}

BOOL CEncrypt::DigestFile(const CString& strFile) {
  try {
    PRECONDITION(!strFile.IsEmpty());
    ASSERTION(m_bInit == TRUE);
    ASSERTION2(m_bUsingEncr == FALSE && m_strKey.IsEmpty(), m_bUsingEncr, !m_strKey.IsEmpty());
    ResetDigest();

    ScopedFile file(Platform::CreateFileW(strFile.GetString(), GENERIC_READ, FILE_SHARE_READ, nullptr, OPEN_EXISTING,
                                          FILE_ATTRIBUTE_NORMAL, nullptr));
    if (!file.IsOpen()) THROW_AT(LumoException::Win32Error(u"CreateFile"));

    std::unique_ptr<BYTE[]> buffer(new BYTE[FILE_BUFFER_SIZE]);
    for (;;) {
      DWORD nBytesRead = 0;
      if (!Platform::ReadFile(file.Get(), buffer.get(), FILE_BUFFER_SIZE, &nBytesRead, nullptr)) {
        THROW_AT(LumoException::Win32Error(u"ReadFile"));
      }
      if (nBytesRead == 0) break;
      ASSERTION(Digest( buffer.get(), (int)nBytesRead ));
    }
    return TRUE;
  } catch (LumoException::Exception& e) {
    try {
      UnableToDigestFile failure(Lumo::String(strFile.GetString()), e);
      failure.Report(u"CEncrypt::DigestFile");
    } catch (...) {
      // A failing report must not turn into a failing digest call.
    }
  }
  return FALSE;
}

BOOL CEncrypt::DigestFileWTimeout(const CString& strFile, int timeout, BOOL* pbFirst, BOOL* pbDone) {
  try {
    PRECONDITION(pbFirst != NULL && pbDone != NULL);
    ASSERTION(m_bInit == TRUE);
    ASSERTION2(m_bUsingEncr == FALSE && m_strKey.IsEmpty(), m_bUsingEncr, !m_strKey.IsEmpty());

    if (strFile.IsEmpty() || timeout == 0) {
      CloseDigestFile();
      *pbDone = TRUE;
      return TRUE;
    }

    if (*pbFirst) {
      ResetDigest();
      *pbFirst = FALSE;
      CloseDigestFile();  // a slice left open by an abandoned run
      m_hFile = Platform::CreateFileW(Paths::ToLongPath(strFile).GetString(), GENERIC_READ, FILE_SHARE_READ, nullptr,
                                      OPEN_EXISTING, FILE_ATTRIBUTE_NORMAL, nullptr);
      if (m_hFile == INVALID_HANDLE_VALUE) THROW_AT(LumoException::Win32Error(u"CreateFile"));
    }

    const std::time_t start = std::time(nullptr);
    std::unique_ptr<BYTE[]> buffer(new BYTE[FILE_BUFFER_SIZE]);
    int reads = 0;
    for (;;) {
      DWORD nBytesRead = 0;
      if (!Platform::ReadFile(m_hFile, buffer.get(), FILE_BUFFER_SIZE, &nBytesRead, nullptr)) {
        THROW_AT(LumoException::Win32Error(u"ReadFile"));
      }
      if (nBytesRead == 0) {
        CloseDigestFile();
        *pbDone = TRUE;
        return TRUE;
      }
      ASSERTION(Digest( buffer.get(), (int)nBytesRead ));
      if (reads == 16) {
        reads = 0;
        if (std::difftime(std::time(nullptr), start) >= timeout) return TRUE;  // file stays open
      }
      ++reads;
    }
  } catch (LumoException::Exception& e) {
    try {
      UnableToDigestFile failure(Lumo::String(strFile.GetString()), e);
      failure.Report(u"CEncrypt::DigestFileWTimeout");
    } catch (...) {
      // A failing report must not turn into a failing digest call.
    }
    CloseDigestFile();
    if (pbDone != nullptr) *pbDone = TRUE;
  }
  return FALSE;
}
