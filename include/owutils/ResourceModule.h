// The layout of a resource module: the one definition shared by the library, which reads
// modules, and the module builder, which writes them.
//
// A resource module is a shared object without code (OWEngineRes409.so, OWAppRes407.so...)
// that exports one data symbol, OWResourceTable, of type OwResourceTable:
//
//   magic, version   kOwResourceMagic ("OWRS") and kOwResourceVersion
//   language         the Windows language identifier of the texts (0x409, 0x407...)
//   strings          the string table: OwResourceString entries sorted by ascending id, no id
//                    twice; each text is UTF-16 of `length` units followed by a zero unit
//   messages         the message table: OwResourceMessage entries sorted by ascending id; each
//                    text is the message template with %1-style inserts, every line ending in
//                    "\r\n", again followed by a zero unit
//
// String ids are 16-bit (0 to 65535); message ids are 32-bit. The engine module also exports
// the OEM records "__OEMData" and "__OEMEmailInfo" (owutils/LmOem.h).
//
// Modules are not written by hand: the CMake function owutils_add_resource_module (resources/)
// builds one from text sources. Client code never reads this layout; it calls LoadStringW-style
// services of the library (owutils/LmResources.h).
#pragma once

#include <cstdint>

// Marks a data symbol as exported by a resource module.
#if defined(_WIN32)
#  define OWUTILS_RESOURCE_EXPORT extern "C" __declspec(dllexport)
#else
#  define OWUTILS_RESOURCE_EXPORT extern "C" __attribute__((visibility("default")))
#endif

// The name of the data symbol every resource module exports.
#define OWUTILS_RESOURCE_TABLE_SYMBOL "OWResourceTable"

constexpr std::uint32_t kOwResourceMagic = 0x5352574Fu;  // "OWRS" in little-endian bytes
constexpr std::uint16_t kOwResourceVersion = 1;

struct OwResourceString {
  std::uint32_t id;
  std::uint32_t length;  // in UTF-16 units, without the terminating zero
  const char16_t* text;
};

struct OwResourceMessage {
  std::uint32_t id;
  std::uint32_t length;  // in UTF-16 units, without the terminating zero
  const char16_t* text;
};

struct OwResourceTable {
  std::uint32_t magic;
  std::uint16_t version;
  std::uint16_t language;
  std::uint32_t stringCount;
  std::uint32_t messageCount;
  const OwResourceString* strings;
  const OwResourceMessage* messages;
};
