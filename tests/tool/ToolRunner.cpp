#include "ToolRunner.h"

#include <fcntl.h>
#include <poll.h>
#include <signal.h>
#include <stdlib.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <fstream>
#include <sstream>
#include <stdexcept>

extern char** environ;

namespace OwTest {
namespace {

void Check(bool ok, const char* what) {
  if (!ok) throw std::runtime_error(std::string(what) + ": " + std::strerror(errno));
}

// A pseudo-terminal pair: the child writes to the secondary side, the test reads the primary.
void OpenTerminal(int& primary, int& secondary) {
  primary = posix_openpt(O_RDWR | O_NOCTTY);
  Check(primary >= 0, "posix_openpt");
  Check(grantpt(primary) == 0 && unlockpt(primary) == 0, "grantpt");
  secondary = open(ptsname(primary), O_RDWR | O_NOCTTY);
  Check(secondary >= 0, "open pts");
}

}  // namespace

ToolResult RunTool(const ToolRun& run) {
  int in[2], out[2], err[2];
  Check(pipe(in) == 0 && pipe(out) == 0, "pipe");
  if (run.stderrTerminal) {
    OpenTerminal(err[0], err[1]);
  } else {
    Check(pipe(err) == 0, "pipe");
  }

  std::vector<std::string> environment;
  for (char** e = environ; *e != nullptr; ++e) {
    std::string entry = *e;
    std::string name = entry.substr(0, entry.find('='));
    if (run.env.count(name) == 0) environment.push_back(entry);
  }
  for (const auto& [name, value] : run.env) environment.push_back(name + "=" + value);
  std::vector<char*> envp, argv;
  for (std::string& entry : environment) envp.push_back(entry.data());
  envp.push_back(nullptr);
  std::string program = OWUTIL_PATH;
  argv.push_back(program.data());
  std::vector<std::string> args = run.args;
  for (std::string& arg : args) argv.push_back(arg.data());
  argv.push_back(nullptr);

  pid_t pid = fork();
  Check(pid >= 0, "fork");
  if (pid == 0) {
    dup2(in[0], 0);
    dup2(out[1], 1);
    dup2(err[1], 2);
    for (int fd : {in[0], in[1], out[0], out[1], err[0], err[1]}) close(fd);
    execve(argv[0], argv.data(), envp.data());
    _exit(127);
  }
  close(in[0]);
  close(out[1]);
  close(err[1]);

  // Feed the input and drain both outputs together, so that no pipe fills up.
  signal(SIGPIPE, SIG_IGN);
  ToolResult result;
  size_t written = 0;
  if (run.input.empty()) {
    close(in[1]);
    in[1] = -1;
  }
  bool outOpen = true, errOpen = true;
  while (outOpen || errOpen || in[1] >= 0) {
    pollfd fds[3] = {{outOpen ? out[0] : -1, POLLIN, 0}, {errOpen ? err[0] : -1, POLLIN, 0}, {in[1], POLLOUT, 0}};
    if (poll(fds, 3, 60000) <= 0) break;
    char buffer[65536];
    for (int i = 0; i < 2; ++i) {
      if (fds[i].revents == 0) continue;
      ssize_t n = read(fds[i].fd, buffer, sizeof buffer);
      if (n > 0) {
        (i == 0 ? result.out : result.err).append(buffer, static_cast<size_t>(n));
      } else {
        (i == 0 ? outOpen : errOpen) = false;  // end of file, or EIO once the terminal's writer has gone
      }
    }
    if (in[1] >= 0 && fds[2].revents != 0) {
      ssize_t n = write(in[1], run.input.data() + written, run.input.size() - written);
      if (n > 0) written += static_cast<size_t>(n);
      if (n <= 0 || written == run.input.size()) {
        close(in[1]);
        in[1] = -1;
      }
    }
  }
  if (in[1] >= 0) close(in[1]);
  close(out[0]);
  close(err[0]);
  int status = 0;
  waitpid(pid, &status, 0);
  result.status = WIFEXITED(status) ? WEXITSTATUS(status) : -1;
  return result;
}

ToolResult RunTool(std::vector<std::string> args, std::string input) {
  ToolRun run;
  run.args = std::move(args);
  run.input = std::move(input);
  return RunTool(run);
}

std::map<std::string, std::string> WithLibraryDrive(std::map<std::string, std::string> env) {
  const char* drives = std::getenv("OWUTILS_DRIVES");
  env["OWUTILS_DRIVES"] = std::string(drives != nullptr ? drives : "") + ";Z=/";
  return env;
}

std::string WriteFile(const std::string& path, const std::string& content) {
  std::ofstream(path, std::ios::binary) << content;
  return path;
}

std::string ReadFile(const std::string& path) {
  std::ifstream in(path, std::ios::binary);
  std::ostringstream text;
  text << in.rdbuf();
  return text.str();
}

}  // namespace OwTest
