// OEM branding data: the version numbers, branding texts and e-mail information that the
// engine resource module carries.
//
// The engine module exports two narrow-character records as data symbols: "__OEMData"
// (_tagSYSOEM) and "__OEMEmailInfo" (_tagOEMEmailInfo). Their byte layout is an interface
// between separately built modules and is fixed here, field by field, with a compile-time check
// of every offset. Most fields carry no meaning for this library and are named after their
// offset; they are passed through by position.
//
//   _tagSYSOEM* oem = nullptr;
//   if (GetOEMDataTextPtr(&oem) == 0) version = oem->dwMajorVersion;
//
//   auto info = std::make_unique<LM_OEM_INFO>();   // 39,200 bytes: keep it off the stack
//   if (GetOEMDataTCHAR(info.get()) == 0) name = info->szReportName;
//
// Each export loads the engine module on first use (owutils/LmResources.h). The returned
// pointers stay valid for the life of the process; the records are read-only.
//
// Texts are widened byte by byte with sign extension, as the records have always been read:
// bytes 0x00-0x7F keep their value, bytes 0x80-0xFF become 0xFF80-0xFFFF. OEM texts should
// therefore stay within ASCII.
#pragma once

#include <cstddef>

#include "owutils/Export.h"
#include "owutils/WinTypes.h"

#pragma pack(push, 1)

// The engine module's "__OEMData" record.
struct _tagSYSOEM {
  DWORD dwValue0;
  DWORD dwBuild;
  DWORD dwMajorVersion;
  DWORD dwMinorVersion;
  DWORD dwValue16;
  DWORD dwValue20;
  char szText24[16];
  char szReportName[128];  // the cn value of the crash-report address
  char szText168[128];
  char szText296[64];
  char szText360[64];
  char szText424[64];
  char szText488[32];
  char szText520[32];
  char szText552[32];
  char szText584[16];
  char aszText600[4][16];
  char szText664[256];
  char szText920[256];
  char szText1176[512];
  char szText1688[512];
  char szText2200[512];
  char szText2712[512];
  BYTE byValue3224;
  char szText3225[512];
  char szText3737[512];
  char szText4249[512];
  BYTE byValue4761;
  BYTE byValue4762;
  BYTE byPadding4763;
  DWORD dwValue4764;
  DWORD dwValue4768;
  DWORD dwValue4772;
  BYTE byValue4776;
  BYTE byValue4777;
};

// The engine module's "__OEMEmailInfo" record.
struct _tagOEMEmailInfo {
  char szText0[100];
  char szText100[75];
  char szText175[4096];
  BYTE byValue4271;
  char szText4272[32];
  char szText4304[32];
  DWORD dwValue4336;
  DWORD dwValue4340;
  DWORD dwValue4344;
  BYTE byValue4348;
  char szText4349[512];
  char szText4861[512];
  char szText5373[512];
};

// Both records in one wide-character record, as GetOEMDataTCHAR fills it. The reserved
// stretches are never written: they keep whatever the caller put there.
struct LM_OEM_INFO {
  DWORD dwValue0;
  DWORD dwBuild;
  DWORD dwMajorVersion;
  DWORD dwMinorVersion;
  DWORD dwValue16;
  DWORD dwValue20;
  char16_t szText24[16];
  char16_t szReportName[128];
  char16_t szText168[128];
  char16_t szText296[64];
  char16_t szText360[64];
  char16_t szText424[64];
  char16_t szText488[32];
  char16_t szText520[32];
  char16_t szText552[32];
  char16_t szText584[16];
  char16_t aszText600[4][16];
  char16_t szText664[256];
  char16_t szText920[256];
  char16_t szText1176[512];
  char16_t szText1688[512];
  char16_t szText2200[512];
  char16_t szText2712[512];
  char16_t szText3225[512];
  char16_t szText3737[512];
  char16_t szText4249[512];
  BYTE byValue3224;
  BYTE byValue4761;
  BYTE byValue4762;
  BYTE byPadding9499;
  DWORD dwValue4764;
  DWORD dwValue4768;
  DWORD dwValue4772;
  BYTE byValue4776;
  BYTE byValue4777;
  BYTE abReserved9514[2];
  char16_t szEmailText4272[32];
  char16_t szEmailText4304[32];
  BYTE abReserved9644[8192];
  char16_t szEmailText100[75];
  char16_t szEmailText175[4096];
  BYTE abReserved26178[8704];
  char16_t szEmailText0[100];
  BYTE abReserved35082[1026];
  DWORD dwEmailValue4271;  // the 8-bit value, zero-extended
  DWORD dwEmailValue4336;
  DWORD dwEmailValue4340;
  DWORD dwEmailValue4344;
  DWORD dwEmailValue4348;  // the 8-bit value, zero-extended
  char16_t szEmailText4349[512];
  char16_t szEmailText4861[512];
  char16_t szEmailText5373[512];
};

