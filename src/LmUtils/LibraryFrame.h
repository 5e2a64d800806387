// The library's process-wide state and the order in which it is built and taken down.
#pragma once

#include <map>
#include <string>

#include "owutils/EventLogger.h"

namespace LmUtils::detail {

// The named-object table: the map, then its lock.
struct NamedObjectTable {
  std::map<std::u16string, void*> map;  // ordinal order of the UTF-16 units
  LumoException::CountedLock lock;
};

// The table, built on first use (at the latest while the library loads, before any export can
// be called); null once the library has begun unloading.
NamedObjectTable* Objects() noexcept;

}  // namespace LmUtils::detail
