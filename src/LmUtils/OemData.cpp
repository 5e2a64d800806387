// The OEM records of the engine module.
#include "owutils/LmOem.h"

#include <cstddef>
#include <cstdint>
#include <cstring>

#include "LmUtils/ResourceState.h"
#include "owutils/LmResources.h"

namespace {

// Widens a narrow text field of `count` bytes into the wide field at `to` byte by byte with sign
// extension (0xE9 becomes 0xFFE9), up to and including its terminating zero or to the end of the
// field; the wide field always ends with a zero unit. The records are packed: the wide field is
// written through bytes, never through a possibly misaligned char16_t pointer.
void WidenField(unsigned char* to, const char* from, size_t count) {
  for (size_t i = 0; i < count; ++i) {
    const auto unit = static_cast<std::uint16_t>(static_cast<std::int16_t>(static_cast<signed char>(from[i])));
    std::memcpy(to + 2 * i, &unit, sizeof unit);
    if (from[i] == 0) return;
  }
  const std::uint16_t zero = 0;
  std::memcpy(to + 2 * (count - 1), &zero, sizeof zero);
}

#define OW_WIDEN_(field, source, extra)                                                      \
  do {                                                                                       \
    static_assert(sizeof(LM_OEM_INFO::field) == 2 * sizeof(source), #field " size");         \
    WidenField(reinterpret_cast<unsigned char*>(info) + offsetof(LM_OEM_INFO, field) + (extra), \
               source, sizeof(source));                                                      \
  } while (false)

bool EngineAvailable() {
  return LmUtils::g_hEngineResources != nullptr || LoadEngineResources();
}

}  // namespace

DWORD GetOEMDataTextPtr(_tagSYSOEM** data) {
  if (data == nullptr) return kOemFailure;
  if (!EngineAvailable() || LmUtils::g_pOEMData == nullptr) {
    *data = nullptr;
    return kOemFailure;
  }
  *data = LmUtils::g_pOEMData;
  return kOemSuccess;
}

DWORD GetOEMEmailInfoTextPtr(_tagOEMEmailInfo** data) {
  if (data == nullptr) return kOemFailure;
  if (!EngineAvailable() || LmUtils::g_pOEMEmailInfo == nullptr) {
    *data = nullptr;
    return kOemFailure;
  }
  *data = LmUtils::g_pOEMEmailInfo;
  return kOemSuccess;
}

DWORD GetOEMDataTCHAR(LM_OEM_INFO* info) {
  if (info == nullptr) return kOemFailure;
  if (!EngineAvailable() || LmUtils::g_pOEMData == nullptr || LmUtils::g_pOEMEmailInfo == nullptr) {
    std::memset(info, 0, sizeof *info);
    return kOemFailure;
  }
  const _tagSYSOEM& oem = *LmUtils::g_pOEMData;
  const _tagOEMEmailInfo& mail = *LmUtils::g_pOEMEmailInfo;

  info->dwValue0 = oem.dwValue0;
  info->dwBuild = oem.dwBuild;
  info->dwMajorVersion = oem.dwMajorVersion;
  info->dwMinorVersion = oem.dwMinorVersion;
  info->dwValue16 = oem.dwValue16;
  info->dwValue20 = oem.dwValue20;

  OW_WIDEN_(szText24, oem.szText24, 0);
  OW_WIDEN_(szReportName, oem.szReportName, 0);
  OW_WIDEN_(szText168, oem.szText168, 0);
  OW_WIDEN_(szText296, oem.szText296, 0);
  OW_WIDEN_(szText360, oem.szText360, 0);
  OW_WIDEN_(szText424, oem.szText424, 0);
  OW_WIDEN_(szText488, oem.szText488, 0);
  OW_WIDEN_(szText520, oem.szText520, 0);
  OW_WIDEN_(szText552, oem.szText552, 0);
  OW_WIDEN_(szText584, oem.szText584, 0);
  for (size_t i = 0; i < 4; ++i) {
    WidenField(reinterpret_cast<unsigned char*>(info) + offsetof(LM_OEM_INFO, aszText600) + 32 * i,
               oem.aszText600[i], sizeof oem.aszText600[i]);
  }
  OW_WIDEN_(szText664, oem.szText664, 0);
  OW_WIDEN_(szText920, oem.szText920, 0);
  OW_WIDEN_(szText1176, oem.szText1176, 0);
  OW_WIDEN_(szText1688, oem.szText1688, 0);
  OW_WIDEN_(szText2200, oem.szText2200, 0);
  OW_WIDEN_(szText2712, oem.szText2712, 0);
  OW_WIDEN_(szText3225, oem.szText3225, 0);
  OW_WIDEN_(szText3737, oem.szText3737, 0);
  OW_WIDEN_(szText4249, oem.szText4249, 0);

  info->byValue3224 = oem.byValue3224;
  info->byValue4761 = oem.byValue4761;
  info->byValue4762 = oem.byValue4762;
  info->dwValue4764 = oem.dwValue4764;
  info->dwValue4768 = oem.dwValue4768;
  info->dwValue4772 = oem.dwValue4772;
  info->byValue4776 = oem.byValue4776;
  info->byValue4777 = oem.byValue4777;

  info->dwEmailValue4271 = mail.byValue4271;
  info->dwEmailValue4344 = mail.dwValue4344;
  info->dwEmailValue4336 = mail.dwValue4336;
  info->dwEmailValue4340 = mail.dwValue4340;
  info->dwEmailValue4348 = mail.byValue4348;
  OW_WIDEN_(szEmailText4272, mail.szText4272, 0);
  OW_WIDEN_(szEmailText4304, mail.szText4304, 0);
  OW_WIDEN_(szEmailText0, mail.szText0, 0);
  OW_WIDEN_(szEmailText100, mail.szText100, 0);
  OW_WIDEN_(szEmailText175, mail.szText175, 0);
  OW_WIDEN_(szEmailText4349, mail.szText4349, 0);
  OW_WIDEN_(szEmailText4861, mail.szText4861, 0);
  OW_WIDEN_(szEmailText5373, mail.szText5373, 0);
  return kOemSuccess;
}
