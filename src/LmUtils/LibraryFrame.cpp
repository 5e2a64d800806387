// Load and unload of the library: its static state is built at one point, in a fixed order.
//
// C++ leaves the order of construction across translation units open, so the library's static
// objects are not namespace-scope objects of their own but members of one object, built on
// first use: by the load-time initialiser below, or earlier by whichever static initialiser of
// another unit reaches the library first. Members are built in declaration order and taken down
// in reverse: the named-object map and its lock, then the default event logger, which installs
// itself and is registered as "LM_EVENT_HANDLER". At unload the logger goes first, then the lock
// and the map; the entry of the logger is not removed, and any later call finds the library
// unloaded and is refused.
#include "LmUtils/LibraryFrame.h"

#include <atomic>

namespace LmUtils::detail {
namespace {

std::atomic<bool> g_unloaded{false};

class LibraryStatics {
 public:
  static LibraryStatics& Get() {
    static LibraryStatics statics;
    return statics;
  }
  NamedObjectTable& Objects() noexcept { return m_objects; }

 private:
  LibraryStatics() {
    // Straight into the table: the exports would come back here while this is being built.
    m_objects.map[u"LM_EVENT_HANDLER"] = static_cast<LumoException::EventLogger*>(&m_defaultLogger);
  }
  ~LibraryStatics() { g_unloaded = true; }

  NamedObjectTable m_objects;
  LumoException::LmDefaultEventLogger m_defaultLogger;
};

// Builds the library's state while the library loads.
[[maybe_unused]] const bool g_loaded = (LibraryStatics::Get(), true);

}  // namespace

NamedObjectTable* Objects() noexcept {
  if (g_unloaded) return nullptr;
  return &LibraryStatics::Get().Objects();
}

}  // namespace LmUtils::detail
