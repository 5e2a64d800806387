// POSIX backend: files, directories and volumes (see platform/Files.h).
#include "platform/Files.h"

#include <dirent.h>
#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <sys/statvfs.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <string>
#include <vector>

#include "platform/Errors.h"
#include "platform/FaultInjection.h"
#include "platform/PathMap.h"
#include "platform/posix/NativeText.h"

#ifndef ERROR_NEGATIVE_SEEK
#define ERROR_NEGATIVE_SEEK 131
#endif

namespace Platform {
namespace {

using FaultInjection::Check;

BOOL Fail(DWORD error) {
  SetLastError(error);
  return FALSE;
}

BOOL FailErrno(int error) {
  SetLastErrorFromErrno(error);
  return FALSE;
}

// The missing-path error of Win32: 2 when the directory of the path exists, 3 when not.
DWORD MissingError(const std::string& native) {
  std::string parent = native;
  while (parent.size() > 1 && parent.back() == '/') parent.pop_back();
  size_t slash = parent.rfind('/');
  if (slash == std::string::npos) return ERROR_FILE_NOT_FOUND;
  parent.resize(slash == 0 ? 1 : slash);
  struct stat st;
  if (::stat(parent.c_str(), &st) == 0 && S_ISDIR(st.st_mode)) return ERROR_FILE_NOT_FOUND;
  return ERROR_PATH_NOT_FOUND;
}

// Sets the last error for a failed call on `native`, telling 2 from 3 for a missing path.
void SetPathError(int error, const std::string& native) {
  if (error == ENOENT) {
    SetLastError(MissingError(native));
  } else if (error == ENOTDIR) {
    SetLastError(ERROR_PATH_NOT_FOUND);
  } else {
    SetLastErrorFromErrno(error);
  }
}

bool Map(const char16_t* path, std::string& native, bool wildcards = false) {
  return MapToNative(path, native, wildcards);
}

FILETIME ToFileTime(const struct timespec& ts) {
  // 100-nanosecond intervals since 1601-01-01.
  constexpr std::int64_t kEpochDifference = 11644473600LL;
  std::int64_t value = (static_cast<std::int64_t>(ts.tv_sec) + kEpochDifference) * 10000000LL + ts.tv_nsec / 100;
  if (value < 0) value = 0;
  FILETIME ft;
  ft.dwLowDateTime = static_cast<DWORD>(static_cast<std::uint64_t>(value) & 0xFFFFFFFFu);
  ft.dwHighDateTime = static_cast<DWORD>(static_cast<std::uint64_t>(value) >> 32);
  return ft;
}

struct timespec FromFileTime(const FILETIME& ft) {
  constexpr std::int64_t kEpochDifference = 11644473600LL;
  std::int64_t value = static_cast<std::int64_t>((static_cast<std::uint64_t>(ft.dwHighDateTime) << 32) | ft.dwLowDateTime);
  struct timespec ts;
  ts.tv_sec = static_cast<time_t>(value / 10000000LL - kEpochDifference);
  ts.tv_nsec = static_cast<long>((value % 10000000LL) * 100);
  return ts;
}

DWORD AttributesOf(const struct stat& st, bool linkToDirectory) {
  DWORD attributes = 0;
  if (S_ISLNK(st.st_mode)) {
    attributes |= FILE_ATTRIBUTE_REPARSE_POINT;
    if (linkToDirectory) attributes |= FILE_ATTRIBUTE_DIRECTORY;
    return attributes;
  }
  if (S_ISDIR(st.st_mode)) attributes |= FILE_ATTRIBUTE_DIRECTORY;
  if ((st.st_mode & S_IWUSR) == 0) attributes |= FILE_ATTRIBUTE_READONLY;
  if (attributes == 0) attributes = FILE_ATTRIBUTE_NORMAL;
  return attributes;
}

// lstat with the attributes of a Win32 query; a link is looked through only to learn whether it
// points at a directory.
bool QueryPath(const std::string& native, struct stat& st, DWORD& attributes) {
  if (::lstat(native.c_str(), &st) != 0) return false;
  bool linkToDirectory = false;
  if (S_ISLNK(st.st_mode)) {
    struct stat target;
    linkToDirectory = ::stat(native.c_str(), &target) == 0 && S_ISDIR(target.st_mode);
  }
  attributes = AttributesOf(st, linkToDirectory);
  return true;
}

FILETIME CreationTime(const struct stat& st) {
  // No birth time in stat: the earlier of the change and modification times stands in.
  const struct timespec& c = st.st_ctim;
  const struct timespec& m = st.st_mtim;
  bool changeFirst = c.tv_sec < m.tv_sec || (c.tv_sec == m.tv_sec && c.tv_nsec < m.tv_nsec);
  return ToFileTime(changeFirst ? c : m);
}

// --- Handles ----------------------------------------------------------------------------------

class FileObject : public HandleObject {
 public:
  FileObject(int fd, std::string deleteOnClose) : m_fd(fd), m_deleteOnClose(std::move(deleteOnClose)) {}
  ~FileObject() override {
    if (m_fd >= 0) Close();
  }
  bool Close() override {
    int fd = m_fd;
    m_fd = -1;
    if (!m_deleteOnClose.empty()) ::unlink(m_deleteOnClose.c_str());
    if (fd >= 0 && ::close(fd) != 0 && errno != EINTR) {
      SetLastErrorFromErrno(errno);
      return false;
    }
    return true;
  }
  int fd() const noexcept { return m_fd; }

