// Application: the library's own module paths (seen from a host program in another folder) and
// the command line.
#include <gtest/gtest.h>

#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <string>
#include <vector>

#include "owutils/Application.h"
#include "owutils/Exceptions.h"
#include "owutils/Paths.h"
#include "platform/FaultInjection.h"
#include "support/TestEnvironment.h"

namespace {

std::vector<std::string> RunProbe(const std::string& arguments) {
  std::vector<std::string> lines;
  // The default drive map: every native path has a drive letter.
  std::string command = "env OWUTILS_DRIVES='C=/' '" OWUTILS_PROBE "' " + arguments;
  FILE* pipe = ::popen(command.c_str(), "r");
  if (pipe == nullptr) return lines;
  char line[8192];
  while (std::fgets(line, sizeof line, pipe) != nullptr) {
    std::string s(line);
    if (!s.empty() && s.back() == '\n') s.pop_back();
    lines.push_back(s);
  }
  ::pclose(pipe);
  return lines;
}

std::string Windows(const std::string& native) {
  std::string out = "C:";
  for (char c : native) out += c == '/' ? '\\' : c;
  return out;
}

TEST(Application, NullModuleIsTheLibraryNotTheHostProgram) {
  std::filesystem::path library(OWUTILS_SHARED_LIBRARY);
  std::filesystem::path probe(OWUTILS_PROBE);
  ASSERT_NE(library.parent_path(), probe.parent_path());
  std::vector<std::string> lines = RunProbe("a 'b c'");
  ASSERT_EQ(lines.size(), 4u) << (lines.empty() ? "" : lines[0]);
  EXPECT_EQ(lines[0], "\\\\?\\" + Windows(library.parent_path().string()));
  EXPECT_EQ(lines[1].rfind("libOWUtils.so", 0), 0u) << lines[1];
  EXPECT_EQ(lines[2], Windows(library.parent_path().string()) + "\\" + lines[1]);
  EXPECT_EQ(lines[3], "a b c");  // quoting is not restored
}

TEST(Application, NoArgumentsGiveAnEmptyText) {
  std::vector<std::string> lines = RunProbe("");
  ASSERT_EQ(lines.size(), 4u);
  EXPECT_EQ(lines[3], "");
}

TEST(Application, PathsOfTheModuleInThisProgram) {
  // Linked statically here: the library is this test program. Its folder lies outside drive C of
  // the sandbox and comes back on the letter that maps "/".
  CString path = Application::GetModulePath(nullptr);
  CString longPath = Application::GetModuleLongPath(nullptr);
  EXPECT_EQ(Paths::ToLongPath(path), longPath);
  EXPECT_EQ(Application::GetModuleLongName(nullptr), u"tests_Application");
  EXPECT_EQ(Application::GetModuleLongDirectory(nullptr) + u"\\tests_Application", longPath);
  EXPECT_EQ(Application::GetModuleDirectory(nullptr) + u"\\tests_Application", path);
  std::string native = OwTest::Narrow(Paths::ToNativePath(path).str());
  EXPECT_TRUE(std::filesystem::equivalent(native, "/proc/self/exe"));
  EXPECT_EQ(Application::GetOwnModuleHandle(), Application::GetOwnModuleHandle());
}

TEST(Application, ModuleInADriveRoot) {
  // A module directly in a drive root (the program's folder mapped as drive D): the directory is
  // the drive without its backslash, and combining it with a name gives the file again.
  std::string folder = std::filesystem::path(OwTest::Narrow(Paths::ToNativePath(Application::GetModulePath(nullptr)).str()))
                           .parent_path()
                           .string();
  std::string saved = std::getenv("OWUTILS_DRIVES");
  setenv("OWUTILS_DRIVES", ("D=" + folder + ";" + saved).c_str(), 1);
  CString directory = Application::GetModuleLongDirectory(nullptr);
  CString plain = Application::GetModuleDirectory(nullptr);
  setenv("OWUTILS_DRIVES", saved.c_str(), 1);
  EXPECT_EQ(directory, u"\\\\?\\D:");
  EXPECT_EQ(plain, u"D:");
  EXPECT_EQ(Paths::Combine(plain, u"tests_Application"), u"D:\\tests_Application");
}

TEST(Application, PlatformFailuresNameTheCall) {
  {
    Platform::FaultInjection::ScopedFault fault("GetModuleFileName", ERROR_MOD_NOT_FOUND);
    try {
      Application::GetModulePath(nullptr);
      FAIL();
    } catch (LumoException::Win32Error& e) {
      EXPECT_EQ(OwTest::Narrow(e.m_function), "GetModuleFileName");
      EXPECT_EQ(e.m_error, ERROR_MOD_NOT_FOUND);
    }
  }
  {
    Platform::FaultInjection::ScopedFault fault("GetLongPathName", ERROR_ACCESS_DENIED);
    EXPECT_THROW(Application::GetModulePath(nullptr), LumoException::Win32Error);
    // The long form tolerates a failing size query and keeps the path unconverted.
    Platform::FaultInjection::Disarm();
    CString expected = Paths::ToLongPath(Application::GetModulePath(nullptr));
    Platform::FaultInjection::Arm("GetLongPathName", ERROR_ACCESS_DENIED);
    EXPECT_EQ(Application::GetModuleLongPath(nullptr), expected);
  }
  {
    Platform::FaultInjection::ScopedFault fault("CommandLineToArgv", ERROR_NOT_ENOUGH_MEMORY);
    try {
      Application::GetCommandLineArguments();
      FAIL();
    } catch (LumoException::Exception& e) {
      EXPECT_EQ(OwTest::Narrow(e.GetMessage()), "Application::GetCommandLineArguments failed");
      ASSERT_NE(e.GetCause(), nullptr);
      EXPECT_EQ(OwTest::Narrow(e.GetCause()->GetType().name), "Win32Error");
    }
  }
}

}  // namespace
