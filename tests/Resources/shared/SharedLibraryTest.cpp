// The shipped modules as a client program meets them: the shared library finds the modules
// that lie beside it (in the build tree, as after installation), whatever the program's folder.
#include <gtest/gtest.h>

#include <cstdlib>
#include <filesystem>
#include <memory>
#include <string>

#include "owutils/LmFormat.h"
#include "owutils/LmOem.h"
#include "owutils/LmResources.h"

namespace {

// This program does not link the test support library (it would bring a second copy of the
// library): it makes itself hermetic here.
class Hermetic : public ::testing::Environment {
 public:
  void SetUp() override {
    std::string pattern = (std::filesystem::temp_directory_path() / "owutils-shared-XXXXXX").string();
    ASSERT_NE(mkdtemp(pattern.data()), nullptr);
    m_root = pattern;
    std::filesystem::create_directories(m_root + "/state");
    setenv("OWUTILS_STATE_DIR", (m_root + "/state").c_str(), 1);
    unsetenv("OWUTILS_DRIVES");
    unsetenv("OWUTILS_DEBUG_OUTPUT");
    for (const char* name : {"LC_ALL", "LC_MESSAGES", "LANGUAGE"}) unsetenv(name);
    setenv("LANG", "en_US.UTF-8", 1);
  }
  void TearDown() override {
    std::error_code ignored;
    std::filesystem::remove_all(m_root, ignored);
  }

 private:
  std::string m_root;
};

[[maybe_unused]] ::testing::Environment* const g_environment =
    ::testing::AddGlobalTestEnvironment(new Hermetic);

TEST(SharedLibraryTest, LoadsTheShippedModulesBesideTheLibrary) {
  ASSERT_TRUE(LoadAppResources(nullptr));
  ASSERT_TRUE(LoadLFResources());
  ASSERT_TRUE(LoadMessageResources());
  EXPECT_EQ(GetLanguageId(), 0x409);
  EXPECT_EQ(LVXSS_get(1002), CString(u"Running"));
  EXPECT_EQ(LVXSS_get(1400), CString(u"Orbis Agent"));
  EXPECT_NE(AfxGetResourceHandle(), GetAppResourceHandle());  // the LF module was loaded last
  ASSERT_TRUE(LoadAppResources(nullptr));
  EXPECT_EQ(AfxGetResourceHandle(), GetAppResourceHandle());

  auto info = std::make_unique<LM_OEM_INFO>();
  ASSERT_EQ(GetOEMDataTCHAR(info.get()), 0u);
  EXPECT_EQ(info->dwMajorVersion, 19u);
  EXPECT_EQ(info->dwMinorVersion, 0u);
  EXPECT_EQ(info->dwBuild, 0u);
  EXPECT_EQ(std::u16string(info->szReportName), u"OrbisAgent");

  CString text;
  GetErrorMessage(0xE0001002, text);
  EXPECT_EQ(text, CString(u"There is not enough free space on %1."));
}

}  // namespace
