// Store commands: eventlog write/read and registry get/set/delete.
#include <cctype>
#include <cstdio>
#include <memory>
#include <string>
#include <vector>

#include "Cli.h"
#include "owutils/CString.h"
#include "owutils/Exceptions.h"

#if __has_include("owutils/EventLogger.h") && __has_include("owutils/LmResources.h") && \
    __has_include("owutils/Application.h")
#include "owutils/Application.h"
#include "owutils/EventLogger.h"
#include "owutils/LmResources.h"
#define OWUTIL_HAVE_EVENTLOG 1
#endif

namespace owutil {
namespace {

[[maybe_unused]] [[noreturn]] void Missing(const char* part) {
  throw Failure(std::string("this build of the library has no ") + part);
}

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

#if defined(OWUTIL_HAVE_EVENTLOG)
// A logger that writes records as `source` and installs nothing: the library's default logger
// stays the installed one.
class SourceLogger : public LumoException::EventLogger {
 public:
  SourceLogger(const Lumo::String& source, const Lumo::String& messageFile) : EventLogger(source.c_str(), nullptr) {
    m_nMessageTargets = LumoException::ToEventLog;
    m_strMessageFile = messageFile;
    m_hEventSource = RegisterSource(source, messageFile);
  }
};

// The engine resource module of the user's language: its message table formats the records
// of the ids it holds.
Lumo::String DefaultMessageFile() {
  HINSTANCE module = nullptr;
  CString name;
  if (!LoadResourceModule(CString(u"EngineRes"), &module, name))
    throw Failure("no message file: the engine resource module could not be loaded (give --message-file)");
  return Lumo::String(Application::GetModulePath(module).str());
}

int EventLogWrite(const WriteOptions& options) {
  WORD type = ParseEventType(options.type);
  DWORD eventId = static_cast<DWORD>(ParseInteger(options.eventId, "--id", 0, UINT32_MAX));
  if (options.source.empty()) throw UsageError("the source name is empty");
  Lumo::String source = Wide(options.source, "the source name");
  Lumo::StringList strings;
  for (const std::string& text : options.texts) strings.push_back(Wide(text, "TEXT"));
  if (strings.size() > 16) throw UsageError("at most 16 texts make one record");
  Lumo::String messageFile = options.messageFile.empty() ? DefaultMessageFile() : LibraryPath(options.messageFile);
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
#else
int EventLogWrite(const WriteOptions&) { Missing("event logger"); }
int EventLogRead(const ReadOptions&) { Missing("event logger"); }
#endif

int RegistryGet(const RegistryOptions&) { Missing("registry access"); }
int RegistrySet(const RegistryOptions&) { Missing("registry access"); }
int RegistryDelete(const RegistryOptions&) { Missing("registry access"); }

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
