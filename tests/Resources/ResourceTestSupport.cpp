#include "ResourceTestSupport.h"

#include <cstdlib>
#include <mutex>

#include "LmUtils/ResourceState.h"
#include "platform/Debug.h"
#include "owutils/Registry.h"
#include "support/TestEnvironment.h"

namespace ResTest {
namespace {

std::mutex g_outputMutex;
std::vector<std::u16string> g_output;

}  // namespace

ModuleFolder MakeModuleFolder(const std::vector<std::string>& files, const std::string& from) {
  static int counter = 0;
  std::string name = "modules" + std::to_string(counter++);
  std::string native = OwTest::SandboxDirectory() + "/drive-c/" + name;
  std::filesystem::create_directories(native);
  for (const std::string& file : files) {
    std::filesystem::copy_file(from + "/" + file, native + "/" + std::filesystem::path(file).filename().string());
  }
  return {native, CString(u"\\\\?\\C:\\") + CString(OwTest::Widen(name))};
}

ScopedEnvironment::~ScopedEnvironment() {
  for (const auto& [name, value] : m_saved) {
    if (value) {
      setenv(name.c_str(), value->c_str(), 1);
    } else {
      unsetenv(name.c_str());
    }
  }
}

void ScopedEnvironment::Set(const char* name, const char* value) {
  if (m_saved.find(name) == m_saved.end()) {
    const char* old = std::getenv(name);
    m_saved[name] = old != nullptr ? std::optional<std::string>(old) : std::nullopt;
  }
  if (value != nullptr) {
    setenv(name, value, 1);
  } else {
    unsetenv(name);
  }
}

void ClearLocaleVariables(ScopedEnvironment& environment) {
  for (const char* name : {"LC_ALL", "LC_MESSAGES", "LC_TIME", "LANG", "LANGUAGE"}) {
    environment.Set(name, nullptr);
  }
}

void SetRegistryLanguage(const DWORD* value) {
  HKEY key = nullptr;
  ASSERT_EQ(Platform::RegCreateKeyExW(HKEY_LOCAL_MACHINE, u"Software\\Orbis Works\\Orbis Works Orbis Agent",
                                      0, nullptr, REG_OPTION_NON_VOLATILE, KEY_ALL_ACCESS, nullptr, &key,
                                      nullptr),
            ERROR_SUCCESS);
  if (value != nullptr) {
    EXPECT_EQ(Platform::RegSetValueExW(key, u"LanguageId", 0, REG_DWORD,
                                       reinterpret_cast<const BYTE*>(value), sizeof *value),
              ERROR_SUCCESS);
  } else {
    Platform::RegDeleteValueW(key, u"LanguageId");
  }
  Platform::RegCloseKey(key);
}

void ResourceTest::SetUp() {
  LmUtils::detail::ResetResourceStateForTesting();
  LmUtils::detail::SetResourceDirectoryForTesting(CString());
  SetRegistryLanguage(nullptr);
  ClearLocaleVariables(m_environment);
  m_environment.Set("LANG", "en_US.UTF-8");
  {
    std::lock_guard<std::mutex> lock(g_outputMutex);
    g_output.clear();
  }
  Platform::SetOutputHook([](const char*, const std::u16string& text) {
    std::lock_guard<std::mutex> lock(g_outputMutex);
    g_output.push_back(text);
  });
}

void ResourceTest::TearDown() {
  Platform::SetOutputHook({});
  SetRegistryLanguage(nullptr);
  LmUtils::detail::ResetResourceStateForTesting();
  LmUtils::detail::SetResourceDirectoryForTesting(CString());
}

void ResourceTest::UseModules(const ModuleFolder& folder) {
  LmUtils::detail::SetResourceDirectoryForTesting(folder.windows);
}

std::vector<std::u16string> ResourceTest::DebugOutput() const {
  std::lock_guard<std::mutex> lock(g_outputMutex);
  return g_output;
}

}  // namespace ResTest
