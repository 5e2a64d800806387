// The registry: the library's configuration store, also open to client programs and tools.
//
// The calls the library makes on the Windows registry, with their Win32 behaviour: two hives
// (HKEY_LOCAL_MACHINE, HKEY_CURRENT_USER), key paths separated by backslashes, key and value
// names compared without regard to case (the name as first created is kept), typed values stored
// with their type and exact bytes, and the Win32 result codes returned (not set as last error):
//   ERROR_SUCCESS (0); ERROR_FILE_NOT_FOUND (2) for a missing key or value; ERROR_ACCESS_DENIED
//   (5) for a handle opened without the right needed, or for deleting a key that has subkeys;
//   ERROR_INVALID_HANDLE (6) for a handle that is not an open key; ERROR_INVALID_PARAMETER (87);
//   ERROR_MORE_DATA (234) when a value does not fit (the size needed is returned);
//   ERROR_BAD_PATHNAME (161) for a key path with an empty component; ERROR_KEY_DELETED (1018)
//   for a handle whose key was deleted; ERROR_REGISTRY_CORRUPT (1015) for a damaged store.
//
// On POSIX the registry is the SQLite database "registry.db" in the state folder
// (platform/StateDirectory.h), shared by every process of the user: a key created or a value
// written by one process is seen by the others at once, and concurrent writers lose nothing.
// HKEY_LOCAL_MACHINE is kept in the same store as HKEY_CURRENT_USER (the state folder of root is
// the machine's).
//
//   HKEY key = nullptr;
//   if (Platform::RegOpenKeyExW(HKEY_LOCAL_MACHINE, u"Software\\Orbis Works", 0, KEY_READ, &key) == ERROR_SUCCESS) {
//     DWORD type = 0, value = 0, size = sizeof value;
//     Platform::RegQueryValueExW(key, u"LanguageId", nullptr, &type, reinterpret_cast<BYTE*>(&value), &size);
//     Platform::RegCloseKey(key);
//   }
#pragma once

#include "owutils/Export.h"
#include "owutils/WinTypes.h"

#if !defined(_WIN32)
using REGSAM = DWORD;

#define HKEY_CLASSES_ROOT (reinterpret_cast<HKEY>(static_cast<ULONG_PTR>(0x80000000u)))
#define HKEY_CURRENT_USER (reinterpret_cast<HKEY>(static_cast<ULONG_PTR>(0x80000001u)))
#define HKEY_LOCAL_MACHINE (reinterpret_cast<HKEY>(static_cast<ULONG_PTR>(0x80000002u)))
#define HKEY_USERS (reinterpret_cast<HKEY>(static_cast<ULONG_PTR>(0x80000003u)))

#define REG_NONE 0
#define REG_SZ 1
#define REG_EXPAND_SZ 2
#define REG_BINARY 3
#define REG_DWORD 4
#define REG_MULTI_SZ 7
#define REG_QWORD 11

#define KEY_QUERY_VALUE 0x0001
#define KEY_SET_VALUE 0x0002
#define KEY_CREATE_SUB_KEY 0x0004
#define KEY_ENUMERATE_SUB_KEYS 0x0008
#define KEY_NOTIFY 0x0010
#define KEY_CREATE_LINK 0x0020
#define KEY_WOW64_64KEY 0x0100
#define KEY_WOW64_32KEY 0x0200
#define KEY_READ 0x20019
#define KEY_WRITE 0x20006
#define KEY_EXECUTE 0x20019
#define KEY_ALL_ACCESS 0xF003F

#define REG_OPTION_NON_VOLATILE 0x0
#define REG_CREATED_NEW_KEY 0x1
#define REG_OPENED_EXISTING_KEY 0x2
#endif

#ifndef ERROR_BAD_PATHNAME
#define ERROR_BAD_PATHNAME 161
#endif

namespace Platform {

// Opens `subKey` below `key`, creating it and any missing parents (disposition
// REG_CREATED_NEW_KEY) or opening it as it is (REG_OPENED_EXISTING_KEY). A null or empty
// `subKey` opens a new handle to `key` itself. `access` holds the KEY_* rights the handle grants.
OWUTILS_API LONG RegCreateKeyExW(HKEY key, const char16_t* subKey, DWORD reserved, char16_t* className, DWORD options,
                     REGSAM access, void* security, HKEY* result, DWORD* disposition);
// Opens an existing key; 2 when it does not exist.
OWUTILS_API LONG RegOpenKeyExW(HKEY key, const char16_t* subKey, DWORD options, REGSAM access, HKEY* result);
// Reads value `name` (null or empty: the key's default value). `type` receives the REG_* type;
// with `data` null, `*size` receives the size in bytes; with a buffer too small, 234 and the size
// needed; `size` may be null only when `data` is null. Needs KEY_QUERY_VALUE.
OWUTILS_API LONG RegQueryValueExW(HKEY key, const char16_t* name, DWORD* reserved, DWORD* type, BYTE* data, DWORD* size);
// Writes value `name` with `type` and exactly `size` bytes of `data` (replacing any value of that
// name, whatever its case). Needs KEY_SET_VALUE.
OWUTILS_API LONG RegSetValueExW(HKEY key, const char16_t* name, DWORD reserved, DWORD type, const BYTE* data, DWORD size);
// Removes value `name`; 2 when there is none. Needs KEY_SET_VALUE.
OWUTILS_API LONG RegDeleteValueW(HKEY key, const char16_t* name);
// Removes key `subKey` below `key` with its values; 5 when it still has subkeys, 2 when missing.
OWUTILS_API LONG RegDeleteKeyW(HKEY key, const char16_t* subKey);
// Closes a handle from RegCreateKeyExW or RegOpenKeyExW. The predefined hive handles need no
// closing (closing them succeeds and does nothing).
OWUTILS_API LONG RegCloseKey(HKEY key);

}  // namespace Platform
