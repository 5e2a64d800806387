// Helpers of the resource tests: module folders on the test drive, environment and registry
// settings restored at the end of a test, and the library's resource state reset between tests.
#pragma once

#include <gtest/gtest.h>

#include <filesystem>
#include <map>
#include <optional>
#include <string>
#include <vector>

#include "owutils/CString.h"
#include "owutils/WinTypes.h"

namespace ResTest {

// Copies the named module files (from the test modules, or from `from`) into a fresh folder on
// drive C of the test environment and returns that folder in native and Windows syntax.
struct ModuleFolder {
  std::string native;
  CString windows;  // \\?\C:\...
};
ModuleFolder MakeModuleFolder(const std::vector<std::string>& files,
                              const std::string& from = OWTEST_MODULE_DIR);

// Sets or removes environment variables for the life of the object.
class ScopedEnvironment {
 public:
  ScopedEnvironment() = default;
  ScopedEnvironment(const ScopedEnvironment&) = delete;
  ScopedEnvironment& operator=(const ScopedEnvironment&) = delete;
  ~ScopedEnvironment();
  void Set(const char* name, const char* value);  // null value: unset
 private:
  std::map<std::string, std::optional<std::string>> m_saved;
};

// Clears the locale variables, so that only what a test sets counts.
void ClearLocaleVariables(ScopedEnvironment& environment);

// Writes (or with a null value removes) the registry value "LanguageId" of the product key.
void SetRegistryLanguage(const DWORD* value);

// Base fixture: fresh resource state, no registry language, English user interface, debugger
// output captured.
class ResourceTest : public ::testing::Test {
 protected:
  void SetUp() override;
  void TearDown() override;
  // Points the loaders at `folder`.
  void UseModules(const ModuleFolder& folder);
  // Debugger output lines captured so far.
  std::vector<std::u16string> DebugOutput() const;

  ScopedEnvironment m_environment;
};

}  // namespace ResTest
