// POSIX backend: FormatMessageW over the library's own printf engine, ExpandEnvironmentStringsW.
#include "platform/Messages.h"

#include <unistd.h>

#include <cstdint>
#include <cstdio>
#include <ctime>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include "Strings/Formatter.h"
#include "platform/posix/NativeText.h"
#include "platform/Errors.h"
#include "platform/Modules.h"
#include "platform/Text.h"

extern char** environ;

namespace Platform {
namespace {

constexpr int kMaxInsert = 99;

enum class Kind { Pointer, Int32, Int64 };

// A piece of a parsed template: literal text, or an insert with its printf format.
struct Piece {
  std::u16string text;  // literal text (when index is 0)
  int index = 0;        // insert number
  std::u16string fmt;  // printf format without the '%' ("s", "*.*s", "08lX")
  int stars = 0;
  Kind kind = Kind::Pointer;
};

// The kind of value a printf format takes; false for one FormatMessage refuses. A
// format is flag, width, precision and length characters, then its one conversion.
bool KindOf(const std::u16string& fmt, Kind& kind) {
  if (fmt.empty() || fmt.find_first_not_of(u"-+ #0123456789.*hlwIjztL") != fmt.size() - 1) return false;
  const char16_t conversion = fmt.back();
  switch (conversion) {
    case u's':
    case u'S':
    case u'p':
      kind = Kind::Pointer;
      return true;
    case u'c':
    case u'C':
    case u'd':
    case u'i':
    case u'u':
    case u'x':
    case u'X':
    case u'o':
      break;
    default:
      return false;  // floating point and everything unknown
  }
  if (fmt.find(u"I64") != std::u16string::npos || fmt.find(u"ll") != std::u16string::npos ||
      fmt.find(u'j') != std::u16string::npos) {
    kind = Kind::Int64;
  } else if (fmt.find(u"I32") != std::u16string::npos) {
    kind = Kind::Int32;  // explicitly 32 bits, as the printf engine reads it
  } else if (fmt.find(u'I') != std::u16string::npos || fmt.find(u'z') != std::u16string::npos ||
             fmt.find(u't') != std::u16string::npos) {
    kind = sizeof(void*) == 8 ? Kind::Int64 : Kind::Int32;
  } else {
    kind = Kind::Int32;
  }
  return true;
}

// Cuts a template into pieces. `maxWidthMask` 0xFF turns the template's own line breaks into
// blanks. Returns false for a malformed insert.
bool Parse(const std::u16string& text, bool ignoreInserts, DWORD width, std::vector<Piece>& pieces) {
  std::u16string literal;
  auto flush = [&] {
    if (!literal.empty()) {
      Piece piece;
      piece.text.swap(literal);
      pieces.push_back(std::move(piece));
    }
  };
  for (size_t i = 0; i < text.size(); ++i) {
    char16_t c = text[i];
    if (width == FORMAT_MESSAGE_MAX_WIDTH_MASK && (c == u'\r' || c == u'\n')) {
      if (c == u'\r' && i + 1 < text.size() && text[i + 1] == u'\n') ++i;
      if (i + 1 < text.size()) literal.push_back(u' ');
      continue;
    }
    if (c != u'%') {
      literal.push_back(c);
      continue;
    }
    if (i + 1 >= text.size()) break;  // a lone % at the end is dropped
    char16_t next = text[++i];
    if (next >= u'1' && next <= u'9') {
      size_t start = i - 1;
      int index = next - u'0';
      if (i + 1 < text.size() && text[i + 1] >= u'0' && text[i + 1] <= u'9') index = index * 10 + (text[++i] - u'0');
      std::u16string fmt = u"s";
      if (i + 1 < text.size() && text[i + 1] == u'!') {
        size_t close = text.find(u'!', i + 2);
        if (close == std::u16string::npos || close == i + 2) return false;
        fmt = text.substr(i + 2, close - i - 2);
        i = close;
      }
      if (ignoreInserts) {
        literal += text.substr(start, i + 1 - start);
        continue;
      }
      Piece piece;
      piece.index = index;
      piece.fmt = fmt;
      for (char16_t s : fmt) piece.stars += s == u'*' ? 1 : 0;
      if (!KindOf(fmt, piece.kind) || piece.stars > 2 || index + piece.stars > kMaxInsert) return false;
      flush();
      pieces.push_back(std::move(piece));
      continue;
    }
    switch (next) {
      case u'0':
        flush();
        return true;
      case u'n':
        literal += u"\r\n";
        break;
      case u'r':
        literal.push_back(u'\r');
        break;
      case u't':
        literal.push_back(u'\t');
        break;
      default:
        literal.push_back(next);  // %% %. %! "% " and any other character stand for themselves
        break;
    }
  }
  flush();
  return true;
}

// One insert value: integers and pointers are kept in 64 bits.
using Value = std::uint64_t;

int FormatInto(char16_t* out, size_t capacity, const char16_t* format, ...) {
  va_list args;
  va_start(args, format);
  int n = Lumo::detail::FormatUtf16(out, capacity, format, args);
  va_end(args);
  return n;
}

// Formats one insert with its format; false when the engine refuses it.
bool FormatInsert(const Piece& piece, const std::vector<Value>& values, std::u16string& out) {
  const std::u16string format = u"%" + piece.fmt;
  int star[2] = {0, 0};
  for (int s = 0; s < piece.stars; ++s) star[s] = static_cast<int>(values[piece.index + s]);
  const Value value = values[piece.index + piece.stars];
  std::vector<char16_t> buffer(256);
  for (int attempt = 0; attempt < 2; ++attempt) {
    int n;
    const char16_t* f = format.c_str();
    auto call = [&](auto v) {
      switch (piece.stars) {
        case 0: return FormatInto(buffer.data(), buffer.size(), f, v);
        case 1: return FormatInto(buffer.data(), buffer.size(), f, star[0], v);
        default: return FormatInto(buffer.data(), buffer.size(), f, star[0], star[1], v);
      }
    };
    switch (piece.kind) {
      case Kind::Pointer: n = call(reinterpret_cast<const void*>(static_cast<std::uintptr_t>(value))); break;
      case Kind::Int32: n = call(static_cast<std::int32_t>(value)); break;
      default: n = call(static_cast<long long>(value)); break;
    }
    if (n < 0) return false;
    if (static_cast<size_t>(n) < buffer.size()) {
      out.append(buffer.data(), static_cast<size_t>(n));
      return true;
    }
    buffer.resize(static_cast<size_t>(n) + 1);
  }
  return false;
}

// Breaks lines longer than `width` at their last blank before it.
std::u16string Wrap(const std::u16string& text, size_t width) {
  std::u16string out;
  size_t lineStart = 0;
  size_t lastBlank = std::u16string::npos;
  for (char16_t c : text) {
    out.push_back(c);
    if (c == u'\n') {
      lineStart = out.size();
      lastBlank = std::u16string::npos;
      continue;
    }
    if (c == u' ') lastBlank = out.size() - 1;
    if (out.size() - lineStart > width && lastBlank != std::u16string::npos) {
      out.replace(lastBlank, 1, u"\r\n");
      lineStart = lastBlank + 2;
      lastBlank = std::u16string::npos;
    }
  }
  return out;
}

DWORD Fail(DWORD error) {
  SetLastError(error);
  return 0;
}

bool GetEnvironment(const std::string& name, std::string& value) {
  if (const char* exact = std::getenv(name.c_str())) {
    value = exact;
    return true;
  }
  for (char** entry = environ; entry != nullptr && *entry != nullptr; ++entry) {
    const char* equals = std::strchr(*entry, '=');
    if (equals == nullptr || static_cast<size_t>(equals - *entry) != name.size()) continue;
    if (strncasecmp(*entry, name.c_str(), name.size()) == 0) {
      value = equals + 1;
      return true;
    }
  }
  return false;
}

}  // namespace

DWORD FormatMessageW(DWORD flags, const void* source, DWORD messageId, DWORD languageId, char16_t* buffer, DWORD size,
                     va_list* args) {
  try {
    if (buffer == nullptr) return Fail(ERROR_INVALID_PARAMETER);
    // The template.
    std::u16string text;
    if ((flags & FORMAT_MESSAGE_FROM_STRING) != 0) {
      if (source == nullptr) return Fail(ERROR_INVALID_PARAMETER);
      text = static_cast<const char16_t*>(source);
    } else {
      bool found = false;
      if ((flags & FORMAT_MESSAGE_FROM_HMODULE) != 0) {
        found = FindMessageTemplate(static_cast<HMODULE>(const_cast<void*>(source)), messageId,
                                    static_cast<LANGID>(languageId), text);
      }
      if (!found && (flags & FORMAT_MESSAGE_FROM_SYSTEM) != 0) found = GetSystemMessage(messageId, text);
      if (!found) {
        if ((flags & (FORMAT_MESSAGE_FROM_HMODULE | FORMAT_MESSAGE_FROM_SYSTEM)) == 0) return Fail(ERROR_INVALID_PARAMETER);
        return Fail(ERROR_MR_MID_NOT_FOUND);
      }
    }

    const bool ignoreInserts = (flags & FORMAT_MESSAGE_IGNORE_INSERTS) != 0;
    const DWORD width = flags & FORMAT_MESSAGE_MAX_WIDTH_MASK;
    std::vector<Piece> pieces;
    if (!Parse(text, ignoreInserts, width, pieces)) return Fail(ERROR_INVALID_PARAMETER);

    // The insert values, fetched in order of their numbers, each with the kind its
    // format takes (numbers no insert names are taken as pointer-sized).
    int highest = 0;
    for (const Piece& p : pieces) {
      if (p.index != 0 && p.index + p.stars > highest) highest = p.index + p.stars;
    }
    std::vector<Value> values(static_cast<size_t>(highest) + 1, 0);
    if (highest > 0) {
      if (args == nullptr) return Fail(ERROR_INVALID_PARAMETER);
      std::vector<Kind> kinds(values.size(), Kind::Pointer);
      for (const Piece& p : pieces) {
        if (p.index == 0) continue;
        for (int s = 0; s < p.stars; ++s) kinds[p.index + s] = Kind::Int32;
        kinds[p.index + p.stars] = p.kind;
      }
      if ((flags & FORMAT_MESSAGE_ARGUMENT_ARRAY) != 0) {
        const DWORD_PTR* array = reinterpret_cast<const DWORD_PTR*>(args);
        for (int i = 1; i <= highest; ++i) values[i] = array[i - 1];
      } else {
        va_list list;
        va_copy(list, *args);
        for (int i = 1; i <= highest; ++i) {
          switch (kinds[i]) {
            case Kind::Int32: values[i] = static_cast<std::uint32_t>(va_arg(list, int)); break;
            case Kind::Int64: values[i] = static_cast<Value>(va_arg(list, long long)); break;
            default: values[i] = reinterpret_cast<std::uintptr_t>(va_arg(list, void*)); break;
          }
        }
        va_end(list);
      }
    }

    std::u16string out;
    for (const Piece& p : pieces) {
      if (p.index == 0) {
        out += p.text;
      } else if (!FormatInsert(p, values, out)) {
        return Fail(ERROR_INVALID_PARAMETER);
      }
    }
    if (width != 0 && width != FORMAT_MESSAGE_MAX_WIDTH_MASK) out = Wrap(out, width);

    const size_t needed = out.size() + 1;
    if ((flags & FORMAT_MESSAGE_ALLOCATE_BUFFER) != 0) {
      const size_t units = needed > size ? needed : size;
      auto* memory = static_cast<char16_t*>(std::malloc(units * sizeof(char16_t)));
      if (memory == nullptr) return Fail(ERROR_NOT_ENOUGH_MEMORY);
      std::memcpy(memory, out.c_str(), needed * sizeof(char16_t));
      *reinterpret_cast<char16_t**>(buffer) = memory;
    } else {
      if (needed > size) return Fail(ERROR_INSUFFICIENT_BUFFER);
      std::memcpy(buffer, out.c_str(), needed * sizeof(char16_t));
    }
    return static_cast<DWORD>(out.size());
  } catch (const std::bad_alloc&) {
    return Fail(ERROR_NOT_ENOUGH_MEMORY);
  }
}

// LocalFree is defined once, with the process services (posix/Process.cpp).

DWORD ExpandEnvironmentStringsW(const char16_t* source, char16_t* destination, DWORD size) {
  if (source == nullptr) return Fail(ERROR_INVALID_PARAMETER);
  try {
    const std::u16string text(source);
    std::u16string out;
    for (size_t i = 0; i < text.size();) {
      if (text[i] == u'%') {
        size_t close = text.find(u'%', i + 1);
        if (close != std::u16string::npos && close > i + 1) {
          std::string value;
          // An unknown name stays as it stands, with both of its percent signs.
          out += GetEnvironment(Posix::ToUtf8(text.substr(i + 1, close - i - 1)), value) ? Posix::ToUtf16(value)
                                                                                 : text.substr(i, close + 1 - i);
          i = close + 1;
          continue;
        }
      }
      out.push_back(text[i++]);
    }
    const DWORD needed = static_cast<DWORD>(out.size() + 1);
    if (destination != nullptr && needed <= size) std::memcpy(destination, out.c_str(), needed * sizeof(char16_t));
    return needed;
  } catch (const std::bad_alloc&) {
    return Fail(ERROR_NOT_ENOUGH_MEMORY);
  }
}

bool CTimeText(std::int64_t time, std::u16string& text) {
  static const char* const kDays[] = {"Sun", "Mon", "Tue", "Wed", "Thu", "Fri", "Sat"};
  static const char* const kMonths[] = {"Jan", "Feb", "Mar", "Apr", "May", "Jun",
                                        "Jul", "Aug", "Sep", "Oct", "Nov", "Dec"};
  if (time < 0) return Fail(ERROR_INVALID_PARAMETER) != 0;
  const time_t value = static_cast<time_t>(time);
  struct tm local;
  if (localtime_r(&value, &local) == nullptr || local.tm_wday < 0 || local.tm_wday > 6 || local.tm_mon < 0 ||
      local.tm_mon > 11) {
    return Fail(ERROR_INVALID_PARAMETER) != 0;
  }
  char buffer[64];
  std::snprintf(buffer, sizeof buffer, "%s %s %02d %02d:%02d:%02d %d\n", kDays[local.tm_wday], kMonths[local.tm_mon],
                local.tm_mday, local.tm_hour, local.tm_min, local.tm_sec, local.tm_year + 1900);
  text = Posix::ToUtf16(buffer);
  return true;
}

}  // namespace Platform
