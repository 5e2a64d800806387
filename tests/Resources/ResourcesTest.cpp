// Language selection and the resource module loaders.
#include <gtest/gtest.h>

#include "LmUtils/ResourceState.h"
#include "ResourceTestSupport.h"
#include "owutils/Exceptions.h"
#include "owutils/LmResources.h"
#include "platform/Modules.h"
#include "support/TestEnvironment.h"

namespace {

using ResTest::MakeModuleFolder;
using ResTest::SetRegistryLanguage;

class LanguageTest : public ResTest::ResourceTest {};

TEST_F(LanguageTest, RegistryValueDecides) {
  const DWORD german = 0x407;
  SetRegistryLanguage(&german);
  m_environment.Set("LC_ALL", "ja_JP.UTF-8");  // the registry wins over the environment
  EXPECT_EQ(GetAppLangFromRegistry(), 0x407);
  EXPECT_EQ(GetLanguageId(), 0x407);
  EXPECT_EQ(std::u16string(GetLanguageIdString()), u"deu");

  const DWORD highBits = 0x10407;  // only the low 16 bits count
  SetRegistryLanguage(&highBits);
  EXPECT_EQ(GetAppLangFromRegistry(), 0x407);
  EXPECT_EQ(GetLanguageId(), 0x407);

  const DWORD dutch = 0x413;  // unsupported: English, and no look at the environment
  SetRegistryLanguage(&dutch);
  EXPECT_EQ(GetAppLangFromRegistry(), 0x413);
  EXPECT_EQ(GetLanguageId(), 0x409);
  EXPECT_EQ(std::u16string(GetLanguageIdString()), u"enu");
}

TEST_F(LanguageTest, WithoutRegistryValueTheUserInterfaceLanguageDecides) {
  EXPECT_EQ(GetAppLangFromRegistry(), 0);
  const std::tuple<const char*, const char*, LANGID, const char16_t*> cases[] = {
      {"LANG", "ru_RU.UTF-8", 0x419, u"rus"},  {"LANG", "zh_TW.UTF-8", 0x404, u"cht"},
      {"LANG", "zh_CN.UTF-8", 0x804, u"chs"},  {"LANG", "pt_BR.UTF-8", 0x416, u"por"},
      {"LANG", "es_ES.UTF-8", 0x40A, u"esp"},  {"LANG", "tr_TR.UTF-8", 0x41F, u"tur"},
      {"LANG", "ko_KR.UTF-8", 0x412, u"kor"},  {"LANG", "fr_FR.UTF-8", 0x40C, u"fra"},
      {"LANG", "it_IT.UTF-8", 0x410, u"ita"},  {"LANG", "ja_JP.UTF-8", 0x411, u"jpn"},
      {"LANG", "nl_NL.UTF-8", 0x409, u"enu"},  {"LANG", "de_AT.UTF-8", 0x409, u"enu"},
      {"LANG", "C", 0x409, u"enu"},            {"LC_MESSAGES", "de_DE.UTF-8", 0x407, u"deu"},
      {"LC_ALL", "ko_KR.UTF-8", 0x412, u"kor"},
  };
  for (const auto& [variable, value, id, code] : cases) {
    ResTest::ScopedEnvironment environment;
    ResTest::ClearLocaleVariables(environment);
    environment.Set(variable, value);
    EXPECT_EQ(GetLanguageId(), id) << variable << "=" << value;
    EXPECT_EQ(std::u16string(GetLanguageIdString()), code) << value;
  }
}

class LoaderTest : public ResTest::ResourceTest {
 protected:
  std::vector<std::u16string> FallbackWarnings() const {
    std::vector<std::u16string> warnings;
    for (const auto& line : DebugOutput()) {
      if (line.find(u"defaulting to English") != std::u16string::npos) warnings.push_back(line);
    }
    return warnings;
  }
};

TEST_F(LoaderTest, LoadsTheChosenLanguage) {
  const DWORD german = 0x407;
  SetRegistryLanguage(&german);
  UseModules(MakeModuleFolder({"OWEngineRes409.so", "OWEngineRes407.so", "OWAppRes409.so", "OWAppRes407.so"}));
  HINSTANCE module = nullptr;
  CString name;
  ASSERT_TRUE(LoadResourceModule(u"AppRes", &module, name));
  EXPECT_EQ(name, CString(u"OWAppRes407.so"));
  EXPECT_EQ(Platform::GetModuleResourceLanguage(module), 0x407);
  Platform::FreeLibrary(module);

  ASSERT_TRUE(LoadAppResources(nullptr));
  EXPECT_EQ(Platform::GetModuleResourceLanguage(GetAppResourceHandle()), 0x407);
  EXPECT_EQ(Platform::GetModuleResourceLanguage(GetEngineResourceHandle()), 0x407);
  EXPECT_EQ(LVXSS_get(1), CString(u"Engine Deutsch"));
  EXPECT_TRUE(FallbackWarnings().empty());
}

TEST_F(LoaderTest, UnsupportedLanguageTriesEnglishOnly) {
  const DWORD dutch = 0x413;
  SetRegistryLanguage(&dutch);
  UseModules(MakeModuleFolder({"OWAppRes409.so"}));
  HINSTANCE module = nullptr;
  CString name;
  ASSERT_TRUE(LoadResourceModule(u"AppRes", &module, name));
  EXPECT_EQ(name, CString(u"OWAppRes409.so"));
  EXPECT_TRUE(FallbackWarnings().empty());
}

TEST_F(LoaderTest, FallbackToEnglishWarnsOncePerProcess) {
  const DWORD german = 0x407;
  SetRegistryLanguage(&german);
  auto folder = MakeModuleFolder({"OWOtherRes409.so", "OWLFRes409.so"});
  UseModules(folder);
  HINSTANCE first = nullptr;
  HINSTANCE second = nullptr;
  CString firstName;
  CString secondName;
  ASSERT_TRUE(LoadResourceModule(u"LFRes", &first, firstName));
  ASSERT_TRUE(LoadResourceModule(u"OtherRes", &second, secondName));
  EXPECT_EQ(firstName, CString(u"OWLFRes409.so"));
  EXPECT_EQ(secondName, CString(u"OWOtherRes409.so"));

  auto warnings = FallbackWarnings();
  ASSERT_EQ(warnings.size(), 1u);
  CString expected(u"Unable to load resource file ");
  expected += folder.windows;
  expected += u"\\OWLFRes407.so, defaulting to English";
  EXPECT_EQ(CString(warnings[0]).Trim(), expected);
  EXPECT_TRUE(LmUtils::g_bResourceFallbackReported);
}

TEST_F(LoaderTest, BothModulesMissingLeavesTheOutputsAlone) {
  UseModules(MakeModuleFolder({}));
  int marker = 0;
  HINSTANCE module = reinterpret_cast<HINSTANCE>(&marker);
  CString name(u"unchanged");
  EXPECT_FALSE(LoadResourceModule(u"AppRes", &module, name));
  EXPECT_EQ(module, reinterpret_cast<HINSTANCE>(&marker));
  EXPECT_EQ(name, CString(u"unchanged"));
  // Reported to the event logger with the export's name, as a failure of LoadLibrary.
  std::u16string all;
  for (const auto& line : DebugOutput()) all += line;
  EXPECT_NE(all.find(u"LoadResourceModule"), std::u16string::npos) << OwTest::Narrow(all);
  EXPECT_NE(all.find(u"LoadLibrary"), std::u16string::npos) << OwTest::Narrow(all);
  EXPECT_FALSE(LoadResourceModule(u"AppRes", nullptr, name));  // no crash on a null output
}

TEST_F(LoaderTest, EngineModuleWithoutOemExportsIsFreed) {
  auto folder = MakeModuleFolder({"no-oem/OWEngineRes409.so", "OWAppRes409.so", "OWLFRes409.so"});
  UseModules(folder);
  EXPECT_FALSE(LoadEngineResources());
  EXPECT_EQ(LmUtils::g_hEngineResources, nullptr);
  EXPECT_EQ(LmUtils::g_pOEMData, nullptr);
  EXPECT_EQ(LmUtils::g_pOEMEmailInfo, nullptr);
  EXPECT_EQ(Platform::GetModuleHandleW(OwTest::Widen(folder.native + "/OWEngineRes409.so").c_str()), nullptr);
  // Without the engine module neither the application nor the LF module is tried.
  EXPECT_FALSE(LoadAppResources(nullptr));
  EXPECT_FALSE(LoadLFResources());
  EXPECT_EQ(LmUtils::g_hAppResources, nullptr);
  EXPECT_EQ(LmUtils::g_hLFResources, nullptr);
  EXPECT_TRUE(LVXSS_get(1).IsEmpty());
}

TEST_F(LoaderTest, HandlesBeforeLoadingAreAssertionFailures) {
  try {
    GetAppResourceHandle();
    FAIL() << "no exception";
  } catch (const LumoException::AssertionFailed0& e) {
    EXPECT_NE(e.GetMessage().find(u"g_hAppResources != NULL"), std::u16string::npos);
  }
  EXPECT_THROW(GetEngineResourceHandle(), LumoException::AssertionFailed0);
}

TEST_F(LoaderTest, EachKindLoadsOnceAndTheLastLoadIsCurrent) {
  auto folder = MakeModuleFolder({"OWEngineRes409.so", "OWAppRes409.so", "OWOtherRes409.so", "OWLFRes409.so",
                                  "OWAppMsg409.so"});
  UseModules(folder);
  HINSTANCE main = Platform::GetModuleHandleW(nullptr);
  EXPECT_EQ(AfxGetResourceHandle(), main);
  ASSERT_TRUE(LoadAppResources(nullptr));
  HINSTANCE app = GetAppResourceHandle();
  EXPECT_EQ(AfxGetResourceHandle(), app);
  // Another base name later: nothing more is loaded, the application module is current again.
  ASSERT_TRUE(LoadLFResources());
  EXPECT_EQ(AfxGetResourceHandle(), LmUtils::g_hLFResources);
  ASSERT_TRUE(LoadAppResources(u"OtherRes"));
  EXPECT_EQ(GetAppResourceHandle(), app);
  EXPECT_EQ(AfxGetResourceHandle(), app);
  EXPECT_EQ(Platform::GetModuleHandleW(OwTest::Widen(folder.native + "/OWOtherRes409.so").c_str()), nullptr);
  // The message module never becomes current.
  ASSERT_TRUE(LoadMessageResources());
  EXPECT_EQ(LmUtils::g_strMessageModuleName, CString(u"OWAppMsg409.so"));
  EXPECT_EQ(AfxGetResourceHandle(), app);
  ASSERT_TRUE(LoadEngineResources());
  EXPECT_EQ(AfxGetResourceHandle(), GetEngineResourceHandle());
}

TEST_F(LoaderTest, EngineStringsInThreeForms) {
  UseModules(MakeModuleFolder({"OWEngineRes409.so"}));
  EXPECT_EQ(LVXSS_get(1), CString(u"Engine English"));
  EXPECT_EQ(AfxGetResourceHandle(), LmUtils::g_hEngineResources);  // loaded on first use
  EXPECT_EQ(LVXSS_get(65535), CString(u"Highest id"));
  EXPECT_TRUE(LVXSS_get(3).IsEmpty());

  CString text(u"previous");
  LVXSS_get(3, text);
  EXPECT_EQ(text, CString(u"previous"));  // a missing string leaves it alone
  LVXSS_get(2, text);
  EXPECT_EQ(text, CString(u"A longer engine string"));

  char16_t buffer[9];
  LVXSS_get(2, buffer, 9);
  EXPECT_EQ(std::u16string(buffer), u"A longer");
  LVXSS_get(3, buffer, 9);
  EXPECT_EQ(buffer[0], 0);
  buffer[0] = u'x';
  LVXSS_get(2, buffer, 0);  // no room: nothing written
  EXPECT_EQ(buffer[0], u'x');
  LVXSS_get(2, buffer, -1);
  EXPECT_EQ(buffer[0], u'x');
  LVXSS_get(2, nullptr, 9);  // no crash
}

TEST_F(LoaderTest, ShippedModulesInBothLanguages) {
  const std::vector<std::string> files = {"OWAppRes409.so", "OWAppRes407.so", "OWEngineRes409.so",
                                          "OWEngineRes407.so", "OWLFRes409.so", "OWLFRes407.so",
                                          "OWAppMsg409.so", "OWAppMsg407.so"};
  UseModules(MakeModuleFolder(files, OWTEST_SHIPPED_DIR));
  ASSERT_TRUE(LoadAppResources(nullptr));
  ASSERT_TRUE(LoadLFResources());
  ASSERT_TRUE(LoadMessageResources());
  EXPECT_EQ(LVXSS_get(1002), CString(u"Running"));
  EXPECT_EQ(LVXSS_get(1301), CString(u"There is not enough free space on the destination."));
  EXPECT_EQ(LmUtils::g_pOEMData->dwMajorVersion, 19u);
  EXPECT_EQ(LmUtils::g_pOEMData->dwMinorVersion, 0u);
  EXPECT_EQ(LmUtils::g_pOEMData->dwBuild, 0u);
  EXPECT_STRNE(LmUtils::g_pOEMData->szReportName, "");

  LmUtils::detail::ResetResourceStateForTesting();
  m_environment.Set("LANG", "de_DE.UTF-8");
  ASSERT_TRUE(LoadAppResources(nullptr));
  EXPECT_EQ(LVXSS_get(1002), CString(u"Wird ausgeführt"));
  EXPECT_EQ(LVXSS_get(1100), CString(u"Sicherung"));
  EXPECT_EQ(LmUtils::g_pOEMData->dwMajorVersion, 19u);
}

}  // namespace
