// A small read-only text file: line by line over the platform file API.
#pragma once

#include <string>
#include <vector>

#include "owutils/CString.h"
#include "owutils/WinTypes.h"

namespace FileSystemInternal {

class TextFile {
 public:
  TextFile() = default;
  TextFile(const TextFile&) = delete;
  TextFile& operator=(const TextFile&) = delete;
  ~TextFile() { Close(); }

  // Opens the file for reading (others may read and write it too). False with the last error set.
  bool Open(const CString& path);
  void SeekToBegin();
  // The next line without its line end ("\n" or "\r\n"), decoded from UTF-8 (a leading byte-order
  // mark is skipped). False at the end of the file, or on a read error (then the last error is
  // set and Failed() is true).
  bool ReadString(CString& line);
  bool Failed() const noexcept { return m_bFailed; }
  void Close();

 private:
  bool Fill();

  HANDLE m_hFile = INVALID_HANDLE_VALUE;
  std::vector<char> m_buffer;
  size_t m_position = 0;
  size_t m_end = 0;
  bool m_bEof = false;
  bool m_bFailed = false;
  bool m_bAtStart = true;
};

}  // namespace FileSystemInternal
