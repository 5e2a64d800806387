// POSIX backend: where the registry and event-log stores live.
#include "platform/StateDirectory.h"

#include <pwd.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>

#include "platform/posix/NativeText.h"
#include "platform/Errors.h"
#include "platform/Text.h"
#include "platform/posix/StateStore.h"

namespace Platform {
namespace posix {
namespace {

std::string HomeDirectory() {
  const char* home = std::getenv("HOME");
  if (home != nullptr && *home != 0) return home;
  struct passwd entry;
  struct passwd* found = nullptr;
  char buffer[4096];
  if (getpwuid_r(geteuid(), &entry, buffer, sizeof buffer, &found) == 0 && found != nullptr && found->pw_dir != nullptr)
    return found->pw_dir;
  return std::string();
}

// mkdir -p with mode 0700 for the folders it creates.
bool MakeDirectories(const std::string& path) {
  struct stat st;
  if (stat(path.c_str(), &st) == 0) {
    if (S_ISDIR(st.st_mode)) return true;
    errno = ENOTDIR;
    return false;
  }
  std::string::size_type slash = path.find_last_of('/');
  if (slash != std::string::npos && slash > 0 && !MakeDirectories(path.substr(0, slash))) return false;
  if (mkdir(path.c_str(), 0700) == 0 || errno == EEXIST) return true;
  return false;
}

}  // namespace

bool NativeStateDirectory(std::string& path) {
  const char* configured = std::getenv("OWUTILS_STATE_DIR");
  if (configured != nullptr && *configured != 0) {
    path = configured;
  } else if (geteuid() == 0) {
    path = "/var/lib/owutils";
  } else if (const char* xdg = std::getenv("XDG_STATE_HOME"); xdg != nullptr && *xdg == '/') {
    path = std::string(xdg) + "/owutils";
  } else {
    std::string home = HomeDirectory();
    if (home.empty()) {
      SetLastError(ERROR_PATH_NOT_FOUND);
      return false;
    }
    path = home + "/.local/state/owutils";
  }
  while (path.size() > 1 && path.back() == '/') path.pop_back();
  if (!MakeDirectories(path)) {
    SetLastErrorFromErrno(errno);
    return false;
  }
  return true;
}

}  // namespace posix

bool GetStateDirectory(std::u16string& path) {
  std::string native;
  if (!posix::NativeStateDirectory(native)) return false;
  path = Posix::ToUtf16(native);
  return true;
}

}  // namespace Platform
