// Paths: long-path forms, roots, existence, free space, native paths.
#include <gtest/gtest.h>

#include <cstdlib>

#include "FsTestSupport.h"
#include "owutils/Paths.h"
#include "platform/FaultInjection.h"

using namespace FsTest;

TEST(Paths, LongPathFormsAndBack) {
  EXPECT_EQ(Paths::ToLongPath(u"C:\\dir"), u"\\\\?\\C:\\dir");
  EXPECT_EQ(Paths::ToLongPath(u"\\\\srv\\share\\f"), u"\\\\?\\UNC\\srv\\share\\f");
  EXPECT_EQ(Paths::ToLongPath(u"\\\\?\\C:\\dir"), u"\\\\?\\C:\\dir");
  EXPECT_EQ(Paths::ToLongPath(u"dir\\f"), u"\\\\?\\UNC\\dir\\f");
  EXPECT_EQ(Paths::FromLongPath(u"\\\\?\\UNC\\srv\\share"), u"\\\\srv\\share");
  EXPECT_EQ(Paths::FromLongPath(Paths::ToLongPath(u"C:\\a\\b")), u"C:\\a\\b");
  EXPECT_EQ(Paths::FromLongPath(u"C:\\a"), u"C:\\a");
  EXPECT_TRUE(Paths::IsLongPath(u"x\\\\?\\y"));  // anywhere, not only at the start
  EXPECT_FALSE(Paths::IsLongPath(u"C:\\x"));
}

TEST(Paths, EmptyPathsArePreconditionFailures) {
  try {
    Paths::ToLongPath(u"");
    FAIL();
  } catch (LumoException::PreconditionFailed0& e) {
    EXPECT_EQ(OwTest::Narrow(e.m_expression), "!strPath.IsEmpty()");
  }
  EXPECT_THROW(Paths::Exists(u""), LumoException::PreconditionFailed0);
  EXPECT_THROW(Paths::GetRootLength(u""), LumoException::PreconditionFailed0);
  try {
    Paths::GetShortPathName(u"");
    FAIL();
  } catch (LumoException::PreconditionFailed0& e) {
    EXPECT_EQ(OwTest::Narrow(e.m_expression), "!strLongPath.IsEmpty()");
  }
}

TEST(Paths, Roots) {
  EXPECT_EQ(Paths::GetRootLength(u"C:\\x"), 3);
  EXPECT_EQ(Paths::GetRootLength(u"\\\\srv\\share\\dir"), 12);
  EXPECT_EQ(Paths::GetRootLength(u"\\\\?\\UNC\\srv\\share"), 17);
  EXPECT_EQ(Paths::GetRoot(u"\\\\srv\\share\\dir"), u"\\\\srv\\share\\");
  EXPECT_EQ(Paths::GetRoot(u"\\\\srv\\share"), u"\\\\srv\\share");
  for (const char16_t* bad : {u"C:", u"\\\\srv\\s", u"\\\\srv", u"srv\\share"}) {
    try {
      Paths::GetRootLength(bad);
      ADD_FAILURE() << OwTest::Narrow(bad);
    } catch (InvalidUncPath& e) {
      EXPECT_EQ(Text(e), "'" + OwTest::Narrow(bad) + "' is not a valid UNC path");
    }
  }
}

TEST(Paths, CombineAddsOneBackslash) {
  EXPECT_EQ(Paths::Combine(u"C:\\a", u"b"), u"C:\\a\\b");
  EXPECT_EQ(Paths::Combine(u"C:\\a\\", u"b"), u"C:\\a\\b");
  EXPECT_EQ(Paths::Combine(u"", u"b"), u"b");
  EXPECT_EQ(Paths::Combine(u"C:\\a", u""), u"C:\\a");
  CString p(u"C:\\x");
  EXPECT_EQ(Paths::AppendPath(p, u"y"), u"C:\\x\\y");
  EXPECT_EQ(p, u"C:\\x\\y");
}

TEST(Paths, ExistenceOnDriveAndShare) {
  Folder d;
  Write(d.Native("file.txt"), "x");
  EXPECT_TRUE(Paths::Exists(d / u"file.txt"));
  EXPECT_FALSE(Paths::IsDirectory(d / u"file.txt"));
  EXPECT_FALSE(Paths::IsDirectory(d / u"missing"));
  EXPECT_TRUE(Paths::IsDirectory(d.path));
  bool isDirectory = false;
  EXPECT_TRUE(Paths::Exists(d / u"file.txt", isDirectory));
  EXPECT_FALSE(isDirectory);
  isDirectory = true;  // left alone for a file
  EXPECT_TRUE(Paths::Exists(d / u"file.txt", isDirectory));
  EXPECT_TRUE(isDirectory);

  std::string unc = OwTest::MakeTempDirectory("unc");
  Write(unc + "/srv/share/dir/f", "y");
  setenv("OWUTILS_UNC_ROOT", unc.c_str(), 1);
  EXPECT_TRUE(Paths::IsDirectory(u"\\\\srv\\share\\dir"));
  EXPECT_TRUE(Paths::Exists(u"\\\\?\\UNC\\srv\\share\\dir\\f"));
  unsetenv("OWUTILS_UNC_ROOT");
  EXPECT_FALSE(Paths::Exists(u"\\\\srv\\share\\dir"));
}

TEST(Paths, LongAndShortNamesOfExistingPaths) {
  Folder d;
  EXPECT_EQ(Paths::GetLongPathName(d.path), d.path);
  EXPECT_EQ(Paths::GetShortPathName(d.path), d.path);
  Caught c;
  try {
    Paths::GetLongPathName(d / u"missing");
  } catch (LumoException::Win32Error& e) {
    c.thrown = true;
    EXPECT_EQ(OwTest::Narrow(e.m_function), "GetLongPathName");
    EXPECT_EQ(e.m_error, ERROR_FILE_NOT_FOUND);
  }
  EXPECT_TRUE(c.thrown);
}

TEST(Paths, FreeDiskSpace) {
  Folder d;
  ULONGLONG mib = Paths::GetFreeDiskSpace(d.path, true);
  ULONGLONG mb = Paths::GetFreeDiskSpace(d.path, false);
  EXPECT_GE(mb, mib);  // smaller units, larger count
  // A UNC root gets its trailing backslash before the platform call.
  Platform::FaultInjection::ScopedFault fault("GetDiskFreeSpaceEx", ERROR_BAD_NETPATH);
  try {
    Paths::GetFreeDiskSpace(u"\\\\srv\\share", true);
    FAIL();
  } catch (FailedToGetDiskFreeSpaceEx& e) {
    EXPECT_EQ(OwTest::Narrow(e.m_path), "\\\\srv\\share\\");
    EXPECT_EQ(e.m_error, ERROR_BAD_NETPATH);
    EXPECT_EQ(Text(e).rfind("Unable to determine free space for path \\\\srv\\share\\, ", 0), 0u);
  }
}

TEST(Paths, NativePathsRoundTrip) {
  Folder d;
  CString native = Paths::ToNativePath(d / u"a\\b");
  EXPECT_EQ(OwTest::Narrow(native.str()), d.native + "/a/b");
  EXPECT_EQ(Paths::FromNativePath(native), d / u"a\\b");
  EXPECT_THROW(Paths::ToNativePath(u"Q:\\x"), LumoException::Win32ErrorCode);
}