 private:
  int m_fd;
  std::string m_deleteOnClose;
};

FileObject* AsFile(HANDLE handle) {
  if (handle == nullptr || handle == INVALID_HANDLE_VALUE) return nullptr;
  auto* object = static_cast<HandleObject*>(handle);
  if (!object->IsValid()) return nullptr;
  return dynamic_cast<FileObject*>(object);
}

bool WantsRead(DWORD access) {
  return (access & (GENERIC_READ | GENERIC_ALL | FILE_READ_DATA)) != 0;
}
bool WantsWrite(DWORD access) {
  return (access & (GENERIC_WRITE | GENERIC_ALL | FILE_WRITE_DATA | FILE_APPEND_DATA)) != 0;
}

// --- Copying ----------------------------------------------------------------------------------

bool CopyData(int from, int to) {
  for (;;) {
    ssize_t n = ::copy_file_range(from, nullptr, to, nullptr, 1 << 30, 0);
    if (n > 0) continue;
    if (n == 0) return true;
    if (errno == EINTR) continue;
    if (errno != EXDEV && errno != EINVAL && errno != ENOSYS && errno != EOPNOTSUPP && errno != EBADF) return false;
    break;
  }
  // A pair of files copy_file_range cannot serve: plain reads and writes.
  std::vector<char> buffer(1 << 16);
  for (;;) {
    ssize_t n = ::read(from, buffer.data(), buffer.size());
    if (n == 0) return true;
    if (n < 0) {
      if (errno == EINTR) continue;
      return false;
    }
    ssize_t done = 0;
    while (done < n) {
      ssize_t w = ::write(to, buffer.data() + done, static_cast<size_t>(n - done));
      if (w < 0) {
        if (errno == EINTR) continue;
        return false;
      }
      done += w;
    }
  }
}

BOOL CopyLinkNative(const std::string& from, const std::string& to, bool failIfExists, const struct stat& source) {
  std::vector<char> target(static_cast<size_t>(source.st_size > 0 ? source.st_size : 255) + 1);
  ssize_t n = ::readlink(from.c_str(), target.data(), target.size() - 1);
  if (n < 0) return FailErrno(errno);
  target[static_cast<size_t>(n)] = 0;
  if (!failIfExists) {
    struct stat existing;
    if (::lstat(to.c_str(), &existing) == 0) {
      if (S_ISDIR(existing.st_mode)) return Fail(ERROR_ACCESS_DENIED);
      ::unlink(to.c_str());
    }
  }
  if (::symlink(target.data(), to.c_str()) != 0) {
    if (errno == EEXIST) return Fail(ERROR_FILE_EXISTS);
    SetPathError(errno, to);
    return FALSE;
  }
  return TRUE;
}

BOOL CopyNative(const std::string& from, const std::string& to, bool failIfExists, bool copyLink) {
  if (copyLink) {
    struct stat source;
    if (::lstat(from.c_str(), &source) != 0) {
      SetPathError(errno, from);
      return FALSE;
    }
    if (S_ISLNK(source.st_mode)) return CopyLinkNative(from, to, failIfExists, source);
  }
  int in = ::open(from.c_str(), O_RDONLY | O_CLOEXEC);
  if (in < 0) {
    SetPathError(errno, from);
    return FALSE;
  }
  struct stat st;
  if (::fstat(in, &st) != 0 || S_ISDIR(st.st_mode)) {
    int error = errno;
    bool directory = S_ISDIR(st.st_mode);
    ::close(in);
    return directory ? Fail(ERROR_ACCESS_DENIED) : FailErrno(error);
  }
  mode_t mode = st.st_mode & 07777;
  // A new destination is created exclusively; an existing one is opened without truncation
  // first, for it may be the source under another name, or read-only.
  bool created = true;
  int out = ::open(to.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, mode | S_IWUSR);
  if (out < 0 && errno == EEXIST && !failIfExists) {
    created = false;
    struct stat existing;
    if (::lstat(to.c_str(), &existing) == 0 && !S_ISDIR(existing.st_mode) && (existing.st_mode & S_IWUSR) == 0) {
      // A read-only destination is not overwritten, whatever rights the caller has.
      ::close(in);
      return Fail(ERROR_ACCESS_DENIED);
    }
    out = ::open(to.c_str(), O_WRONLY | O_CLOEXEC);
  }
  if (out < 0) {
    int error = errno;
    ::close(in);
    if (error == EEXIST) return Fail(ERROR_FILE_EXISTS);
    if (error == EISDIR) return Fail(ERROR_ACCESS_DENIED);
    SetPathError(error, to);
    return FALSE;
  }
  struct stat dst;
  bool ok = true;
  if (!created) {
    if (::fstat(out, &dst) == 0 && dst.st_dev == st.st_dev && dst.st_ino == st.st_ino) {
      ::close(out);
      ::close(in);
      return Fail(ERROR_SHARING_VIOLATION);
    }
    ok = ::ftruncate(out, 0) == 0;
  }
  ok = ok && CopyData(in, out);
  int error = errno;
  if (ok) {
    struct timespec times[2] = {st.st_atim, st.st_mtim};
    ::futimens(out, times);
    // Created with the owner's write permission added and the umask taken away: the source's
    // permissions (and so its read-only attribute) are set last.
    ::fchmod(out, mode);
  }
  if (::close(out) != 0 && ok) {
    ok = false;
    error = errno;
  }
  ::close(in);
  if (!ok) {
    // Nothing incomplete is left behind under the destination's name.
    ::unlink(to.c_str());
    return FailErrno(error);
  }
  return TRUE;
}

// --- Wildcards --------------------------------------------------------------------------------

bool Match(const char16_t* p, const char16_t* pe, const char16_t* n, const char16_t* ne) {
  // Iterative matcher with one backtrack point for the last star.
  const char16_t* starP = nullptr;
  const char16_t* starN = nullptr;
  while (n < ne) {
    if (p < pe && (*p == u'?' || *p == *n)) {
      ++p;
      ++n;
    } else if (p < pe && *p == u'*') {
      starP = ++p;
      starN = n;
    } else if (starP != nullptr) {
      p = starP;
      n = ++starN;
    } else {
      return false;
    }
  }
  while (p < pe && *p == u'*') ++p;
  return p == pe;
}

bool WildcardMatch(const std::u16string& pattern, const std::u16string& name) {
  const char16_t* p = pattern.data();
  const char16_t* pe = p + pattern.size();
  if (Match(p, pe, name.data(), name.data() + name.size())) return true;
  // "x.*" also matches "x": a trailing ".*" may stand for no extension at all.
  if (pattern.size() >= 2 && pattern.compare(pattern.size() - 2, 2, u".*") == 0 &&
      name.find(u'.') == std::u16string::npos) {
    return Match(p, pe - 2, name.data(), name.data() + name.size());
  }
  return false;
}

bool HasWildcards(const std::u16string& text) {
  return text.find_first_of(u"*?") != std::u16string::npos;
}

class FindObject : public HandleObject {
 public:
  ~FindObject() override {
    if (m_dir != nullptr) Close();
  }
  bool Close() override {
    if (m_dir != nullptr) ::closedir(m_dir);
    m_dir = nullptr;
    return true;
  }

