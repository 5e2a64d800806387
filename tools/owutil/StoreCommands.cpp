// Store commands: eventlog write/read and registry get/set/delete.
#include <cctype>
#include <cstdio>
#include <cstring>
#include <memory>
#include <string>
#include <vector>

#include "Cli.h"
#include "SourceLogger.h"
#include "owutils/CString.h"
#include "owutils/Exceptions.h"

// The registry store, through the Win32-style calls of the library's public registry header.
#include "owutils/Registry.h"

namespace owutil {
namespace {

struct WriteOptions {
  std::string source;
  std::string type = "information";
  std::string eventId = "0xC0000000";
  std::string messageFile;
  std::vector<std::string> texts;
};

struct ReadOptions {
  std::string log = "Application";
  std::string max;
  bool backwards = false;
  std::string from = "0";
};

struct RegistryOptions {
  std::string key;
  std::string name;
  std::string value;
  std::string type = "sz";
};

// Event-log types by name or number.
WORD ParseEventType(const std::string& text) {
  static const std::vector<std::pair<std::string, WORD>> types = {
      {"error", 1}, {"warning", 2}, {"information", 4}, {"audit-success", 8}, {"audit-failure", 16}};
  std::string lower = text;
  for (char& c : lower) c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
  for (const auto& [name, value] : types) {
    if (lower == name || lower == std::to_string(value)) return value;
  }
  throw UsageError("unknown event type '" + text + "' (error, warning, information, audit-success, audit-failure)");
}

int ParseLog(const std::string& text) {
  static const char* const logs[] = {"application", "security", "system"};
  std::string lower = text;
  for (char& c : lower) c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
  for (int i = 0; i < 3; ++i) {
    if (lower == logs[i] || lower == std::to_string(i + 1)) return i + 1;
  }
  throw UsageError("unknown log '" + text + "' (Application, Security or System)");
}

int EventLogWrite(const WriteOptions& options) {
  WORD type = ParseEventType(options.type);
  DWORD eventId = static_cast<DWORD>(ParseInteger(options.eventId, "--id", 0, UINT32_MAX));
  if (options.source.empty()) throw UsageError("the source name is empty");
  Lumo::String source = Wide(options.source, "the source name");
  Lumo::StringList strings;
  for (const std::string& text : options.texts) strings.push_back(Wide(text, "TEXT"));
  if (strings.size() > 16) throw UsageError("at most 16 texts make one record");
  Lumo::String messageFile = options.messageFile.empty() ? EngineMessageFile() : LibraryPath(options.messageFile);
  SourceLogger logger(source, messageFile);
  if (!logger.ReportStrings(type, eventId, strings, 0, nullptr)) throw Failure("the record could not be written");
  return 0;
}

int EventLogRead(const ReadOptions& options) {
  int log = ParseLog(options.log);
  std::int64_t max = options.max.empty() ? UINT32_MAX : ParseInteger(options.max, "--max", 0, UINT32_MAX);
  DWORD record = static_cast<DWORD>(ParseInteger(options.from, "--from", 0, UINT32_MAX));
  LumoException::EventLogger reader;
  Lumo::StringList records;
  reader.ReadEventLog(log, static_cast<unsigned>(max), !options.backwards, records, record);
  for (const Lumo::String& text : records) {
    std::string line = Utf8(text);
    while (!line.empty() && (line.back() == '\n' || line.back() == '\r')) line.pop_back();
    PrintLine(line);
    PrintLine("");
  }
  return 0;
}

// A key path from the command line: its hive and the path below it.
struct KeyPath {
  HKEY hive;
  Lumo::String subKey;
};

KeyPath ParseKey(const std::string& text) {
  static const std::vector<std::pair<std::string, HKEY>> hives = {
      {"HKEY_LOCAL_MACHINE", HKEY_LOCAL_MACHINE}, {"HKLM", HKEY_LOCAL_MACHINE},
      {"HKEY_CURRENT_USER", HKEY_CURRENT_USER},   {"HKCU", HKEY_CURRENT_USER}};
  std::string head = text.substr(0, text.find('\\'));
  std::string rest = head.size() < text.size() ? text.substr(head.size() + 1) : std::string();
  for (char& c : head) c = static_cast<char>(std::toupper(static_cast<unsigned char>(c)));
  for (const auto& [name, hive] : hives) {
    if (head == name) return {hive, Wide(rest, "KEY")};
  }
  throw UsageError("KEY must start with its hive (HKEY_LOCAL_MACHINE\\..., HKLM\\..., HKEY_CURRENT_USER\\... or "
                   "HKCU\\...), not '" + text + "'");
}

// An open key, closed at the end of the scope.
class OpenKey {
 public:
  OpenKey() = default;
  ~OpenKey() {
    if (m_key != nullptr) Platform::RegCloseKey(m_key);
  }
  OpenKey(const OpenKey&) = delete;
  OpenKey& operator=(const OpenKey&) = delete;
  HKEY* Out() { return &m_key; }
  HKEY Get() const { return m_key; }

