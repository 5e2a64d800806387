// owutil: the command-line face of the OWUtils library, for support engineers and
// administrators: check a key, digest or encrypt a file, read the event log, see which
// language and OEM data a machine uses. Each group of subcommands lives in a source file of
// its own; this file parses the command line, runs the chosen command and turns its failure
// into a message and an exit status.
#include <cstdio>
#include <exception>

#include "Cli.h"
#include "owutils/Exceptions.h"

int main(int argc, char** argv) {
  CLI::App app{"owutil: the command-line tool of the OWUtils library.\n"
               "Paths are native paths. Exit status: 0 success, 1 failure, 2 bad input.",
               "owutil"};
  app.require_subcommand(1);

  owutil::Commands commands;
  owutil::AddDemoCommand(app, commands);
  owutil::AddSecurityCommands(app, commands);
  owutil::AddCodecCommands(app, commands);
  owutil::AddInfoCommands(app, commands);
  owutil::AddEventLogCommands(app, commands);
  owutil::AddRegistryCommands(app, commands);

  if (argc >= 2 && argv[1][0] != '-') {
    try {
      app.get_subcommand(argv[1]);
    } catch (const CLI::OptionNotFound&) {
      std::fprintf(stderr, "owutil: unknown command '%s'\nRun 'owutil --help' for the list of commands.\n", argv[1]);
      return 2;
    }
  }
  try {
    app.parse(argc, argv);
  } catch (const CLI::ParseError& e) {
    if (e.get_exit_code() == 0) return app.exit(e);
    std::fprintf(stderr, "owutil: %s\nRun 'owutil --help' or 'owutil COMMAND --help' for usage.\n", e.what());
    return 2;
  }
  if (!commands.action) {
    std::fprintf(stderr, "owutil: a command is needed\nRun 'owutil --help' for usage.\n");
    return 2;
  }

  std::fflush(stdout);
  int status = 1;
  try {
    status = commands.action();
  } catch (const owutil::UsageError& e) {
    std::fprintf(stderr, "owutil: %s\n", e.what());
    status = 2;
  } catch (const owutil::Failure& e) {
    std::fprintf(stderr, "owutil: %s\n", e.what());
    status = 1;
  } catch (const LumoException::Exception& e) {
    std::fprintf(stderr, "owutil: %s", owutil::Utf8(e.ToString()).c_str());
    status = 1;
  } catch (const std::exception& e) {
    std::fprintf(stderr, "owutil: %s\n", e.what());
    status = 1;
  }
  if (std::fflush(stdout) != 0 && status == 0) {
    std::fprintf(stderr, "owutil: cannot write the output\n");
    status = 1;
  }
  return status;
}
