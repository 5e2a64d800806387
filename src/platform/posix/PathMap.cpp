// POSIX backend: the path mapping (see platform/PathMap.h).
#include "platform/PathMap.h"

#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <mutex>
#include <vector>

#include "platform/Errors.h"
#include "platform/posix/NativeText.h"

namespace Platform {
namespace {

struct Drive {
  char16_t letter;     // upper case
  std::string root;    // native, no trailing slash except for "/"
};

struct MapState {
  std::string drivesText;  // the variables the tables were built from
  std::string uncText;
  bool uncSet = false;
  std::vector<Drive> drives;
  std::string uncRoot;
};

char16_t Upper(char16_t c) { return (c >= u'a' && c <= u'z') ? static_cast<char16_t>(c - u'a' + u'A') : c; }
bool IsLetter(char16_t c) { return (c >= u'a' && c <= u'z') || (c >= u'A' && c <= u'Z'); }
bool IsSeparator(char16_t c) { return c == u'\\' || c == u'/'; }

std::string TrimRoot(std::string root) {
  while (root.size() > 1 && root.back() == '/') root.pop_back();
  return root;
}

void Parse(MapState& state) {
  state.drives.clear();
  std::string text = state.drivesText.empty() ? std::string("C=/") : state.drivesText;
  size_t start = 0;
  while (start <= text.size()) {
    size_t end = text.find(';', start);
    if (end == std::string::npos) end = text.size();
    std::string entry = text.substr(start, end - start);
    if (entry.size() >= 3 && entry[1] == '=' && IsLetter(static_cast<char16_t>(entry[0])) && entry[2] == '/') {
      char16_t letter = Upper(static_cast<char16_t>(entry[0]));
      bool known = false;
      for (const Drive& d : state.drives) known = known || d.letter == letter;
      if (!known) state.drives.push_back(Drive{letter, TrimRoot(entry.substr(2))});
    }
    start = end + 1;
  }
  bool rootMapped = false;
  for (const Drive& d : state.drives) rootMapped = rootMapped || d.root == "/";
  if (!rootMapped) {
    for (char16_t letter = u'Z'; letter >= u'A'; --letter) {
      bool taken = false;
      for (const Drive& d : state.drives) taken = taken || d.letter == letter;
      if (!taken) {
        state.drives.push_back(Drive{letter, "/"});
        break;
      }
    }
  }
  state.uncRoot = state.uncSet ? TrimRoot(state.uncText) : std::string();
}

// A copy of the current tables, rebuilt when the environment changed.
MapState Current() {
  static std::mutex lock;
  static MapState cached;
  static bool built = false;
  const char* drives = std::getenv("OWUTILS_DRIVES");
  const char* unc = std::getenv("OWUTILS_UNC_ROOT");
  std::lock_guard<std::mutex> guard(lock);
  std::string drivesText = drives != nullptr ? drives : "";
  bool uncSet = unc != nullptr && unc[0] != '\0';
  std::string uncText = uncSet ? unc : "";
  if (!built || drivesText != cached.drivesText || uncSet != cached.uncSet || uncText != cached.uncText) {
    cached.drivesText = drivesText;
    cached.uncSet = uncSet;
    cached.uncText = uncText;
    Parse(cached);
    built = true;
  }
  return cached;
}

bool StartsWith(const std::u16string& s, const char16_t* prefix) {
  return s.compare(0, std::char_traits<char16_t>::length(prefix), prefix) == 0;
}

// Splits `text` at separators into names; empty names are dropped.
std::vector<std::u16string> SplitNames(const std::u16string& text) {
  std::vector<std::u16string> names;
  size_t start = 0;
  for (size_t i = 0; i <= text.size(); ++i) {
    if (i == text.size() || IsSeparator(text[i])) {
      if (i > start) names.push_back(text.substr(start, i - start));
      start = i + 1;
    }
  }
  return names;
}

bool ValidName(const std::u16string& name, bool wildcards) {
  for (char16_t c : name) {
    if (c < 32 || c == u'<' || c == u'>' || c == u'"' || c == u'|' || c == u':') return false;
    if (!wildcards && (c == u'*' || c == u'?')) return false;
  }
  return true;
}

// Resolves "." and ".." among `names`, never above the first `fixed` names.
std::vector<std::u16string> Resolve(const std::vector<std::u16string>& names, size_t fixed) {
  std::vector<std::u16string> out;
  for (size_t i = 0; i < names.size(); ++i) {
    const std::u16string& n = names[i];
    if (i >= fixed && n == u".") continue;
    if (i >= fixed && n == u"..") {
      if (out.size() > fixed) out.pop_back();
      continue;
    }
    out.push_back(n);
  }
  return out;
}

std::string Join(const std::string& root, const std::vector<std::u16string>& names, size_t from) {
  std::string out = root;
  for (size_t i = from; i < names.size(); ++i) {
    if (i > from || !out.empty()) {
      if (out.empty() || out.back() != '/') out += '/';
    }
    out += Posix::ToUtf8(names[i]);
  }
  return out;
}

bool Fail(DWORD error) {
  SetLastError(error);
  return false;
}

bool DriveRoot(const MapState& state, char16_t letter, std::string& root) {
  letter = Upper(letter);
  for (const Drive& d : state.drives) {
    if (d.letter == letter) {
      root = d.root;
      return true;
    }
  }
  return false;
}

bool IsUnder(const std::string& path, const std::string& root, std::string& rest) {
  if (root == "/") {
    rest = path.substr(1);
    return true;
  }
  if (path.compare(0, root.size(), root) != 0) return false;
  if (path.size() == root.size()) {
    rest.clear();
    return true;
  }
  if (path[root.size()] != '/') return false;
  rest = path.substr(root.size() + 1);
  return true;
}

std::u16string Backslashed(const std::string& rest) {
  std::u16string out = Posix::ToUtf16(rest);
  for (char16_t& c : out) {
    if (c == u'/') c = u'\\';
  }
  while (!out.empty() && out.back() == u'\\') out.pop_back();
  return out;
}

}  // namespace

bool MapToNative(const char16_t* path, std::string& native, bool allowWildcards) {
  if (path == nullptr || path[0] == 0) return Fail(ERROR_PATH_NOT_FOUND);
  std::u16string s(path);
  bool unc = false;
  if (StartsWith(s, u"\\\\?\\UNC\\") || StartsWith(s, u"\\\\.\\UNC\\")) {
    unc = true;
    s.erase(0, 8);
  } else if (StartsWith(s, u"\\\\?\\") || StartsWith(s, u"\\\\.\\")) {
    s.erase(0, 4);
  } else if (s.size() >= 2 && IsSeparator(s[0]) && IsSeparator(s[1])) {
    unc = true;
    s.erase(0, 2);
  }
  bool trailing = !s.empty() && IsSeparator(s.back());
  MapState state = Current();

  std::vector<std::u16string> names;
  std::string root;
  size_t fixed = 0;
  if (unc) {
    names = SplitNames(s);
    if (!state.uncSet || names.empty()) return Fail(ERROR_BAD_NETPATH);
    if (names.size() < 2) return Fail(ERROR_BAD_NET_NAME);
    if (names[0] == u"." || names[0] == u".." || names[1] == u"." || names[1] == u"..") {
      return Fail(ERROR_BAD_NETPATH);
    }
    root = state.uncRoot;
    fixed = 2;
  } else if (s.size() >= 2 && IsLetter(s[0]) && s[1] == u':') {
    if (!DriveRoot(state, s[0], root)) return Fail(ERROR_PATH_NOT_FOUND);
    names = SplitNames(s.substr(2));
  } else if (!s.empty() && IsSeparator(s[0])) {
    // Rooted without a drive: the drive of the current directory.
    char buffer[4096];
    if (getcwd(buffer, sizeof buffer) == nullptr) return Fail(SetLastErrorFromErrno(errno));
    std::u16string cwd = MapFromNative(buffer);
    if (cwd.size() < 2 || cwd[1] != u':' || !DriveRoot(state, cwd[0], root)) return Fail(ERROR_PATH_NOT_FOUND);
    names = SplitNames(s);
  } else {
    // Relative: stays relative to the process's current directory.
    names = SplitNames(s);
    for (size_t i = 0; i < names.size(); ++i) {
      if (!ValidName(names[i], allowWildcards && i + 1 == names.size())) return Fail(ERROR_INVALID_NAME);
    }
    native = Join(std::string(), names, 0);
    if (native.empty()) native = ".";
    if (trailing) native += '/';
    return true;
  }
  for (size_t i = 0; i < names.size(); ++i) {
    if (!ValidName(names[i], allowWildcards && i + 1 == names.size())) return Fail(ERROR_INVALID_NAME);
  }
  names = Resolve(names, fixed);
  native = Join(root, names, 0);
  if (trailing && !names.empty() && native.back() != '/') native += '/';
  return true;
}

std::u16string MapFromNative(const std::string& native) {
  if (native.empty() || native[0] != '/') return Backslashed(native);
  MapState state = Current();
  std::string rest;
  size_t bestLength = 0;
  std::u16string best;
  bool found = false;
  if (state.uncSet && IsUnder(native, state.uncRoot, rest)) {
    std::u16string tail = Backslashed(rest);
    // A share needs a server and a share name below the UNC root.
    size_t first = tail.find(u'\\');
    if (first != std::u16string::npos && first > 0 && first + 1 < tail.size()) {
      best = u"\\\\" + tail;
      bestLength = state.uncRoot.size();
      found = true;
    }
  }
  for (const Drive& d : state.drives) {
    if (IsUnder(native, d.root, rest) && (!found || d.root.size() > bestLength)) {
      best = std::u16string(1, d.letter) + u":\\" + Backslashed(rest);
      bestLength = d.root.size();
      found = true;
    }
  }
  return found ? best : Backslashed(native);
}

}  // namespace Platform
