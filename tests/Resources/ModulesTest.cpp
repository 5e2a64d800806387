// The platform module loader: loading, exports, string and message tables, data-file handles.
#include <gtest/gtest.h>

#include <fstream>

#include "ResourceTestSupport.h"
#include "owutils/LmOem.h"
#include "platform/Errors.h"
#include "platform/Modules.h"
#include "platform/Process.h"
#include "support/TestEnvironment.h"

namespace {

using ResTest::MakeModuleFolder;

std::u16string PathOf(const ResTest::ModuleFolder& folder, const char* file) {
  return (folder.windows + u"\\" + CString(OwTest::Widen(file))).str();
}

class ModulesTest : public ResTest::ResourceTest {};

TEST_F(ModulesTest, LoadsStringsInBothForms) {
  auto folder = MakeModuleFolder({"OWAppRes409.so"});
  HMODULE module = Platform::LoadLibraryW(PathOf(folder, "OWAppRes409.so").c_str());
  ASSERT_NE(module, nullptr);

  // Zero size: a read-only pointer to the text and its length, not terminated.
  const char16_t* text = nullptr;
  int length = Platform::LoadStringW(module, 10, reinterpret_cast<char16_t*>(&text), 0);
  EXPECT_EQ(std::u16string(text, length), u"Application English");

  // Escapes of the string source survive the build.
  length = Platform::LoadStringW(module, 11, reinterpret_cast<char16_t*>(&text), 0);
  EXPECT_EQ(std::u16string(text, length), u"Tab\there, quote \" and \\ backslash, \u00e9");

  // A buffer: at most size-1 units and a terminator.
  char16_t buffer[8];
  EXPECT_EQ(Platform::LoadStringW(module, 10, buffer, 8), 7);
  EXPECT_EQ(std::u16string(buffer), u"Applica");
  EXPECT_EQ(Platform::LoadStringW(module, 10, buffer, 1), 0);
  EXPECT_EQ(buffer[0], 0);

  // A missing id: 0, 1814 and an empty buffer.
  buffer[0] = u'x';
  EXPECT_EQ(Platform::LoadStringW(module, 12, buffer, 8), 0);
  EXPECT_EQ(Platform::GetLastError(), static_cast<DWORD>(ERROR_RESOURCE_NAME_NOT_FOUND));
  EXPECT_EQ(buffer[0], 0);
  EXPECT_EQ(Platform::LoadStringW(module, 10, nullptr, 8), 0);
  EXPECT_EQ(Platform::GetLastError(), static_cast<DWORD>(ERROR_INVALID_PARAMETER));

  EXPECT_TRUE(Platform::FreeLibrary(module));
}

TEST_F(ModulesTest, ReportsMissingAndInvalidModules) {
  auto folder = MakeModuleFolder({});
  EXPECT_EQ(Platform::LoadLibraryW(PathOf(folder, "OWNothing409.so").c_str()), nullptr);
  EXPECT_EQ(Platform::GetLastError(), static_cast<DWORD>(ERROR_MOD_NOT_FOUND));

  std::ofstream(folder.native + "/OWBroken409.so") << "not a shared object";
  EXPECT_EQ(Platform::LoadLibraryW(PathOf(folder, "OWBroken409.so").c_str()), nullptr);
  EXPECT_EQ(Platform::GetLastError(), static_cast<DWORD>(ERROR_BAD_EXE_FORMAT));

  EXPECT_EQ(Platform::LoadLibraryW(nullptr), nullptr);
  EXPECT_EQ(Platform::GetLastError(), static_cast<DWORD>(ERROR_INVALID_PARAMETER));

  int notAModule = 0;
  EXPECT_FALSE(Platform::FreeLibrary(reinterpret_cast<HMODULE>(&notAModule)));
  EXPECT_EQ(Platform::GetLastError(), static_cast<DWORD>(ERROR_INVALID_HANDLE));
}

TEST_F(ModulesTest, ExportsAreTheModulesOwn) {
  auto folder = MakeModuleFolder({"OWEngineRes409.so", "OWAppRes409.so"});
  HMODULE engine = Platform::LoadLibraryW(PathOf(folder, "OWEngineRes409.so").c_str());
  HMODULE app = Platform::LoadLibraryW(PathOf(folder, "OWAppRes409.so").c_str());
  ASSERT_NE(engine, nullptr);
  ASSERT_NE(app, nullptr);
  auto* oem = static_cast<const _tagSYSOEM*>(Platform::GetProcAddress(engine, "__OEMData"));
  ASSERT_NE(oem, nullptr);
  EXPECT_EQ(oem->dwMajorVersion, 5u);
  EXPECT_EQ(Platform::GetProcAddress(app, "__OEMData"), nullptr);
  EXPECT_EQ(Platform::GetLastError(), static_cast<DWORD>(ERROR_PROC_NOT_FOUND));
  // Symbols of the modules it depends on (the C library) are not its exports.
  EXPECT_EQ(Platform::GetProcAddress(app, "malloc"), nullptr);
  Platform::FreeLibrary(app);
  Platform::FreeLibrary(engine);
}

TEST_F(ModulesTest, DatafileHandlesServeResourcesOnly) {
  auto folder = MakeModuleFolder({"OWEngineRes409.so"});
  HMODULE module = Platform::LoadLibraryExW(PathOf(folder, "OWEngineRes409.so").c_str(), nullptr,
                                            Platform::kLoadLibraryAsDatafile);
  ASSERT_NE(module, nullptr);
  char16_t buffer[64];
  EXPECT_GT(Platform::LoadStringW(module, 1, buffer, 64), 0);
  EXPECT_EQ(std::u16string(buffer), u"Engine English");
  EXPECT_EQ(Platform::GetProcAddress(module, "__OEMData"), nullptr);

  // Loaded both ways, the module stays until both references are gone.
  HMODULE normal = Platform::LoadLibraryW(PathOf(folder, "OWEngineRes409.so").c_str());
  ASSERT_NE(normal, nullptr);
  EXPECT_NE(Platform::GetProcAddress(normal, "__OEMData"), nullptr);
  EXPECT_TRUE(Platform::FreeLibrary(module));
  EXPECT_EQ(Platform::LoadStringW(normal, 1, buffer, 64), 14);
  EXPECT_TRUE(Platform::FreeLibrary(normal));
  EXPECT_FALSE(Platform::FreeLibrary(normal));  // no reference left to drop
}

TEST_F(ModulesTest, ModuleHandlesByNameAndAddress) {
  // A file name no other test loads.
  auto folder = MakeModuleFolder({});
  std::filesystem::copy_file(std::string(OWTEST_MODULE_DIR) + "/OWOtherRes409.so", folder.native + "/OWByName409.so");
  EXPECT_EQ(Platform::GetModuleHandleW(u"OWByName409.so"), nullptr);
  HMODULE module = Platform::LoadLibraryW(PathOf(folder, "OWByName409.so").c_str());
  ASSERT_NE(module, nullptr);
  EXPECT_EQ(Platform::GetModuleHandleW(u"OWByName409.so"), module);
  EXPECT_EQ(Platform::GetModuleResourceLanguage(module), 0x409);

  // The module holding an address, and its file name mapped back onto drive C.
  const void* table = Platform::GetProcAddress(module, "OWResourceTable");
  EXPECT_EQ(Platform::GetModuleHandleFromAddress(table, false), module);
  char16_t path[1024];
  DWORD length = Platform::GetModuleFileNameW(module, path, 1024);
  EXPECT_EQ(std::u16string(path, length), PathOf(folder, "OWByName409.so").substr(4));

  EXPECT_TRUE(Platform::FreeLibrary(module));
  EXPECT_EQ(Platform::GetModuleHandleW(u"OWByName409.so"), nullptr);
}

TEST_F(ModulesTest, MessageTemplates) {
  auto folder = MakeModuleFolder({"OWAppMsg409.so", "OWAppRes409.so"});
  HMODULE messages = Platform::LoadLibraryW(PathOf(folder, "OWAppMsg409.so").c_str());
  ASSERT_NE(messages, nullptr);
  std::u16string text;
  ASSERT_TRUE(Platform::FindMessageTemplate(messages, 0x20000001, 0, text));
  EXPECT_EQ(text, u"One line with an insert %1.\r\n");
  ASSERT_TRUE(Platform::FindMessageTemplate(messages, 0x20000002, 0x409, text));
  EXPECT_EQ(text, u"First line.\r\nSecond line.\r\nThird line.\r\n");

  EXPECT_FALSE(Platform::FindMessageTemplate(messages, 0x20000003, 0, text));
  EXPECT_EQ(Platform::GetLastError(), static_cast<DWORD>(ERROR_MR_MID_NOT_FOUND));
  EXPECT_FALSE(Platform::FindMessageTemplate(messages, 0x20000001, 0x407, text));
  EXPECT_EQ(Platform::GetLastError(), static_cast<DWORD>(ERROR_RESOURCE_LANG_NOT_FOUND));
  EXPECT_FALSE(Platform::FindMessageTemplate(nullptr, 0x20000001, 0, text));
  EXPECT_EQ(Platform::GetLastError(), static_cast<DWORD>(ERROR_INVALID_HANDLE));

  HMODULE strings = Platform::LoadLibraryW(PathOf(folder, "OWAppRes409.so").c_str());
  EXPECT_FALSE(Platform::FindMessageTemplate(strings, 0x20000001, 0, text));
  Platform::FreeLibrary(strings);
  Platform::FreeLibrary(messages);
}

TEST_F(ModulesTest, CurrentResourceModuleFollowsTheLastSetAndDiesWithItsModule) {
  HINSTANCE main = Platform::GetModuleHandleW(nullptr);
  EXPECT_EQ(Platform::GetResourceHandle(), main);
  auto folder = MakeModuleFolder({"OWAppRes409.so"});
  HMODULE module = Platform::LoadLibraryW(PathOf(folder, "OWAppRes409.so").c_str());
  Platform::SetResourceHandle(module);
  EXPECT_EQ(Platform::GetResourceHandle(), module);
  Platform::FreeLibrary(module);
  EXPECT_EQ(Platform::GetResourceHandle(), main);
}

}  // namespace
