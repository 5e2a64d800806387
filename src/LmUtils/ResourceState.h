// The process-wide state of the resource loaders, shared by the resource, formatting and OEM
// units of LmUtils. Set without a lock: the client programs load their modules during start-up.
#pragma once

#include "owutils/CString.h"
#include "owutils/LmOem.h"
#include "owutils/WinTypes.h"

namespace LmUtils {

extern HINSTANCE g_hAppResources;
extern HINSTANCE g_hEngineResources;
extern HINSTANCE g_hLFResources;
extern HINSTANCE g_hMessageResources;
extern CString g_strMessageModuleName;
extern _tagSYSOEM* g_pOEMData;
extern _tagOEMEmailInfo* g_pOEMEmailInfo;
extern bool g_bResourceFallbackReported;

namespace detail {

// Looks for the modules in `directory` (Windows path syntax) instead of the library's own
// directory; an empty directory restores the normal lookup. For tests.
void SetResourceDirectoryForTesting(const CString& directory);
// Forgets every loaded module (without freeing it), the OEM pointers and the fallback flag, and
// makes the main program the current resource module again. For tests.
void ResetResourceStateForTesting();

}  // namespace detail
}  // namespace LmUtils
