// The OEM records of the engine module.
#include <gtest/gtest.h>

#include <cstring>
#include <memory>

#include "LmUtils/ResourceState.h"
#include "ResourceTestSupport.h"
#include "owutils/LmOem.h"

namespace {

class OemTest : public ResTest::ResourceTest {
 protected:
  // The record as raw bytes, for checks by offset.
  static std::uint16_t UnitAt(const LM_OEM_INFO& info, size_t offset) {
    std::uint16_t unit;
    std::memcpy(&unit, reinterpret_cast<const unsigned char*>(&info) + offset, sizeof unit);
    return unit;
  }
  static std::uint32_t ValueAt(const LM_OEM_INFO& info, size_t offset) {
    std::uint32_t value;
    std::memcpy(&value, reinterpret_cast<const unsigned char*>(&info) + offset, sizeof value);
    return value;
  }
};

TEST_F(OemTest, WithoutEngineModuleEverythingFails) {
  UseModules(ResTest::MakeModuleFolder({}));
  auto info = std::make_unique<LM_OEM_INFO>();
  std::memset(info.get(), 0x5A, sizeof *info);
  EXPECT_EQ(GetOEMDataTCHAR(info.get()), 0xFFFFFFFFu);
  const auto* bytes = reinterpret_cast<const unsigned char*>(info.get());
  EXPECT_TRUE(std::all_of(bytes, bytes + sizeof *info, [](unsigned char b) { return b == 0; }));

  _tagSYSOEM* data = reinterpret_cast<_tagSYSOEM*>(info.get());
  EXPECT_EQ(GetOEMDataTextPtr(&data), 0xFFFFFFFFu);
  EXPECT_EQ(data, nullptr);
  _tagOEMEmailInfo* mail = reinterpret_cast<_tagOEMEmailInfo*>(info.get());
  EXPECT_EQ(GetOEMEmailInfoTextPtr(&mail), 0xFFFFFFFFu);
  EXPECT_EQ(mail, nullptr);
  EXPECT_EQ(GetOEMDataTextPtr(nullptr), 0xFFFFFFFFu);
  EXPECT_EQ(GetOEMDataTCHAR(nullptr), 0xFFFFFFFFu);
}

TEST_F(OemTest, EngineModuleWithoutOemExportsFails) {
  UseModules(ResTest::MakeModuleFolder({"no-oem/OWEngineRes409.so"}));
  _tagSYSOEM* data = nullptr;
  EXPECT_EQ(GetOEMDataTextPtr(&data), 0xFFFFFFFFu);
  EXPECT_EQ(data, nullptr);
}

TEST_F(OemTest, PointersAreTheModulesRecords) {
  UseModules(ResTest::MakeModuleFolder({"OWEngineRes409.so"}));
  _tagSYSOEM* first = nullptr;
  _tagSYSOEM* second = nullptr;
  ASSERT_EQ(GetOEMDataTextPtr(&first), 0u);
  ASSERT_EQ(GetOEMDataTextPtr(&second), 0u);
  EXPECT_EQ(first, second);
  EXPECT_EQ(first->dwBuild, 1234u);
  EXPECT_EQ(first->dwMajorVersion, 5u);
  EXPECT_EQ(first->dwMinorVersion, 2u);
  EXPECT_STREQ(first->szText24, "ABC");
  _tagOEMEmailInfo* mail = nullptr;
  ASSERT_EQ(GetOEMEmailInfoTextPtr(&mail), 0u);
  EXPECT_STREQ(mail->szText100, "reports@example.test");
  EXPECT_EQ(mail->dwValue4336, 4336u);
}

TEST_F(OemTest, WideCopyWidensBySignExtensionAndKeepsReservedBytes) {
  UseModules(ResTest::MakeModuleFolder({"OWEngineRes409.so"}));
  auto info = std::make_unique<LM_OEM_INFO>();
  std::memset(info.get(), 0x5A, sizeof *info);
  ASSERT_EQ(GetOEMDataTCHAR(info.get()), 0u);
  const LM_OEM_INFO& r = *info;

  EXPECT_EQ(ValueAt(r, 0), 0x11223344u);
  EXPECT_EQ(ValueAt(r, 4), 1234u);
  EXPECT_EQ(ValueAt(r, 8), 5u);
  EXPECT_EQ(ValueAt(r, 12), 2u);
  EXPECT_EQ(ValueAt(r, 16), 0u);
  EXPECT_EQ(ValueAt(r, 20), 0xFFFFFFFFu);

  // "ABC" and its terminator; the rest of the field is not written.
  EXPECT_EQ(UnitAt(r, 24), 0x0041);
  EXPECT_EQ(UnitAt(r, 26), 0x0042);
  EXPECT_EQ(UnitAt(r, 28), 0x0043);
  EXPECT_EQ(UnitAt(r, 30), 0x0000);
  EXPECT_EQ(UnitAt(r, 32), 0x5A5A);
  // 0xE9 becomes 0xFFE9, not 0x00E9.
  EXPECT_EQ(UnitAt(r, 56 + 3 * 2), 0xFFE9);
  EXPECT_EQ(std::u16string(r.szReportName, 3), u"Caf");
  EXPECT_EQ(UnitAt(r, 312), 0xFFE9);
  // A text filling its whole field (15 characters and the terminator in 16 bytes).
  EXPECT_EQ(std::u16string(r.szText584), u"0123456789ABCDE");
  EXPECT_EQ(std::u16string(r.aszText600[0]), u"first");
  EXPECT_EQ(std::u16string(r.aszText600[1]), u"");
  EXPECT_EQ(std::u16string(r.aszText600[3]), u"fourth");
  EXPECT_EQ(std::u16string(r.szText4249), u"last text");

  EXPECT_EQ(r.byValue3224, 7);
  EXPECT_EQ(r.byValue4761, 0x81);
  EXPECT_EQ(r.byValue4762, 0x82);
  EXPECT_EQ(ValueAt(r, 9500), 4764u);
  EXPECT_EQ(ValueAt(r, 9504), 0u);
  EXPECT_EQ(ValueAt(r, 9508), 4772u);
  EXPECT_EQ(r.byValue4776, 0);
  EXPECT_EQ(r.byValue4777, 255);

  // E-mail record: 8-bit values zero-extended to 32 bits.
  EXPECT_EQ(ValueAt(r, 36108), 0xABu);
  EXPECT_EQ(ValueAt(r, 36112), 4336u);
  EXPECT_EQ(ValueAt(r, 36116), 4340u);
  EXPECT_EQ(ValueAt(r, 36120), 4344u);
  EXPECT_EQ(ValueAt(r, 36124), 0xFEu);
  EXPECT_EQ(std::u16string(r.szEmailText0), u"subject");
  EXPECT_EQ(std::u16string(r.szEmailText100), u"reports@example.test");
  EXPECT_EQ(std::u16string(r.szEmailText175), u"body");
  EXPECT_EQ(std::u16string(r.szEmailText4272), u"");
  EXPECT_EQ(std::u16string(r.szEmailText4304), u"4304");
  EXPECT_EQ(std::u16string(r.szEmailText5373), u"tail");

  // The stretches the copy never writes keep the caller's bytes.
  const auto* bytes = reinterpret_cast<const unsigned char*>(&r);
  for (auto [from, to] : {std::pair<size_t, size_t>{9514, 9516}, {9644, 17836}, {26178, 34882}, {35082, 36108}}) {
    for (size_t i = from; i < to; ++i) ASSERT_EQ(bytes[i], 0x5A) << "byte " << i;
  }
}

TEST(OemWideningTest, FieldWithoutTerminatorEndsWithZeroUnit) {
  // A narrow field filled to its end has no terminator of its own: the last unit becomes one.
  // Checked through a record built in memory, as a module built elsewhere could hold it.
  _tagSYSOEM oem{};
  _tagOEMEmailInfo mail{};
  std::memset(oem.szText24, 'x', sizeof oem.szText24);
  LmUtils::g_hEngineResources = reinterpret_cast<HINSTANCE>(&oem);  // any non-null handle
  LmUtils::g_pOEMData = &oem;
  LmUtils::g_pOEMEmailInfo = &mail;
  auto info = std::make_unique<LM_OEM_INFO>();
  EXPECT_EQ(GetOEMDataTCHAR(info.get()), 0u);
  EXPECT_EQ(std::u16string(info->szText24), std::u16string(15, u'x'));
  LmUtils::detail::ResetResourceStateForTesting();
}

}  // namespace
