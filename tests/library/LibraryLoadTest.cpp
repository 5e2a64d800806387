// The shared library as a client program sees it: loaded at run time, entered by its exported
// (decorated) names.
#include <dlfcn.h>
#include <gtest/gtest.h>
#include <stdlib.h>
#include <unistd.h>

#include <filesystem>
#include <string>
#include <thread>

namespace {

using ObjectGet = void* (*)(const char16_t*);
using ObjectAdd = bool (*)(const char16_t*, void*);
using ObjectDel = bool (*)(const char16_t*);

// The decorated names of the exports' signatures.
constexpr const char* kObjectGet = "_Z11LmObjectGetPKDs";
constexpr const char* kObjectAdd = "_Z11LmObjectAddPKDsPv";
constexpr const char* kObjectDel = "_Z11LmObjectDelPKDs";

// The library's state folder and debugger output point into a fresh folder, so that loading can
// be seen to touch no store.
class LibraryLoad : public ::testing::Test {
 protected:
  void SetUp() override {
    std::string pattern = (std::filesystem::temp_directory_path() / "owutils-load-XXXXXX").string();
    ASSERT_NE(mkdtemp(pattern.data()), nullptr);
    m_dir = pattern;
    setenv("OWUTILS_STATE_DIR", m_dir.c_str(), 1);
    unsetenv("OWUTILS_DEBUG_OUTPUT");
  }
  void TearDown() override { std::filesystem::remove_all(m_dir); }
  std::string m_dir;
};

}  // namespace

TEST_F(LibraryLoad, EventHandlerIsRegisteredBeforeAnyCall) {
  void* library = dlopen(OWUTILS_LIBRARY_FILE, RTLD_NOW | RTLD_LOCAL);
  ASSERT_NE(library, nullptr) << dlerror();
  auto get = reinterpret_cast<ObjectGet>(dlsym(library, kObjectGet));
  auto add = reinterpret_cast<ObjectAdd>(dlsym(library, kObjectAdd));
  auto del = reinterpret_cast<ObjectDel>(dlsym(library, kObjectDel));
  ASSERT_NE(get, nullptr);
  ASSERT_NE(add, nullptr);
  ASSERT_NE(del, nullptr);
  // The first call into the library finds the default logger.
  void* handler = get(u"LM_EVENT_HANDLER");
  EXPECT_NE(handler, nullptr);

  int object = 0;
  EXPECT_TRUE(add(u"Client.Object", &object));
  EXPECT_EQ(get(u"Client.Object"), &object);
  // Threads that come and go change nothing.
  std::thread([&] { EXPECT_EQ(get(u"LM_EVENT_HANDLER"), handler); }).join();
  EXPECT_TRUE(del(u"Client.Object"));
  EXPECT_EQ(get(u"LM_EVENT_HANDLER"), handler);
  EXPECT_EQ(dlclose(library), 0);

  // Loading and unloading touched no registry or event-log store.
  EXPECT_TRUE(std::filesystem::is_empty(m_dir));
}

TEST_F(LibraryLoad, ExportsAreVisibleOnlyUnderTheirDecoratedNames) {
  void* library = dlopen(OWUTILS_LIBRARY_FILE, RTLD_NOW | RTLD_LOCAL);
  ASSERT_NE(library, nullptr) << dlerror();
  EXPECT_EQ(dlsym(library, "LmObjectGet"), nullptr);
  EXPECT_NE(dlsym(library, kObjectGet), nullptr);
  // Internal units stay hidden.
  EXPECT_EQ(dlsym(library, "_ZN7LmUtils6detail7ObjectsEv"), nullptr);
  dlclose(library);
}