 private:
  HKEY m_key = nullptr;
};

[[noreturn]] void RegistryFailure(LONG error, const std::string& what) {
  if (error == 2) throw Failure(what + ": not found");
  std::string text = Utf8(LumoException::SystemErrorText(static_cast<int>(error), false));
  while (!text.empty() && (text.back() == '\n' || text.back() == '\r' || text.back() == ' ')) text.pop_back();
  throw Failure(what + ": " + text + " (error " + std::to_string(error) + ")");
}

std::string ValueText(DWORD type, const std::vector<BYTE>& data) {
  auto units = [&](size_t bytes) {
    std::u16string text(bytes / 2, u'\0');
    std::memcpy(text.data(), data.data(), text.size() * 2);
    return text;
  };
  switch (type) {
    case REG_SZ:
    case REG_EXPAND_SZ: {
      std::u16string text = units(data.size());
      return Utf8(Lumo::String(text.c_str()));  // up to the terminator
    }
    case REG_MULTI_SZ: {
      std::u16string text = units(data.size());
      std::string lines;
      for (size_t start = 0; start < text.size() && text[start] != 0;) {
        size_t end = text.find(u'\0', start);
        if (end == std::u16string::npos) end = text.size();
        lines += (lines.empty() ? "" : "\n") + Utf8(Lumo::String(text.substr(start, end - start)));
        start = end + 1;
      }
      return lines;
    }
    case REG_DWORD:
      if (data.size() == 4) {
        DWORD value;
        std::memcpy(&value, data.data(), 4);
        return std::to_string(value);
      }
      break;
    case REG_QWORD:
      if (data.size() == 8) {
        std::uint64_t value;
        std::memcpy(&value, data.data(), 8);
        return std::to_string(value);
      }
      break;
    default:
      break;
  }
  static const char digits[] = "0123456789abcdef";
  std::string hex;
  for (BYTE b : data) {
    hex += digits[b >> 4];
    hex += digits[b & 15];
  }
  return hex;
}

int RegistryGet(const RegistryOptions& options) {
  KeyPath path = ParseKey(options.key);
  Lumo::String name = Wide(options.name, "NAME");
  OpenKey key;
  LONG error = Platform::RegOpenKeyExW(path.hive, path.subKey.c_str(), 0, KEY_READ, key.Out());
  if (error != 0) RegistryFailure(error, options.key);
  DWORD type = 0, size = 0;
  std::vector<BYTE> data;
  for (;;) {
    error = Platform::RegQueryValueExW(key.Get(), name.c_str(), nullptr, &type, nullptr, &size);
    if (error != 0) break;
    data.resize(size);
    error = Platform::RegQueryValueExW(key.Get(), name.c_str(), nullptr, &type, data.data(), &size);
    if (error != 234) break;  // grown in between: ask again
  }
  if (error != 0) RegistryFailure(error, options.key + (options.name.empty() ? " (default value)" : ", " + options.name));
  data.resize(size);
  PrintLine(ValueText(type, data));
  return 0;
}

int RegistrySet(const RegistryOptions& options) {
  KeyPath path = ParseKey(options.key);
  if (path.subKey.empty()) throw UsageError("KEY must name a key below its hive");
  Lumo::String name = Wide(options.name, "NAME");
  std::string type = options.type;
  for (char& c : type) c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
  std::vector<BYTE> data;
  DWORD regType;
  if (type == "dword") {
    regType = REG_DWORD;
    DWORD value = static_cast<DWORD>(ParseInteger(options.value, "VALUE", INT32_MIN, UINT32_MAX));
    data.resize(4);
    std::memcpy(data.data(), &value, 4);
  } else if (type == "sz") {
    regType = REG_SZ;
    Lumo::String text = Wide(options.value, "VALUE");
    data.resize((text.size() + 1) * 2);
    std::memcpy(data.data(), text.c_str(), data.size());
  } else {
    throw UsageError("--type must be sz or dword, not '" + options.type + "'");
  }
  OpenKey key;
  DWORD disposition = 0;
  LONG error = Platform::RegCreateKeyExW(path.hive, path.subKey.c_str(), 0, nullptr, REG_OPTION_NON_VOLATILE,
                                         KEY_WRITE | KEY_QUERY_VALUE, nullptr, key.Out(), &disposition);
  if (error != 0) RegistryFailure(error, options.key);
  error = Platform::RegSetValueExW(key.Get(), name.c_str(), 0, regType, data.data(), static_cast<DWORD>(data.size()));
  if (error != 0) RegistryFailure(error, options.key + ", " + options.name);
  return 0;
}

int RegistryDelete(const RegistryOptions& options) {
  KeyPath path = ParseKey(options.key);
  if (options.name.empty()) {
    if (path.subKey.empty()) throw UsageError("a hive cannot be deleted");
    LONG error = Platform::RegDeleteKeyW(path.hive, path.subKey.c_str());
    if (error == 5) throw Failure(options.key + ": the key has subkeys; delete them first");
    if (error != 0) RegistryFailure(error, options.key);
    return 0;
  }
  Lumo::String name = Wide(options.name, "NAME");
  OpenKey key;
  LONG error = Platform::RegOpenKeyExW(path.hive, path.subKey.c_str(), 0, KEY_SET_VALUE, key.Out());
  if (error != 0) RegistryFailure(error, options.key);
  error = Platform::RegDeleteValueW(key.Get(), name.c_str());
  if (error != 0) RegistryFailure(error, options.key + ", " + options.name);
  return 0;
}

}  // namespace

void AddEventLogCommands(CLI::App& app, Commands& commands) {
  CLI::App* eventlog = app.add_subcommand("eventlog", "write records to the event log and read them back");
  eventlog->require_subcommand(1);

  auto write = std::make_shared<WriteOptions>();
  CLI::App* w = eventlog->add_subcommand("write", "write one record (its insertion strings are the TEXT arguments)");
  w->add_option("--source", write->source, "the event source")->required()->type_name("NAME");
  w->add_option("--type", write->type, "error, warning, information (default), audit-success, audit-failure, or 1, 2, "
                                       "4, 8, 16")
      ->type_name("TYPE");
  w->add_option("--id", write->eventId, "the event id (default 0xC0000000: the texts stand as they are); an id of "
                                       "the message file formats them as its inserts")
      ->type_name("ID");
  w->add_option("--message-file", write->messageFile, "the message module registered for the source (default: the "
                                                       "engine resource module)")
      ->type_name("FILE");
  w->add_option("TEXT", write->texts, "the record's texts (at most 16)")->required();
  w->footer("Example: owutil eventlog write --source Backup --type warning 'disk almost full'");
  commands.Bind(w, [write] { return EventLogWrite(*write); });

  auto read = std::make_shared<ReadOptions>();
  CLI::App* r = eventlog->add_subcommand("read", "print records as the event logger formats them");
  r->add_option("--log", read->log, "Application (default), Security or System")->type_name("LOG");
  r->add_option("--max", read->max, "at most N records (default: all)")->type_name("N");
  r->add_flag("--backwards", read->backwards, "newest first");
  r->add_option("--from", read->from, "start at this record number")->type_name("RECORD");
  r->footer("Example: owutil eventlog read --backwards --max 5");
  commands.Bind(r, [read] { return EventLogRead(*read); });
}

void AddRegistryCommands(CLI::App& app, Commands& commands) {
  CLI::App* registry = app.add_subcommand("registry", "read and change the registry store");
  registry->require_subcommand(1);
  registry->footer("KEY is a full path starting with its hive: HKEY_LOCAL_MACHINE\\... or HKLM\\..., "
                   "HKEY_CURRENT_USER\\... or HKCU\\...");

  auto get = std::make_shared<RegistryOptions>();
  CLI::App* g = registry->add_subcommand("get", "print value NAME of KEY (the default value without NAME)");
  g->add_option("KEY", get->key, "the key")->required();
  g->add_option("NAME", get->name, "the value name");
  g->footer("Example: owutil registry get 'HKLM\\Software\\Orbis Works\\Orbis Works Orbis Agent' LanguageId");
  commands.Bind(g, [get] { return RegistryGet(*get); });

  auto set = std::make_shared<RegistryOptions>();
  CLI::App* s = registry->add_subcommand("set", "write value NAME of KEY, creating the key");
  s->add_option("KEY", set->key, "the key")->required();
  s->add_option("NAME", set->name, "the value name")->required();
  s->add_option("VALUE", set->value, "the value; a dword in decimal or as 0x hex")->required();
  s->add_option("--type", set->type, "sz (default) or dword")->type_name("TYPE");
  s->footer("Example: owutil registry set 'HKLM\\Software\\Orbis Works\\Orbis Works Orbis Agent' LanguageId 0x407 "
            "--type dword");
  commands.Bind(s, [set] { return RegistrySet(*set); });

  auto del = std::make_shared<RegistryOptions>();
  CLI::App* d = registry->add_subcommand("delete", "delete value NAME of KEY, or KEY itself without NAME");
  d->add_option("KEY", del->key, "the key")->required();
  d->add_option("NAME", del->name, "the value name");
  commands.Bind(d, [del] { return RegistryDelete(*del); });
}

}  // namespace owutil