#pragma pack(pop)

#define OW_OEM_AT_(type, field, offset) \
  static_assert(offsetof(type, field) == (offset), #type "::" #field " must lie at offset " #offset)
OW_OEM_AT_(_tagSYSOEM, dwValue0, 0);
OW_OEM_AT_(_tagSYSOEM, dwBuild, 4);
OW_OEM_AT_(_tagSYSOEM, dwMajorVersion, 8);
OW_OEM_AT_(_tagSYSOEM, dwMinorVersion, 12);
OW_OEM_AT_(_tagSYSOEM, dwValue16, 16);
OW_OEM_AT_(_tagSYSOEM, dwValue20, 20);
OW_OEM_AT_(_tagSYSOEM, szText24, 24);
OW_OEM_AT_(_tagSYSOEM, szReportName, 40);
OW_OEM_AT_(_tagSYSOEM, szText168, 168);
OW_OEM_AT_(_tagSYSOEM, szText296, 296);
OW_OEM_AT_(_tagSYSOEM, szText360, 360);
OW_OEM_AT_(_tagSYSOEM, szText424, 424);
OW_OEM_AT_(_tagSYSOEM, szText488, 488);
OW_OEM_AT_(_tagSYSOEM, szText520, 520);
OW_OEM_AT_(_tagSYSOEM, szText552, 552);
OW_OEM_AT_(_tagSYSOEM, szText584, 584);
OW_OEM_AT_(_tagSYSOEM, aszText600, 600);
OW_OEM_AT_(_tagSYSOEM, szText664, 664);
OW_OEM_AT_(_tagSYSOEM, szText920, 920);
OW_OEM_AT_(_tagSYSOEM, szText1176, 1176);
OW_OEM_AT_(_tagSYSOEM, szText1688, 1688);
OW_OEM_AT_(_tagSYSOEM, szText2200, 2200);
OW_OEM_AT_(_tagSYSOEM, szText2712, 2712);
OW_OEM_AT_(_tagSYSOEM, byValue3224, 3224);
OW_OEM_AT_(_tagSYSOEM, szText3225, 3225);
OW_OEM_AT_(_tagSYSOEM, szText3737, 3737);
OW_OEM_AT_(_tagSYSOEM, szText4249, 4249);
OW_OEM_AT_(_tagSYSOEM, byValue4761, 4761);
OW_OEM_AT_(_tagSYSOEM, byValue4762, 4762);
OW_OEM_AT_(_tagSYSOEM, byPadding4763, 4763);
OW_OEM_AT_(_tagSYSOEM, dwValue4764, 4764);
OW_OEM_AT_(_tagSYSOEM, dwValue4768, 4768);
OW_OEM_AT_(_tagSYSOEM, dwValue4772, 4772);
OW_OEM_AT_(_tagSYSOEM, byValue4776, 4776);
OW_OEM_AT_(_tagSYSOEM, byValue4777, 4777);
static_assert(sizeof(_tagSYSOEM) == 4778, "_tagSYSOEM must be 4,778 bytes");

OW_OEM_AT_(_tagOEMEmailInfo, szText0, 0);
OW_OEM_AT_(_tagOEMEmailInfo, szText100, 100);
OW_OEM_AT_(_tagOEMEmailInfo, szText175, 175);
OW_OEM_AT_(_tagOEMEmailInfo, byValue4271, 4271);
OW_OEM_AT_(_tagOEMEmailInfo, szText4272, 4272);
OW_OEM_AT_(_tagOEMEmailInfo, szText4304, 4304);
OW_OEM_AT_(_tagOEMEmailInfo, dwValue4336, 4336);
OW_OEM_AT_(_tagOEMEmailInfo, dwValue4340, 4340);
OW_OEM_AT_(_tagOEMEmailInfo, dwValue4344, 4344);
OW_OEM_AT_(_tagOEMEmailInfo, byValue4348, 4348);
OW_OEM_AT_(_tagOEMEmailInfo, szText4349, 4349);
OW_OEM_AT_(_tagOEMEmailInfo, szText4861, 4861);
OW_OEM_AT_(_tagOEMEmailInfo, szText5373, 5373);
static_assert(sizeof(_tagOEMEmailInfo) == 5885, "_tagOEMEmailInfo must be 5,885 bytes");

OW_OEM_AT_(LM_OEM_INFO, dwValue0, 0);
OW_OEM_AT_(LM_OEM_INFO, dwBuild, 4);
OW_OEM_AT_(LM_OEM_INFO, dwMajorVersion, 8);
OW_OEM_AT_(LM_OEM_INFO, dwMinorVersion, 12);
OW_OEM_AT_(LM_OEM_INFO, dwValue16, 16);
OW_OEM_AT_(LM_OEM_INFO, dwValue20, 20);
OW_OEM_AT_(LM_OEM_INFO, szText24, 24);
OW_OEM_AT_(LM_OEM_INFO, szReportName, 56);
OW_OEM_AT_(LM_OEM_INFO, szText168, 312);
OW_OEM_AT_(LM_OEM_INFO, szText296, 568);
OW_OEM_AT_(LM_OEM_INFO, szText360, 696);
OW_OEM_AT_(LM_OEM_INFO, szText424, 824);
OW_OEM_AT_(LM_OEM_INFO, szText488, 952);
OW_OEM_AT_(LM_OEM_INFO, szText520, 1016);
OW_OEM_AT_(LM_OEM_INFO, szText552, 1080);
OW_OEM_AT_(LM_OEM_INFO, szText584, 1144);
OW_OEM_AT_(LM_OEM_INFO, aszText600, 1176);
OW_OEM_AT_(LM_OEM_INFO, szText664, 1304);
OW_OEM_AT_(LM_OEM_INFO, szText920, 1816);
OW_OEM_AT_(LM_OEM_INFO, szText1176, 2328);
OW_OEM_AT_(LM_OEM_INFO, szText1688, 3352);
OW_OEM_AT_(LM_OEM_INFO, szText2200, 4376);
OW_OEM_AT_(LM_OEM_INFO, szText2712, 5400);
OW_OEM_AT_(LM_OEM_INFO, szText3225, 6424);
OW_OEM_AT_(LM_OEM_INFO, szText3737, 7448);
OW_OEM_AT_(LM_OEM_INFO, szText4249, 8472);
OW_OEM_AT_(LM_OEM_INFO, byValue3224, 9496);
OW_OEM_AT_(LM_OEM_INFO, byValue4761, 9497);
OW_OEM_AT_(LM_OEM_INFO, byValue4762, 9498);
OW_OEM_AT_(LM_OEM_INFO, dwValue4764, 9500);
OW_OEM_AT_(LM_OEM_INFO, dwValue4768, 9504);
OW_OEM_AT_(LM_OEM_INFO, dwValue4772, 9508);
OW_OEM_AT_(LM_OEM_INFO, byValue4776, 9512);
OW_OEM_AT_(LM_OEM_INFO, byValue4777, 9513);
OW_OEM_AT_(LM_OEM_INFO, abReserved9514, 9514);
OW_OEM_AT_(LM_OEM_INFO, szEmailText4272, 9516);
OW_OEM_AT_(LM_OEM_INFO, szEmailText4304, 9580);
OW_OEM_AT_(LM_OEM_INFO, abReserved9644, 9644);
OW_OEM_AT_(LM_OEM_INFO, szEmailText100, 17836);
OW_OEM_AT_(LM_OEM_INFO, szEmailText175, 17986);
OW_OEM_AT_(LM_OEM_INFO, abReserved26178, 26178);
OW_OEM_AT_(LM_OEM_INFO, szEmailText0, 34882);
OW_OEM_AT_(LM_OEM_INFO, abReserved35082, 35082);
OW_OEM_AT_(LM_OEM_INFO, dwEmailValue4271, 36108);
OW_OEM_AT_(LM_OEM_INFO, dwEmailValue4336, 36112);
OW_OEM_AT_(LM_OEM_INFO, dwEmailValue4340, 36116);
OW_OEM_AT_(LM_OEM_INFO, dwEmailValue4344, 36120);
OW_OEM_AT_(LM_OEM_INFO, dwEmailValue4348, 36124);
OW_OEM_AT_(LM_OEM_INFO, szEmailText4349, 36128);
OW_OEM_AT_(LM_OEM_INFO, szEmailText4861, 37152);
OW_OEM_AT_(LM_OEM_INFO, szEmailText5373, 38176);
static_assert(sizeof(LM_OEM_INFO) == 39200, "LM_OEM_INFO must be 39,200 bytes");
#undef OW_OEM_AT_

// Status of the OEM accessors.
constexpr DWORD kOemSuccess = 0;
constexpr DWORD kOemFailure = 0xFFFFFFFFu;

// On success *data = the engine module's "__OEMData" record and 0; otherwise *data = null and
// 0xFFFFFFFF. A null `data` gives 0xFFFFFFFF and writes nothing. Two calls give the same address.
OWUTILS_API DWORD GetOEMDataTextPtr(_tagSYSOEM** data);
// The same for the "__OEMEmailInfo" record.
OWUTILS_API DWORD GetOEMEmailInfoTextPtr(_tagOEMEmailInfo** data);
// On success fills *info from both records (texts widened, 8-bit e-mail values zero-extended;
// the reserved stretches untouched) and returns 0; otherwise sets all 39,200 bytes to 0 and
// returns 0xFFFFFFFF. A null `info` gives 0xFFFFFFFF.
OWUTILS_API DWORD GetOEMDataTCHAR(LM_OEM_INFO* info);
