// Shared pieces of owutil: conversions, numbers, the type table, key options, progress display.
#include "Cli.h"

#include <algorithm>
#include <cctype>
#include <charconv>
#include <cstdio>
#include <fstream>
#include <iostream>

#include "owutils/Exceptions.h"
#include "owutils/Paths.h"

namespace owutil {

void Commands::Bind(CLI::App* sub, Action body) {
  sub->callback([this, body = std::move(body)] { action = body; });
}

// --- Text ------------------------------------------------------------------------------------

std::string Utf8(const Lumo::String& text) {
  Lumo::CharArrayHolder utf8 = text.ToUtf8();
  return utf8.Get() != nullptr ? std::string(utf8.Get()) : std::string();
}

std::string CUtf8(const CString& text) { return Utf8(Lumo::String(text.str())); }

Lumo::String Wide(const std::string& text, const char* what) {
  Lumo::String wide;
  try {
    wide.AssignUtf8(text.c_str());
  } catch (LumoException::Exception&) {
    throw UsageError(std::string(what) + " is not valid UTF-8");
  }
  return wide;
}

void PrintLine(const std::string& text) {
  std::fwrite(text.data(), 1, text.size(), stdout);
  std::fputc('\n', stdout);
}

// --- Numbers ---------------------------------------------------------------------------------

std::int64_t ParseInteger(const std::string& text, const char* what, std::int64_t min, std::int64_t max) {
  std::string_view digits = text;
  bool negative = false;
  if (!digits.empty() && (digits[0] == '-' || digits[0] == '+')) {
    negative = digits[0] == '-';
    digits.remove_prefix(1);
  }
  int base = 10;
  if (digits.size() > 2 && digits[0] == '0' && (digits[1] == 'x' || digits[1] == 'X')) {
    base = 16;
    digits.remove_prefix(2);
  }
  std::uint64_t magnitude = 0;
  auto [end, error] = std::from_chars(digits.data(), digits.data() + digits.size(), magnitude, base);
  bool ok = !digits.empty() && error == std::errc() && end == digits.data() + digits.size();
  std::int64_t value = 0;
  if (ok) {
    if (negative) {
      ok = magnitude <= static_cast<std::uint64_t>(INT64_MAX) + 1;
      value = ok ? static_cast<std::int64_t>(0 - magnitude) : 0;
    } else {
      ok = magnitude <= static_cast<std::uint64_t>(INT64_MAX);
      value = static_cast<std::int64_t>(magnitude);
    }
  }
  if (!ok) throw UsageError(std::string(what) + " must be a whole number, not '" + text + "'");
  if (value < min || value > max)
    throw UsageError(std::string(what) + " must be between " + std::to_string(min) + " and " + std::to_string(max) +
                     ", not " + text);
  return value;
}

bool IsHexText(const std::string& text) {
  return !text.empty() && std::all_of(text.begin(), text.end(), [](unsigned char c) { return std::isxdigit(c) != 0; });
}

// --- Paths -----------------------------------------------------------------------------------

Lumo::String LibraryPath(const std::string& nativePath) {
  Lumo::String native = Wide(nativePath, "the file name");
  return Lumo::String(Paths::FromNativePath(CString(native)).str());
}

// --- Types -----------------------------------------------------------------------------------

const std::vector<TypeInfo>& TypeTable() {
  static const std::vector<TypeInfo> table = {
      {1, "blowfish", 448, 8, false},  {2, "3des", 192, 8, false},      {3, "des", 128, 8, false},
      {4, "safer-sk", 128, 8, false},  {5, "idea", 128, 8, false},      {6, "rc5", 2048, 8, false},
      {7, "blowfish2", 448, 8, false}, {8, "des2", 128, 8, false},      {9, "twofish", 128, 16, false},
      {10, "mars", 128, 16, false},    {11, "aes128", 128, 16, false},  {12, "aes192", 192, 16, false},
      {13, "aes256", 256, 16, false},  {20, "sha1", 0, 20, true},       {21, "ripemd160", 0, 20, true},
      {22, "md5", 0, 16, true},        {30, "crc32", 0, 4, true},
  };
  return table;
}

const TypeInfo& ParseType(const std::string& text) {
  std::string lower = text;
  std::transform(lower.begin(), lower.end(), lower.begin(), [](unsigned char c) { return std::tolower(c); });
  for (const TypeInfo& type : TypeTable()) {
    if (lower == type.name || lower == std::to_string(type.code)) return type;
  }
  throw UsageError("unknown type '" + text + "' (codes 1-13, 20, 21, 22, 30 or names " + TypeNames(false) + ", " +
                   TypeNames(true) + ")");
}

const TypeInfo& ParseCipherType(const std::string& text) {
  const TypeInfo& type = ParseType(text);
  if (type.digest) throw UsageError("type '" + text + "' is a digest; a cipher is needed here (" + TypeNames(false) + ")");
  return type;
}

const TypeInfo& ParseDigestType(const std::string& text) {
  const TypeInfo& type = ParseType(text);
  if (!type.digest) throw UsageError("type '" + text + "' is a cipher; a digest is needed here (" + TypeNames(true) + ")");
  return type;
}

std::string TypeNames(bool digests) {
  std::string names;
  for (const TypeInfo& type : TypeTable()) {
    if (type.digest != digests) continue;
    if (!names.empty()) names += ", ";
    names += type.name;
  }
  return names;
}

// --- Keys ------------------------------------------------------------------------------------

void KeyOptions::Add(CLI::App* sub) {
  m_keyOption = sub->add_option("-k,--key", m_key, "the key text (visible to other users in the process list; "
                                                    "prefer --key-file or --key-stdin)");
  m_fileOption = sub->add_option("--key-file", m_keyFile, "read the key from the first line of FILE");
  CLI::Option* stdinOption = sub->add_flag("--key-stdin", m_keyStdin, "read the key from the first line of standard input");
  m_keyOption->excludes(m_fileOption)->excludes(stdinOption);
  m_fileOption->excludes(stdinOption);
  m_keyOption->type_name("KEY");
  m_fileOption->type_name("FILE");
}

namespace {
void DropLineEnd(std::string& line) {
  while (!line.empty() && (line.back() == '\r' || line.back() == '\n')) line.pop_back();
}
}  // namespace

Lumo::String KeyOptions::Read() const {
  std::string key;
  if (m_keyOption != nullptr && m_keyOption->count() > 0) {
    key = m_key;
  } else if (m_fileOption != nullptr && m_fileOption->count() > 0) {
    std::ifstream file(m_keyFile, std::ios::binary);
    if (!file) throw UsageError("cannot read the key file '" + m_keyFile + "'");
    std::getline(file, key);
    DropLineEnd(key);
  } else if (m_keyStdin) {
    std::getline(std::cin, key);
    DropLineEnd(key);
  } else {
    throw UsageError("a key is needed: -k KEY, --key-file FILE or --key-stdin");
  }
  if (key.empty()) throw UsageError("the key is empty");
  return Wide(key, "the key");
}

// --- Progress ----------------------------------------------------------------------------------

std::string FormatBytes(double bytes) {
  static const char* const units[] = {"B", "KiB", "MiB", "GiB", "TiB"};
  int unit = 0;
  while (bytes >= 1024.0 && unit < 4) {
    bytes /= 1024.0;
    ++unit;
  }
  char text[32];
  std::snprintf(text, sizeof text, unit == 0 ? "%.0f %s" : "%.1f %s", bytes, units[unit]);
  return text;
}

Progress::Progress(std::string label, std::optional<std::uint64_t> totalBytes)
    : m_label(std::move(label)), m_total(totalBytes), m_start(std::chrono::steady_clock::now()),
      m_enabled(StderrIsTerminal()) {
  if (!m_enabled) return;
  m_thread = std::thread([this] {
    while (!m_stop.load()) {
      Draw(false);
      for (int i = 0; i < 4 && !m_stop.load(); ++i) std::this_thread::sleep_for(std::chrono::milliseconds(50));
    }
  });
}

Progress::~Progress() { Finish(false); }

void Progress::Finish(bool ok) {
  if (m_finished) return;
  m_finished = true;
  if (!m_enabled) return;
  m_stop = true;
  if (m_thread.joinable()) m_thread.join();
  if (ok) {
    Draw(true);
  } else {
    std::fprintf(stderr, "\r\033[K");
  }
  std::fflush(stderr);
}

void Progress::Draw(bool final) {
  static const char spinner[] = "|/-\\";
  double seconds = std::chrono::duration<double>(std::chrono::steady_clock::now() - m_start).count();
  bool counting = m_counting.load();
  double done = static_cast<double>(final && m_total ? *m_total : m_done.load());
  std::string line = "\r\033[K" + m_label + " ";
  if (counting && m_total && *m_total > 0 && !final) {
    constexpr int width = 24;
    double fraction = std::min(1.0, done / static_cast<double>(*m_total));
    int filled = static_cast<int>(fraction * width);
    char percent[16];
    std::snprintf(percent, sizeof percent, "%3.0f%% ", fraction * 100.0);
    line += "[" + std::string(filled, '#') + std::string(width - filled, '.') + "] " + percent;
    line += FormatBytes(done) + " of " + FormatBytes(static_cast<double>(*m_total));
  } else if (counting || final) {
    line += FormatBytes(done);
  } else {
    line += std::string(1, spinner[static_cast<int>(seconds * 5) % 4]) + " ";
    if (m_total) line += FormatBytes(static_cast<double>(*m_total));
  }
  char elapsed[32];
  std::snprintf(elapsed, sizeof elapsed, final ? " in %.1f s" : ", %.1f s", seconds);
  line += elapsed;
  if ((counting || final) && seconds > 0.0 && done > 0) line += ", " + FormatBytes(done / seconds) + "/s";
  if (final) line += "\n";
  std::fputs(line.c_str(), stderr);
  std::fflush(stderr);
}

}  // namespace owutil
