// Application: the running module's file, name and directory, and the process command line.
//
// A null module means this library itself (found from the address of one of its own functions),
// never the host program, so a library loaded from another folder than its host finds the files
// beside it:
//
//   CString dir = Application::GetModuleLongDirectory(nullptr);   // "\\?\C:\app\lib"
//   CString res = Paths::Combine(dir, u"OWEngineRes409.so");
//
// Platform failures raise LumoException::Win32Error (or Win32ErrorCode) naming the platform call.
#pragma once

#include "owutils/CString.h"
#include "owutils/Export.h"
#include "owutils/WinTypes.h"

namespace Application {

// This library's module handle.
OWUTILS_API HMODULE GetOwnModuleHandle();

// The module's full path with long names, at most MAX_PATH characters (Win32ErrorCode naming
// "GetModuleFileName" with 122 when longer).
OWUTILS_API CString GetModulePath(HMODULE module);
// The module's full path with long names in long-path form, of any length.
OWUTILS_API CString GetModuleLongPath(HMODULE module);
// The file name of GetModuleLongPath (after its last backslash).
OWUTILS_API CString GetModuleLongName(HMODULE module);
// The directory of GetModuleLongPath; a root keeps its backslash.
OWUTILS_API CString GetModuleLongDirectory(HMODULE module);
// The directory of GetModulePath.
OWUTILS_API CString GetModuleDirectory(HMODULE module);

// The process command line.
OWUTILS_API CString GetCommandLine();
// The arguments after the program name, joined by single spaces (quoting is not kept: 'a' and
// 'b c' give "a b c"). A failure of the split raises LumoException::Exception
// "Application::GetCommandLineArguments failed" with the platform error as cause.
OWUTILS_API CString GetCommandLineArguments();

}  // namespace Application
