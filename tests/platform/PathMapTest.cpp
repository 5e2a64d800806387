// The path mapping between Windows-form paths and native ones.
#include <gtest/gtest.h>

#include <cstdlib>
#include <string>

#include "platform/Errors.h"
#include "platform/PathMap.h"
#include "support/TestEnvironment.h"

namespace {

class PathMapTest : public ::testing::Test {
 protected:
  void SetUp() override {
    saved_ = std::getenv("OWUTILS_DRIVES");
    setenv("OWUTILS_DRIVES", "C=/srv/c/;d=/mnt/data", 1);
    setenv("OWUTILS_UNC_ROOT", "/net", 1);
  }
  void TearDown() override {
    setenv("OWUTILS_DRIVES", saved_.c_str(), 1);
    unsetenv("OWUTILS_UNC_ROOT");
  }
  static std::string To(const char16_t* path, bool wildcards = false) {
    std::string native;
    if (!Platform::MapToNative(path, native, wildcards)) return "error " + std::to_string(Platform::GetLastError());
    return native;
  }
  std::string saved_;
};

TEST_F(PathMapTest, DrivesPrefixesAndSeparators) {
  EXPECT_EQ(To(u"C:\\a\\b\\c"), "/srv/c/a/b/c");
  EXPECT_EQ(To(u"c:/a/b"), "/srv/c/a/b");
  EXPECT_EQ(To(u"\\\\?\\C:\\dir"), "/srv/c/dir");
  EXPECT_EQ(To(u"D:\\x\\"), "/mnt/data/x/");
  EXPECT_EQ(To(u"C:\\"), "/srv/c");
  EXPECT_EQ(To(u"E:\\x"), "error 3");  // a drive the map does not name
}

TEST_F(PathMapTest, UncPathsNeedTheRootAServerAndAShare) {
  EXPECT_EQ(To(u"\\\\srv\\share\\dir"), "/net/srv/share/dir");
  EXPECT_EQ(To(u"\\\\?\\UNC\\srv\\share\\f"), "/net/srv/share/f");
  EXPECT_EQ(To(u"\\\\srv"), "error 67");
  unsetenv("OWUTILS_UNC_ROOT");
  EXPECT_EQ(To(u"\\\\srv\\share\\dir"), "error 53");
}

TEST_F(PathMapTest, DotsNeverLeaveTheDriveOrShare) {
  EXPECT_EQ(To(u"C:\\a\\..\\..\\..\\etc\\passwd"), "/srv/c/etc/passwd");
  EXPECT_EQ(To(u"C:\\a\\.\\b\\..\\c"), "/srv/c/a/c");
  EXPECT_EQ(To(u"\\\\srv\\share\\..\\..\\x"), "/net/srv/share/x");
  EXPECT_EQ(To(u"\\\\..\\share\\x"), "error 53");
}

TEST_F(PathMapTest, RelativePathsStayRelativeAndNamesAreChecked) {
  EXPECT_EQ(To(u"dir\\f"), "dir/f");
  EXPECT_EQ(To(u"C:\\a|b"), "error 123");
  EXPECT_EQ(To(u"C:\\a\\b:c"), "error 123");
  EXPECT_EQ(To(u"C:\\a\\*.*"), "error 123");
  EXPECT_EQ(To(u"C:\\a\\*.*", true), "/srv/c/a/*.*");
  EXPECT_EQ(To(u"C:\\*\\x", true), "error 123");  // wildcards only in the last name
  EXPECT_EQ(To(u""), "error 3");
}

TEST_F(PathMapTest, InverseTakesTheLongestRoot) {
  EXPECT_EQ(Platform::MapFromNative("/srv/c/a/b"), u"C:\\a\\b");
  EXPECT_EQ(Platform::MapFromNative("/srv/c"), u"C:\\");
  EXPECT_EQ(Platform::MapFromNative("/mnt/data/x/"), u"D:\\x");
  EXPECT_EQ(Platform::MapFromNative("/net/srv/share/dir"), u"\\\\srv\\share\\dir");
  EXPECT_EQ(Platform::MapFromNative("/srv/cc"), u"Z:\\srv\\cc");  // not under C's root
  // The implicit letter for "/" works forward too, so the inverse always round-trips.
  EXPECT_EQ(To(u"Z:\\srv\\cc"), "/srv/cc");
  setenv("OWUTILS_DRIVES", "C=/", 1);
  EXPECT_EQ(Platform::MapFromNative("/usr/lib"), u"C:\\usr\\lib");
  EXPECT_EQ(To(u"Z:\\x"), "error 3");
}

}  // namespace
