// What every command group of owutil shares: the error classes that decide the exit status,
// text conversions at the edge of the program, the type table, the key options and the
// progress bar.
//
// Exit status: 0 success, 1 the operation failed (a file could not be processed, a key is
// invalid), 2 bad input (unknown option, malformed number or hex, unknown type). Results go to
// standard output, messages to standard error.
#pragma once

#include <CLI/CLI.hpp>

#include <atomic>
#include <chrono>
#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include "owutils/CString.h"
#include "owutils/tstring.h"

namespace owutil {

// Bad input: printed as "owutil: <message>" and exit status 2.
struct UsageError : std::runtime_error {
  using std::runtime_error::runtime_error;
};

// The operation failed: printed as "owutil: <message>" and exit status 1.
struct Failure : std::runtime_error {
  using std::runtime_error::runtime_error;
};

// The command chosen on the command line, run once parsing is over.
using Action = std::function<int()>;

struct Commands {
  Action action;
  // Binds `body` to `sub`: parsing `sub` selects it as the action.
  void Bind(CLI::App* sub, Action body);
};

// --- Text ------------------------------------------------------------------------------------
std::string Utf8(const Lumo::String& text);
std::string CUtf8(const CString& text);
// Strict UTF-8 from the command line; invalid bytes are bad input naming `what`.
Lumo::String Wide(const std::string& text, const char* what);
// Writes `text` and a line end to standard output.
void PrintLine(const std::string& text);

// --- Numbers ---------------------------------------------------------------------------------
// Whole numbers in decimal, or in hex with a 0x prefix; anything else (or out of range) is bad
// input naming `what`.
std::int64_t ParseInteger(const std::string& text, const char* what, std::int64_t min, std::int64_t max);
// True when `text` is one or more hexadecimal digits.
bool IsHexText(const std::string& text);

// --- Paths -----------------------------------------------------------------------------------
// A native path from the command line in the library's form.
Lumo::String LibraryPath(const std::string& nativePath);

// --- Types -----------------------------------------------------------------------------------
struct TypeInfo {
  int code;          // the type code of CEncrypt
  const char* name;  // the command-line name
  int keyBits;       // derived key length at full strength; 0 for digests
  int blockBytes;    // cipher block, or digest length
  bool digest;
};

const std::vector<TypeInfo>& TypeTable();
// A type given as its code or its name (case-insensitive); unknown types are bad input.
const TypeInfo& ParseType(const std::string& text);
// The same, and the type must be a cipher (or a digest when `wantDigest`).
const TypeInfo& ParseCipherType(const std::string& text);
const TypeInfo& ParseDigestType(const std::string& text);
// "blowfish, 3des, ..." for help texts.
std::string TypeNames(bool digests);

// --- Keys ------------------------------------------------------------------------------------
// -k KEY, --key-file FILE or --key-stdin (first line). Exactly one is required; the key is never
// printed, not even in error messages.
class KeyOptions {
 public:
  void Add(CLI::App* sub);
  Lumo::String Read() const;

 private:
  std::string m_key;
  std::string m_keyFile;
  bool m_keyStdin = false;
  CLI::Option* m_keyOption = nullptr;
  CLI::Option* m_fileOption = nullptr;
};

// --- Host services the library does not offer ------------------------------------------------
bool StderrIsTerminal();
bool SetEnvironmentVariable(const char* name, const std::string& value);
std::string GetEnvironmentVariable(const char* name);

// --- Progress ----------------------------------------------------------------------------------
// A one-line progress display on standard error, redrawn a few times a second from a thread of
// its own: bytes done (of the total when known), elapsed time and rate. Only drawn when
// standard error is a terminal; otherwise every call does nothing.
class Progress {
 public:
  Progress(std::string label, std::optional<std::uint64_t> totalBytes);
  ~Progress();
  Progress(const Progress&) = delete;
  Progress& operator=(const Progress&) = delete;

  void Add(std::uint64_t bytes) {
    m_done += bytes;
    m_counting = true;
  }
  // Draws the final line (or clears it on failure) and stops the thread.
  void Finish(bool ok);

 private:
  void Draw(bool final);

  std::string m_label;
  std::optional<std::uint64_t> m_total;
  std::atomic<std::uint64_t> m_done{0};
  std::atomic<bool> m_stop{false};
  std::atomic<bool> m_counting{false};  // false: only the total and the time are known
  std::chrono::steady_clock::time_point m_start;
  std::thread m_thread;
  bool m_enabled = false;
  bool m_finished = false;
};

std::string FormatBytes(double bytes);

// --- Command groups ----------------------------------------------------------------------------
void AddSecurityCommands(CLI::App& app, Commands& commands);
void AddCodecCommands(CLI::App& app, Commands& commands);
void AddInfoCommands(CLI::App& app, Commands& commands);
void AddEventLogCommands(CLI::App& app, Commands& commands);
void AddRegistryCommands(CLI::App& app, Commands& commands);
void AddDemoCommand(CLI::App& app, Commands& commands);

}  // namespace owutil
