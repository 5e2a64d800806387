// Store commands: eventlog write/read and registry get/set/delete.
#include <cstdio>
#include <memory>
#include <string>
#include <vector>

#include "Cli.h"
#include "owutils/Exceptions.h"

namespace owutil {
namespace {

[[noreturn]] void Missing(const char* part) {
  throw Failure(std::string("this build of the library has no ") + part);
}

struct WriteOptions {
  std::string source;
  std::string type = "information";
  std::vector<std::string> texts;
};

struct ReadOptions {
  std::string log = "Application";
  std::string max = "100";
  bool backwards = false;
  std::string from = "0";
};

struct RegistryOptions {
  std::string key;
  std::string name;
  std::string value;
  std::string type = "sz";
};

int EventLogWrite(const WriteOptions&) { Missing("event log"); }
int EventLogRead(const ReadOptions&) { Missing("event log"); }
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
  w->add_option("TEXT", write->texts, "the record's texts")->required();
  w->footer("Example: owutil eventlog write --source Backup --type warning 'disk almost full'");
  commands.Bind(w, [write] { return EventLogWrite(*write); });

  auto read = std::make_shared<ReadOptions>();
  CLI::App* r = eventlog->add_subcommand("read", "print records as the event logger formats them");
  r->add_option("--log", read->log, "Application (default), Security or System")->type_name("LOG");
  r->add_option("--max", read->max, "at most N records (default 100)")->type_name("N");
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