  std::string m_directory;  // native, for single-entry searches
  DIR* m_dir = nullptr;
  std::vector<std::string> m_names;
  std::vector<unsigned char> m_types;  // d_type of each name, for the names-and-types level
  bool m_namesAndTypes = false;
  size_t m_next = 0;
};

FindObject* AsFind(HANDLE handle) {
  if (handle == nullptr || handle == INVALID_HANDLE_VALUE) return nullptr;
  auto* object = static_cast<HandleObject*>(handle);
  if (!object->IsValid()) return nullptr;
  return dynamic_cast<FindObject*>(object);
}

void FillFindData(const std::string& name, const struct stat& st, bool linkToDirectory, WIN32_FIND_DATAW* data) {
  std::memset(data, 0, sizeof *data);
  data->dwFileAttributes = AttributesOf(st, linkToDirectory);
  data->ftCreationTime = CreationTime(st);
  data->ftLastAccessTime = ToFileTime(st.st_atim);
  data->ftLastWriteTime = ToFileTime(st.st_mtim);
  if (!S_ISDIR(st.st_mode)) {
    auto size = static_cast<std::uint64_t>(st.st_size);
    data->nFileSizeHigh = static_cast<DWORD>(size >> 32);
    data->nFileSizeLow = static_cast<DWORD>(size & 0xFFFFFFFFu);
  }
  if (S_ISLNK(st.st_mode)) data->dwReserved0 = IO_REPARSE_TAG_SYMLINK;
  std::u16string wide = Posix::ToUtf16(name);
  size_t n = std::min(wide.size(), static_cast<size_t>(MAX_PATH - 1));
  std::memcpy(data->cFileName, wide.data(), n * sizeof(char16_t));
}

void FillNameAndType(const std::string& name, DWORD attributes, WIN32_FIND_DATAW* data) {
  std::memset(data, 0, sizeof *data);
  data->dwFileAttributes = attributes;
  std::u16string wide = Posix::ToUtf16(name);
  size_t n = std::min(wide.size(), static_cast<size_t>(MAX_PATH - 1));
  std::memcpy(data->cFileName, wide.data(), n * sizeof(char16_t));
}

// Delivers the next entry that still exists.
bool NextEntry(FindObject* find, WIN32_FIND_DATAW* data) {
  while (find->m_next < find->m_names.size()) {
    size_t index = find->m_next++;
    const std::string& name = find->m_names[index];
    if (find->m_namesAndTypes && find->m_dir != nullptr && index < find->m_types.size()) {
      unsigned char type = find->m_types[index];
      if (type == DT_DIR) {
        FillNameAndType(name, FILE_ATTRIBUTE_DIRECTORY, data);
        return true;
      }
      if (type == DT_LNK) {
        struct stat target;
        bool toDirectory = ::fstatat(::dirfd(find->m_dir), name.c_str(), &target, 0) == 0 && S_ISDIR(target.st_mode);
        FillNameAndType(name, FILE_ATTRIBUTE_REPARSE_POINT | (toDirectory ? FILE_ATTRIBUTE_DIRECTORY : 0u), data);
        return true;
      }
      if (type != DT_UNKNOWN) {
        FillNameAndType(name, FILE_ATTRIBUTE_NORMAL, data);
        return true;
      }
    }
    struct stat st;
    int rc = find->m_dir != nullptr ? ::fstatat(::dirfd(find->m_dir), name.c_str(), &st, AT_SYMLINK_NOFOLLOW)
                                    : ::lstat((find->m_directory + "/" + name).c_str(), &st);
    if (rc != 0) continue;
    bool linkToDirectory = false;
    if (S_ISLNK(st.st_mode)) {
      struct stat target;
      linkToDirectory = find->m_dir != nullptr
                            ? ::fstatat(::dirfd(find->m_dir), name.c_str(), &target, 0) == 0 && S_ISDIR(target.st_mode)
                            : ::stat((find->m_directory + "/" + name).c_str(), &target) == 0 && S_ISDIR(target.st_mode);
    }
    FillFindData(name, st, linkToDirectory, data);
    return true;
  }
  return false;
}

}  // namespace

// --- Handles ----------------------------------------------------------------------------------

HANDLE CreateFileW(const char16_t* fileName, DWORD access, DWORD shareMode, SECURITY_ATTRIBUTES*,
                   DWORD disposition, DWORD flagsAndAttributes, HANDLE) noexcept {
  if (Check("CreateFile")) return INVALID_HANDLE_VALUE;
  std::string native;
  if (!Map(fileName, native)) return INVALID_HANDLE_VALUE;
  bool read = WantsRead(access);
  bool write = WantsWrite(access);
  int flags = O_CLOEXEC | O_NOCTTY;
  flags |= write ? (read ? O_RDWR : O_WRONLY) : O_RDONLY;
  if ((access & FILE_APPEND_DATA) != 0 && (access & (FILE_WRITE_DATA | GENERIC_WRITE | GENERIC_ALL)) == 0) flags |= O_APPEND;
  if ((flagsAndAttributes & FILE_FLAG_WRITE_THROUGH) != 0) flags |= O_DSYNC;
  struct stat before;
  bool existed = ::stat(native.c_str(), &before) == 0;
  switch (disposition) {
    case CREATE_NEW: flags |= O_CREAT | O_EXCL; break;
    case CREATE_ALWAYS: flags |= O_CREAT | O_TRUNC; break;
    case OPEN_EXISTING: break;
    case OPEN_ALWAYS: flags |= O_CREAT; break;
    case TRUNCATE_EXISTING:
      if (!write) {
        SetLastError(ERROR_INVALID_PARAMETER);
        return INVALID_HANDLE_VALUE;
      }
      flags |= O_TRUNC;
      break;
    default: SetLastError(ERROR_INVALID_PARAMETER); return INVALID_HANDLE_VALUE;
  }
  if (existed && S_ISDIR(before.st_mode)) {
    if ((flagsAndAttributes & FILE_FLAG_BACKUP_SEMANTICS) == 0 || write || disposition == CREATE_NEW ||
        disposition == CREATE_ALWAYS || disposition == TRUNCATE_EXISTING) {
      SetLastError(disposition == CREATE_NEW ? ERROR_FILE_EXISTS : ERROR_ACCESS_DENIED);
      return INVALID_HANDLE_VALUE;
    }
    flags = O_RDONLY | O_CLOEXEC | O_DIRECTORY;
  }
  if (existed && !S_ISDIR(before.st_mode) && (before.st_mode & S_IWUSR) == 0 &&
      (write || disposition == CREATE_ALWAYS || disposition == TRUNCATE_EXISTING) && disposition != CREATE_NEW) {
    // A read-only file is not written to, whatever rights the caller has.
    SetLastError(ERROR_ACCESS_DENIED);
    return INVALID_HANDLE_VALUE;
  }
  mode_t mode = (flagsAndAttributes & FILE_ATTRIBUTE_READONLY) != 0 ? 0444 : 0666;
  int fd = ::open(native.c_str(), flags, mode);
  if (fd < 0 && errno == EACCES && access == 0 && (flags & O_CREAT) == 0) {
    // A query-only handle needs no read permission.
    fd = ::open(native.c_str(), O_PATH | O_CLOEXEC);
  }
  if (fd < 0) {
    int error = errno;
    if (error == EEXIST) {
      SetLastError(ERROR_FILE_EXISTS);
    } else if (error == EISDIR) {
      SetLastError(ERROR_ACCESS_DENIED);
    } else {
      SetPathError(error, native);
    }
    return INVALID_HANDLE_VALUE;
  }
  // Sharing: share mode 0 holds the open file description's lock exclusively.
  if (::flock(fd, (shareMode == 0 ? LOCK_EX : LOCK_SH) | LOCK_NB) != 0 && errno != EBADF) {
    int error = errno;
    bool created = !existed && (flags & O_CREAT) != 0;
    ::close(fd);
    if (created) ::unlink(native.c_str());
    SetLastError(error == EWOULDBLOCK ? ERROR_SHARING_VIOLATION : Win32ErrorFromErrno(error));
    return INVALID_HANDLE_VALUE;
  }
  std::string deleteOnClose = (flagsAndAttributes & FILE_FLAG_DELETE_ON_CLOSE) != 0 ? native : std::string();
  auto* object = new (std::nothrow) FileObject(fd, std::move(deleteOnClose));
  if (object == nullptr) {
    ::close(fd);
    SetLastError(ERROR_NOT_ENOUGH_MEMORY);
    return INVALID_HANDLE_VALUE;
  }
  SetLastError(existed && (disposition == CREATE_ALWAYS || disposition == OPEN_ALWAYS) ? ERROR_ALREADY_EXISTS
                                                                                       : ERROR_SUCCESS);
  return static_cast<HandleObject*>(object);
}

BOOL ReadFile(HANDLE file, void* buffer, DWORD toRead, DWORD* read, void* overlapped) noexcept {
  if (read != nullptr) *read = 0;
  if (Check("ReadFile")) return FALSE;
  FileObject* object = AsFile(file);
  if (object == nullptr) return Fail(ERROR_INVALID_HANDLE);
  if (overlapped != nullptr || (buffer == nullptr && toRead > 0)) return Fail(ERROR_INVALID_PARAMETER);
  DWORD want = FaultInjection::LimitTransfer("ReadFile", toRead);
  DWORD done = 0;
  auto* bytes = static_cast<char*>(buffer);
  while (done < want) {
    ssize_t n = ::read(object->fd(), bytes + done, want - done);
    if (n == 0) break;
    if (n < 0) {
      if (errno == EINTR) continue;
      if (read != nullptr) *read = done;
      return FailErrno(errno == EISDIR ? EACCES : errno);
    }
    done += static_cast<DWORD>(n);
  }
  if (read != nullptr) *read = done;
  return TRUE;
}

BOOL WriteFile(HANDLE file, const void* buffer, DWORD toWrite, DWORD* written, void* overlapped) noexcept {
  if (written != nullptr) *written = 0;
  if (Check("WriteFile")) return FALSE;
  FileObject* object = AsFile(file);
  if (object == nullptr) return Fail(ERROR_INVALID_HANDLE);
  if (overlapped != nullptr || (buffer == nullptr && toWrite > 0)) return Fail(ERROR_INVALID_PARAMETER);
  DWORD want = FaultInjection::LimitTransfer("WriteFile", toWrite);
  DWORD done = 0;
  const auto* bytes = static_cast<const char*>(buffer);
  while (done < want) {
    ssize_t n = ::write(object->fd(), bytes + done, want - done);
    if (n < 0) {
      if (errno == EINTR) continue;
      if (written != nullptr) *written = done;
      return FailErrno(errno == EBADF ? EACCES : errno);
    }
    done += static_cast<DWORD>(n);
  }
  if (written != nullptr) *written = done;
  return TRUE;
}

BOOL SetFilePointerEx(HANDLE file, LARGE_INTEGER distance, LARGE_INTEGER* newPosition, DWORD method) noexcept {
  if (Check("SetFilePointer")) return FALSE;
  FileObject* object = AsFile(file);
  if (object == nullptr) return Fail(ERROR_INVALID_HANDLE);
  int whence = method == FILE_BEGIN ? SEEK_SET : method == FILE_CURRENT ? SEEK_CUR : method == FILE_END ? SEEK_END : -1;
  if (whence < 0) return Fail(ERROR_INVALID_PARAMETER);
  off_t position = ::lseek(object->fd(), static_cast<off_t>(distance.QuadPart), whence);
  if (position < 0) return errno == EINVAL ? Fail(ERROR_NEGATIVE_SEEK) : FailErrno(errno);
  if (newPosition != nullptr) newPosition->QuadPart = position;
  return TRUE;
}

BOOL SetEndOfFile(HANDLE file) noexcept {
  if (Check("SetEndOfFile")) return FALSE;
  FileObject* object = AsFile(file);
  if (object == nullptr) return Fail(ERROR_INVALID_HANDLE);
  off_t position = ::lseek(object->fd(), 0, SEEK_CUR);
  if (position < 0) return FailErrno(errno);
  if (::ftruncate(object->fd(), position) != 0) return FailErrno(errno == EINVAL || errno == EBADF ? EACCES : errno);
  return TRUE;
}

BOOL GetFileSizeEx(HANDLE file, LARGE_INTEGER* size) noexcept {
  if (Check("GetFileSize")) return FALSE;
  FileObject* object = AsFile(file);
  if (object == nullptr) return Fail(ERROR_INVALID_HANDLE);
  if (size == nullptr) return Fail(ERROR_INVALID_PARAMETER);
  struct stat st;
  if (::fstat(object->fd(), &st) != 0) return FailErrno(errno);
  size->QuadPart = S_ISDIR(st.st_mode) ? 0 : st.st_size;
  return TRUE;
}

BOOL FlushFileBuffers(HANDLE file) noexcept {
  if (Check("FlushFileBuffers")) return FALSE;
  FileObject* object = AsFile(file);
  if (object == nullptr) return Fail(ERROR_INVALID_HANDLE);
  if (::fsync(object->fd()) != 0) return FailErrno(errno == EBADF ? EACCES : errno);
  return TRUE;
}

BOOL GetFileInformationByHandle(HANDLE file, BY_HANDLE_FILE_INFORMATION* info) noexcept {
  if (Check("GetFileInformationByHandle")) return FALSE;
  FileObject* object = AsFile(file);
  if (object == nullptr) return Fail(ERROR_INVALID_HANDLE);
  if (info == nullptr) return Fail(ERROR_INVALID_PARAMETER);
  struct stat st;
  if (::fstat(object->fd(), &st) != 0) return FailErrno(errno);
  std::memset(info, 0, sizeof *info);
  info->dwFileAttributes = AttributesOf(st, false);
  info->ftCreationTime = CreationTime(st);
  info->ftLastAccessTime = ToFileTime(st.st_atim);
  info->ftLastWriteTime = ToFileTime(st.st_mtim);
  auto device = static_cast<std::uint64_t>(st.st_dev);
  info->dwVolumeSerialNumber = static_cast<DWORD>(device ^ (device >> 32));
  auto size = static_cast<std::uint64_t>(S_ISDIR(st.st_mode) ? 0 : st.st_size);
  info->nFileSizeHigh = static_cast<DWORD>(size >> 32);
  info->nFileSizeLow = static_cast<DWORD>(size & 0xFFFFFFFFu);
  info->nNumberOfLinks = static_cast<DWORD>(st.st_nlink);
  auto inode = static_cast<std::uint64_t>(st.st_ino);
  info->nFileIndexHigh = static_cast<DWORD>(inode >> 32);
  info->nFileIndexLow = static_cast<DWORD>(inode & 0xFFFFFFFFu);
  return TRUE;
}

BOOL GetFileTime(HANDLE file, FILETIME* creation, FILETIME* lastAccess, FILETIME* lastWrite) noexcept {
  if (Check("GetFileTime")) return FALSE;
  FileObject* object = AsFile(file);
  if (object == nullptr) return Fail(ERROR_INVALID_HANDLE);
  struct stat st;
  if (::fstat(object->fd(), &st) != 0) return FailErrno(errno);
  if (creation != nullptr) *creation = CreationTime(st);
  if (lastAccess != nullptr) *lastAccess = ToFileTime(st.st_atim);
  if (lastWrite != nullptr) *lastWrite = ToFileTime(st.st_mtim);
  return TRUE;
}

BOOL SetFileTime(HANDLE file, const FILETIME*, const FILETIME* lastAccess, const FILETIME* lastWrite) noexcept {
  if (Check("SetFileTime")) return FALSE;
  FileObject* object = AsFile(file);
  if (object == nullptr) return Fail(ERROR_INVALID_HANDLE);
  struct timespec times[2];
  times[0].tv_nsec = UTIME_OMIT;
  times[1].tv_nsec = UTIME_OMIT;
  if (lastAccess != nullptr) times[0] = FromFileTime(*lastAccess);
  if (lastWrite != nullptr) times[1] = FromFileTime(*lastWrite);
  if (::futimens(object->fd(), times) != 0) return FailErrno(errno);
  return TRUE;
}

BOOL CloseHandle(HANDLE handle) noexcept {
  if (handle == nullptr || handle == INVALID_HANDLE_VALUE) return Fail(ERROR_INVALID_HANDLE);
  auto* object = static_cast<HandleObject*>(handle);
  if (!object->IsValid()) return Fail(ERROR_INVALID_HANDLE);
  bool ok = object->Close();
  DWORD error = GetLastError();
  delete object;
  if (!ok) return Fail(error);
  // As on Windows, a close that fails has still released the handle: an injected failure is
  // reported after the release, never instead of it.
  if (Check("CloseHandle")) return FALSE;
  return TRUE;
}

// --- Files by name ----------------------------------------------------------------------------

BOOL CopyFileW(const char16_t* source, const char16_t* destination, BOOL failIfExists) noexcept {
  if (Check("CopyFile")) return FALSE;
  std::string from, to;
  if (!Map(source, from) || !Map(destination, to)) return FALSE;
  return CopyNative(from, to, failIfExists != FALSE, false);
}

BOOL CopyFileExW(const char16_t* source, const char16_t* destination, void*, void*, BOOL* cancel,
                 DWORD flags) noexcept {
  if (Check("CopyFile")) return FALSE;
  if (cancel != nullptr && *cancel) return Fail(ERROR_OPERATION_ABORTED);
  std::string from, to;
  if (!Map(source, from) || !Map(destination, to)) return FALSE;
  return CopyNative(from, to, (flags & COPY_FILE_FAIL_IF_EXISTS) != 0, (flags & COPY_FILE_COPY_SYMLINK) != 0);
}

namespace {

BOOL MoveNative(const std::string& from, const std::string& to, DWORD flags) {
  struct stat source;
  if (::lstat(from.c_str(), &source) != 0) {
    SetPathError(errno, from);
    return FALSE;
  }
  bool replace = (flags & MOVEFILE_REPLACE_EXISTING) != 0;
  struct stat target;
  bool targetExists = ::lstat(to.c_str(), &target) == 0;
  bool sameFile = targetExists && target.st_dev == source.st_dev && target.st_ino == source.st_ino;
  if (targetExists && !sameFile) {
    if (!replace) return Fail(ERROR_ALREADY_EXISTS);
    if (S_ISDIR(target.st_mode) || S_ISDIR(source.st_mode)) return Fail(ERROR_ACCESS_DENIED);
  }
  int rc = replace ? ::renameat2(AT_FDCWD, from.c_str(), AT_FDCWD, to.c_str(), 0)
                   : ::renameat2(AT_FDCWD, from.c_str(), AT_FDCWD, to.c_str(), RENAME_NOREPLACE);
  if (rc != 0 && !replace && (errno == EINVAL || errno == ENOSYS)) {
    // A file system without the no-replace rename: the check above has to do.
    rc = ::rename(from.c_str(), to.c_str());
  }
  if (rc == 0) {
    if ((flags & MOVEFILE_WRITE_THROUGH) != 0) {
      std::string directory = to.substr(0, to.rfind('/') == std::string::npos ? 0 : to.rfind('/'));
      int fd = ::open(directory.empty() ? "." : directory.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
      if (fd >= 0) {
        ::fsync(fd);
        ::close(fd);
      }
    }
    return TRUE;
  }
  int error = errno;
  if (error == EEXIST) return Fail(ERROR_ALREADY_EXISTS);
  if (error == EXDEV) {
    if ((flags & MOVEFILE_COPY_ALLOWED) == 0 || S_ISDIR(source.st_mode)) return Fail(ERROR_NOT_SAME_DEVICE);
    if (!CopyNative(from, to, !replace, true)) return FALSE;
    if ((flags & MOVEFILE_WRITE_THROUGH) != 0) {
      int fd = ::open(to.c_str(), O_RDONLY | O_CLOEXEC);
      if (fd >= 0) {
        ::fsync(fd);
        ::close(fd);
      }
    }
    if (::unlink(from.c_str()) != 0) return FailErrno(errno);
    return TRUE;
  }
  if (error == EISDIR || error == ENOTEMPTY) return Fail(ERROR_ACCESS_DENIED);
  SetPathError(error, error == ENOENT ? to : from);
  return FALSE;
}

}  // namespace

BOOL MoveFileW(const char16_t* source, const char16_t* destination) noexcept {
  if (Check("MoveFile")) return FALSE;
  std::string from, to;
  if (!Map(source, from) || !Map(destination, to)) return FALSE;
  return MoveNative(from, to, MOVEFILE_COPY_ALLOWED);
}

BOOL MoveFileExW(const char16_t* source, const char16_t* destination, DWORD flags) noexcept {
  if (Check("MoveFile")) return FALSE;
  std::string from, to;
  if (!Map(source, from) || !Map(destination, to)) return FALSE;
  return MoveNative(from, to, flags);
}

BOOL DeleteFileW(const char16_t* fileName) noexcept {
  if (Check("DeleteFile")) return FALSE;
  std::string native;
  if (!Map(fileName, native)) return FALSE;
  struct stat st;
  DWORD attributes = 0;
  if (!QueryPath(native, st, attributes)) {
    SetPathError(errno, native);
    return FALSE;
  }
  if ((attributes & (FILE_ATTRIBUTE_DIRECTORY | FILE_ATTRIBUTE_READONLY)) != 0) return Fail(ERROR_ACCESS_DENIED);
  if (::unlink(native.c_str()) != 0) {
    SetPathError(errno, native);
    return FALSE;
  }
  return TRUE;
}

DWORD GetFileAttributesW(const char16_t* fileName) noexcept {
  if (Check("GetFileAttributes")) return INVALID_FILE_ATTRIBUTES;
  std::string native;
  if (!Map(fileName, native)) return INVALID_FILE_ATTRIBUTES;
  struct stat st;
  DWORD attributes = 0;
  if (!QueryPath(native, st, attributes)) {
    SetPathError(errno, native);
    return INVALID_FILE_ATTRIBUTES;
  }
  return attributes;
}

BOOL GetFileAttributesExW(const char16_t* fileName, int infoLevel, void* information) noexcept {
  if (Check("GetFileAttributes")) return FALSE;
  if (infoLevel != GetFileExInfoStandard || information == nullptr) return Fail(ERROR_INVALID_PARAMETER);
  std::string native;
  if (!Map(fileName, native)) return FALSE;
  struct stat st;
  DWORD attributes = 0;
  if (!QueryPath(native, st, attributes)) {
    SetPathError(errno, native);
    return FALSE;
  }
  auto* data = static_cast<WIN32_FILE_ATTRIBUTE_DATA*>(information);
  data->dwFileAttributes = attributes;
  data->ftCreationTime = CreationTime(st);
  data->ftLastAccessTime = ToFileTime(st.st_atim);
  data->ftLastWriteTime = ToFileTime(st.st_mtim);
  auto size = static_cast<std::uint64_t>(S_ISDIR(st.st_mode) ? 0 : st.st_size);
  data->nFileSizeHigh = static_cast<DWORD>(size >> 32);
  data->nFileSizeLow = static_cast<DWORD>(size & 0xFFFFFFFFu);
  return TRUE;
}

BOOL SetFileAttributesW(const char16_t* fileName, DWORD attributes) noexcept {
  if (Check("SetFileAttributes")) return FALSE;
  std::string native;
  if (!Map(fileName, native)) return FALSE;
  struct stat st;
  if (::stat(native.c_str(), &st) != 0) {
    SetPathError(errno, native);
    return FALSE;
  }
  mode_t mode = st.st_mode & 07777;
  mode_t wanted = (attributes & FILE_ATTRIBUTE_READONLY) != 0 ? (mode & ~static_cast<mode_t>(0222)) : (mode | S_IWUSR);
  if (wanted != mode && ::chmod(native.c_str(), wanted) != 0) return FailErrno(errno);
  return TRUE;
}

// --- Searching --------------------------------------------------------------------------------

namespace {

HANDLE FindFirst(const char16_t* pattern, WIN32_FIND_DATAW* data, bool namesAndTypes) {
  if (data == nullptr) {
    SetLastError(ERROR_INVALID_PARAMETER);
    return INVALID_HANDLE_VALUE;
  }
  std::string native;
  if (!Map(pattern, native, true)) return INVALID_HANDLE_VALUE;
  size_t slash = native.rfind('/');
  std::string directory = slash == std::string::npos ? "." : native.substr(0, slash == 0 ? 1 : slash);
  std::string last = slash == std::string::npos ? native : native.substr(slash + 1);
  if (last.empty()) {
    SetLastError(ERROR_FILE_NOT_FOUND);
    return INVALID_HANDLE_VALUE;
  }
  std::u16string wildcard = Posix::ToUtf16(last);
  auto* find = new (std::nothrow) FindObject();
  if (find == nullptr) {
    SetLastError(ERROR_NOT_ENOUGH_MEMORY);
    return INVALID_HANDLE_VALUE;
  }
  find->m_directory = directory;
  find->m_namesAndTypes = namesAndTypes;
  if (!HasWildcards(wildcard)) {
    // One name: no need to read the directory.
    find->m_names.push_back(last);
  } else {
    find->m_dir = ::opendir(directory.c_str());
    if (find->m_dir == nullptr) {
      int error = errno;
      delete find;
      SetLastError(error == ENOENT || error == ENOTDIR ? ERROR_PATH_NOT_FOUND : Win32ErrorFromErrno(error));
      return INVALID_HANDLE_VALUE;
    }
    bool matchAll = wildcard == u"*" || wildcard == u"*.*";
    std::vector<std::pair<std::string, unsigned char>> entries;
    while (struct dirent* entry = ::readdir(find->m_dir)) {
      if (matchAll || WildcardMatch(wildcard, Posix::ToUtf16(entry->d_name, std::strlen(entry->d_name)))) {
        entries.emplace_back(entry->d_name, entry->d_type);
      }
    }
    std::sort(entries.begin(), entries.end());
    find->m_names.reserve(entries.size());
    find->m_types.reserve(entries.size());
    for (auto& entry : entries) {
      find->m_names.push_back(std::move(entry.first));
      find->m_types.push_back(entry.second);
    }
  }
  if (!NextEntry(find, data)) {
    bool directoryMissing = find->m_dir == nullptr && MissingError(native) == ERROR_PATH_NOT_FOUND;
    delete find;
    SetLastError(directoryMissing ? ERROR_PATH_NOT_FOUND : ERROR_FILE_NOT_FOUND);
    return INVALID_HANDLE_VALUE;
  }
  SetLastError(ERROR_SUCCESS);
  return static_cast<HandleObject*>(find);
}

}  // namespace

HANDLE FindFirstFileW(const char16_t* pattern, WIN32_FIND_DATAW* data) noexcept {
  if (Check("FindFirstFile")) return INVALID_HANDLE_VALUE;
  try {
    return FindFirst(pattern, data, false);
  } catch (...) {
    SetLastError(ERROR_NOT_ENOUGH_MEMORY);
    return INVALID_HANDLE_VALUE;
  }
}

HANDLE FindFirstFileExW(const char16_t* pattern, int infoLevel, WIN32_FIND_DATAW* data, int searchOp, void* filter,
                        DWORD) noexcept {
  if (Check("FindFirstFile")) return INVALID_HANDLE_VALUE;
  bool known = infoLevel == FindExInfoStandard || infoLevel == FindExInfoBasic || infoLevel == kFindExInfoNamesAndTypes;
  if (!known || searchOp != FindExSearchNameMatch || filter != nullptr) {
    SetLastError(ERROR_INVALID_PARAMETER);
    return INVALID_HANDLE_VALUE;
  }
  try {
    return FindFirst(pattern, data, infoLevel == kFindExInfoNamesAndTypes);
  } catch (...) {
    SetLastError(ERROR_NOT_ENOUGH_MEMORY);
    return INVALID_HANDLE_VALUE;
  }
}

BOOL FindNextFileW(HANDLE handle, WIN32_FIND_DATAW* data) noexcept {
  if (Check("FindNextFile")) return FALSE;
  FindObject* find = AsFind(handle);
  if (find == nullptr) return Fail(ERROR_INVALID_HANDLE);
  if (data == nullptr) return Fail(ERROR_INVALID_PARAMETER);
  try {
    if (!NextEntry(find, data)) return Fail(ERROR_NO_MORE_FILES);
  } catch (...) {
    return Fail(ERROR_NOT_ENOUGH_MEMORY);
  }
  return TRUE;
}

BOOL FindClose(HANDLE handle) noexcept {
  if (Check("FindClose")) return FALSE;
  FindObject* find = AsFind(handle);
  if (find == nullptr) return Fail(ERROR_INVALID_HANDLE);
  delete find;
  return TRUE;
}

// --- Directories and volumes ------------------------------------------------------------------

BOOL CreateDirectoryW(const char16_t* path, SECURITY_ATTRIBUTES*) noexcept {
  if (Check("CreateDirectory")) return FALSE;
  std::string native;
  if (!Map(path, native)) return FALSE;
  if (::mkdir(native.c_str(), 0777) != 0) {
    if (errno == EEXIST) return Fail(ERROR_ALREADY_EXISTS);
    if (errno == ENOENT || errno == ENOTDIR) return Fail(ERROR_PATH_NOT_FOUND);
    return FailErrno(errno);
  }
  return TRUE;
}

BOOL RemoveDirectoryW(const char16_t* path) noexcept {
  if (Check("RemoveDirectory")) return FALSE;
  std::string native;
  if (!Map(path, native)) return FALSE;
  while (native.size() > 1 && native.back() == '/') native.pop_back();
  struct stat st;
  DWORD attributes = 0;
  if (!QueryPath(native, st, attributes)) {
    return Fail(errno == ENOENT || errno == ENOTDIR ? ERROR_PATH_NOT_FOUND : Win32ErrorFromErrno(errno));
  }
  if ((attributes & FILE_ATTRIBUTE_DIRECTORY) == 0) return Fail(ERROR_DIRECTORY);
  if (S_ISLNK(st.st_mode)) {
    // The link goes, its target stays.
    if (::unlink(native.c_str()) != 0) return FailErrno(errno);
    return TRUE;
  }
  if (::rmdir(native.c_str()) != 0) {
    if (errno == ENOTEMPTY || errno == EEXIST) return Fail(ERROR_DIR_NOT_EMPTY);
    if (errno == ENOENT) return Fail(ERROR_PATH_NOT_FOUND);
    if (errno == EBUSY) return Fail(ERROR_ACCESS_DENIED);
    return FailErrno(errno);
  }
  return TRUE;
}

BOOL GetDiskFreeSpaceExW(const char16_t* path, ULARGE_INTEGER* freeToCaller, ULARGE_INTEGER* total,
                         ULARGE_INTEGER* totalFree) noexcept {
  if (Check("GetDiskFreeSpaceEx")) return FALSE;
  std::string native;
  if (!Map(path, native)) return FALSE;
  struct stat st;
  if (::stat(native.c_str(), &st) != 0) {
    SetPathError(errno, native);
    return FALSE;
  }
  if (!S_ISDIR(st.st_mode)) return Fail(ERROR_DIRECTORY);
  struct statvfs vfs;
  if (::statvfs(native.c_str(), &vfs) != 0) return FailErrno(errno);
  auto unit = static_cast<ULONGLONG>(vfs.f_frsize != 0 ? vfs.f_frsize : vfs.f_bsize);
  if (freeToCaller != nullptr) freeToCaller->QuadPart = static_cast<ULONGLONG>(vfs.f_bavail) * unit;
  if (total != nullptr) total->QuadPart = static_cast<ULONGLONG>(vfs.f_blocks) * unit;
  if (totalFree != nullptr) totalFree->QuadPart = static_cast<ULONGLONG>(vfs.f_bfree) * unit;
  return TRUE;
}

namespace {

DWORD PathNameOfExisting(const char16_t* path, char16_t* buffer, DWORD bufferSize) {
  if (path == nullptr) {
    SetLastError(ERROR_INVALID_PARAMETER);
    return 0;
  }
  std::string native;
  if (!Map(path, native)) return 0;
  struct stat st;
  if (::lstat(native.c_str(), &st) != 0) {
    SetPathError(errno, native);
    return 0;
  }
  size_t length = std::char_traits<char16_t>::length(path);
  if (buffer == nullptr || bufferSize <= length) return static_cast<DWORD>(length + 1);
  std::memmove(buffer, path, length * sizeof(char16_t));
  buffer[length] = 0;
  return static_cast<DWORD>(length);
}

}  // namespace

DWORD GetLongPathNameW(const char16_t* path, char16_t* buffer, DWORD bufferSize) noexcept {
  if (Check("GetLongPathName")) return 0;
  return PathNameOfExisting(path, buffer, bufferSize);
}

DWORD GetShortPathNameW(const char16_t* path, char16_t* buffer, DWORD bufferSize) noexcept {
  if (Check("GetShortPathName")) return 0;
  return PathNameOfExisting(path, buffer, bufferSize);
}

}  // namespace Platform
