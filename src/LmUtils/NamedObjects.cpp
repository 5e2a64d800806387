// The named-object registry.
#include "owutils/NamedObjects.h"

#include "LmUtils/LibraryFrame.h"

using LmUtils::detail::NamedObjectTable;
using LumoException::CountedLockGuard;

namespace {

std::u16string Key(const char16_t* name) { return name == nullptr ? std::u16string() : std::u16string(name); }

}  // namespace

bool LmObjectAdd(const char16_t* name, void* object) {
  NamedObjectTable* table = LmUtils::detail::Objects();
  if (table == nullptr) return false;
  CountedLockGuard guard(table->lock);
  const std::u16string key = Key(name);
  if (key.empty()) return false;
  table->map.insert_or_assign(key, object);
  return true;
}

bool LmObjectDel(const char16_t* name) {
  NamedObjectTable* table = LmUtils::detail::Objects();
  if (table == nullptr) return false;
  CountedLockGuard guard(table->lock);
  const std::u16string key = Key(name);
  if (key.empty()) return false;
  return table->map.erase(key) == 1;
}

void* LmObjectGet(const char16_t* name) {
  NamedObjectTable* table = LmUtils::detail::Objects();
  if (table == nullptr) return nullptr;
  CountedLockGuard guard(table->lock);
  const std::u16string key = Key(name);
  if (key.empty()) return nullptr;
  auto found = table->map.find(key);
  return found == table->map.end() ? nullptr : found->second;
}
