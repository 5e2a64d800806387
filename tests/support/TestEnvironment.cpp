#include "support/TestEnvironment.h"

#include <gtest/gtest.h>

#include <atomic>
#include <cstdlib>
#include <filesystem>

#include "platform/Text.h"

namespace OwTest {
namespace {

std::string CreateSandbox() {
  std::string pattern = (std::filesystem::temp_directory_path() / "owutils-test-XXXXXX").string();
  char* made = mkdtemp(pattern.data());
  if (made == nullptr) std::abort();
  return made;
}

class HermeticEnvironment : public ::testing::Environment {
 public:
  void SetUp() override {
    const std::string& root = SandboxDirectory();
    std::filesystem::create_directories(root + "/state");
    std::filesystem::create_directories(root + "/drive-c");
    setenv("OWUTILS_STATE_DIR", (root + "/state").c_str(), 1);
    setenv("OWUTILS_DRIVES", ("C=" + root + "/drive-c").c_str(), 1);
    unsetenv("OWUTILS_UNC_ROOT");
    unsetenv("OWUTILS_DEBUG_OUTPUT");
  }
  void TearDown() override {
    std::error_code ignored;
    std::filesystem::remove_all(SandboxDirectory(), ignored);
  }
};

[[maybe_unused]] ::testing::Environment* const g_environment =
    ::testing::AddGlobalTestEnvironment(new HermeticEnvironment);

}  // namespace

const std::string& SandboxDirectory() {
  static const std::string root = CreateSandbox();
  return root;
}

std::string MakeTempDirectory(const std::string& prefix) {
  static std::atomic<int> counter{0};
  std::string path = SandboxDirectory() + "/" + prefix + std::to_string(counter++);
  std::filesystem::create_directories(path);
  return path;
}

std::string Narrow(const std::u16string& text) {
  int n = Platform::WideCharToMultiByte(Platform::kCodePageUtf8, 0, text.c_str(), -1, nullptr, 0, nullptr, nullptr);
  std::string result(n > 0 ? static_cast<size_t>(n) : 1, '\0');
  if (n > 0) Platform::WideCharToMultiByte(Platform::kCodePageUtf8, 0, text.c_str(), -1, result.data(), n, nullptr, nullptr);
  result.pop_back();
  return result;
}

std::u16string Widen(const std::string& text) {
  int n = Platform::MultiByteToWideChar(Platform::kCodePageUtf8, 0, text.c_str(), -1, nullptr, 0);
  std::u16string result(n > 0 ? static_cast<size_t>(n) : 1, u'\0');
  if (n > 0) Platform::MultiByteToWideChar(Platform::kCodePageUtf8, 0, text.c_str(), -1, result.data(), n);
  result.pop_back();
  return result;
}

}  // namespace OwTest

