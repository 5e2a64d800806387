// Resource modules and language selection.
//
// The client programs keep their localized resources in resource-only modules beside this
// library, one per language: OW<base name><language in hex><platform suffix>, for example
// OWEngineRes409.so (English) or OWAppRes407.so (German). This unit chooses the language,
// loads the module of each kind once with a fallback to English, keeps it for the life of the
// process, and hands out engine strings.
//
//   if (!LoadAppResources(nullptr)) return false;     // loads the engine module first
//   CString title = LVXSS_get(1400);                  // a string of the engine module
//   HINSTANCE app = GetAppResourceHandle();
//
// The language is the registry value "LanguageId" under HKEY_LOCAL_MACHINE\Software\Orbis
// Works\Orbis Works Orbis Agent (low 16 bits), else the user-interface language; anything
// outside the supported set gives English (0x409). Loading a missing language module falls
// back to the English one and writes one warning per process to the event logger registered
// as "LM_EVENT_HANDLER".
//
// Loaders are meant for start-up, on one thread: they test and set their handles without a lock.
#pragma once

#include "owutils/CString.h"
#include "owutils/Export.h"
#include "owutils/WinTypes.h"

// The language stored in the registry (low 16 bits of "LanguageId"), or 0.
OWUTILS_API unsigned short GetAppLangFromRegistry();
// The language to use: always one of the supported identifiers (0x404, 0x407, 0x409, 0x40A,
// 0x40C, 0x410, 0x411, 0x412, 0x416, 0x419, 0x41F, 0x804).
OWUTILS_API unsigned short GetLanguageId();
// The three-letter code of GetLanguageId() ("enu", "deu"...); a constant owned by the library.
OWUTILS_API const char16_t* GetLanguageIdString();

// Loads OW<baseName><language> beside the library, else the English module OW<baseName>409. On
// success stores the handle in *module and the file name loaded (without directory) in
// fileName. On failure reports to the event logger with "LoadResourceModule", returns false and
// leaves both as they were.
OWUTILS_API bool LoadResourceModule(const CString& baseName, HINSTANCE* module, CString& fileName);

// Load the module of their kind once and make it the current resource module. The application
// module (baseName, or "AppRes" for null) and the LF module need the engine module first.
OWUTILS_API bool LoadAppResources(const char16_t* baseName);
OWUTILS_API bool LoadEngineResources();
OWUTILS_API bool LoadLFResources();
// Loads the message-table module "AppMsg" once; never changes the current resource module.
OWUTILS_API bool LoadMessageResources();

// The loaded module; AssertionFailed0 ("g_hAppResources != NULL" / "g_hEngineResources !=
// NULL") when it is not loaded. They never load it.
OWUTILS_API HINSTANCE GetAppResourceHandle();
OWUTILS_API HINSTANCE GetEngineResourceHandle();

// String `id` of the engine module (loaded on first use). The first gives an empty string when
// the string or the module is missing; the second leaves `text` unchanged then; the third
// writes at most size-1 units and a terminator into `buffer`, the empty string when the string
// is missing, and nothing at all for a null buffer or a size below 1.
OWUTILS_API CString LVXSS_get(int id);
OWUTILS_API void LVXSS_get(int id, CString& text);
OWUTILS_API void LVXSS_get(int id, char16_t* buffer, int size);

// The current resource module: the module the client programs load their own resources from by
// default. Each successful LoadAppResources, LoadEngineResources or LoadLFResources makes its
// module current; before that it is the main program.
OWUTILS_API HINSTANCE AfxGetResourceHandle();
OWUTILS_API void AfxSetResourceHandle(HINSTANCE module);
