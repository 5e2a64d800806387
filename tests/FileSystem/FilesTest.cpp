// Files: copy, move, delete, attributes, sizes, names, text files, temporary files, and the
// Try/raising pairs under injected platform failures.
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdlib>

#include "FsTestSupport.h"
#include "owutils/Files.h"
#include "owutils/Paths.h"
#include "platform/Debug.h"
#include "platform/FaultInjection.h"
#include "platform/Files.h"

using namespace FsTest;
namespace FI = Platform::FaultInjection;

TEST(Files, CopyOntoItselfByAnyNameDoesNothing) {
  Folder d;
  Write(d.Native("f.txt"), "data");
  Files::CopyFile(d / u"f.txt", d / u"f.txt");
  ASSERT_EQ(::link(d.Native("f.txt").c_str(), d.Native("alias").c_str()), 0);
  Files::CopyFile(d / u"f.txt", d / u"alias");
  EXPECT_EQ(Read(d.Native("f.txt")), "data");
}

TEST(Files, CopyToANameDifferingInCaseReallyCopies) {
  // Two names differing in case are two files here: the copy must happen.
  Folder d;
  Write(d.Native("f.txt"), "new");
  Write(d.Native("F.TXT"), "old");
  Files::CopyFile(d / u"f.txt", d / u"F.TXT");
  EXPECT_EQ(Read(d.Native("F.TXT")), "new");
}

TEST(Files, CopyCreatesTheChainAndOverwrites) {
  Folder d;
  Write(d.Native("src"), "one");
  Files::CopyFile(d / u"src", d / u"x\\y\\dst");
  EXPECT_EQ(Read(d.Native("x/y/dst")), "one");
  Write(d.Native("src"), "two");
  Files::CopyFile(d / u"src", d / u"x\\y\\dst");
  EXPECT_EQ(Read(d.Native("x/y/dst")), "two");

  Write(d.Native("src"), "three");
  EXPECT_FALSE(Files::TryCopyFile(d / u"src", d / u"x\\y\\dst", false));
  EXPECT_EQ(Read(d.Native("x/y/dst")), "two");
  EXPECT_TRUE(Files::TryCopyFile(d / u"src", d / u"x\\y\\dst", true));
  EXPECT_EQ(Read(d.Native("x/y/dst")), "three");
  EXPECT_TRUE(Files::TryCopyFile(d / u"src", d / u"new\\dir\\dst", false));
}

TEST(Files, CopyFailureNamesTheLongPathsAndTheError) {
  Folder d;
  Write(d.Native("src"), "x");
  FI::ScopedFault full("CopyFile", ERROR_DISK_FULL);
  Caught c = Catch<UnableToCopyFile>([&] { Files::CopyFile(d / u"src", d / u"dst"); });
  ASSERT_TRUE(c.thrown);
  std::string longSrc = OwTest::Narrow(Paths::ToLongPath(d / u"src").str());
  std::string longDst = OwTest::Narrow(Paths::ToLongPath(d / u"dst").str());
  EXPECT_EQ(c.message, "Unable to copy file from '" + longSrc + "' to '" + longDst + "'");
  EXPECT_EQ(c.causeName, "Win32ErrorCode");
  EXPECT_EQ(c.causeError, ERROR_DISK_FULL);
  EXPECT_FALSE(NativeExists(d.Native("dst")));
  FI::Disarm();
  FI::Arm("CopyFile", ERROR_IO_DEVICE);
  EXPECT_FALSE(Files::TryCopyFile(d / u"src", d / u"dst", true));
}

TEST(Files, RaisingFlavoursWrapTheirPlatformError) {
  Folder d;
  Write(d.Native("f"), "x");
  {
    FI::ScopedFault f("MoveFile", ERROR_ACCESS_DENIED);
    Caught c = Catch<UnableToMoveFile>([&] { Files::MoveFile(d / u"f", d / u"g"); });
    EXPECT_EQ(c.message, "Unable to move file from '" + OwTest::Narrow((d / u"f").str()) + "' to '" +
                             OwTest::Narrow((d / u"g").str()) + "'");
    EXPECT_EQ(c.causeName, "Win32Error");
    EXPECT_EQ(c.causeError, ERROR_ACCESS_DENIED);
  }
  {
    FI::ScopedFault f("MoveFile", ERROR_IO_DEVICE);
    Caught c = Catch<UnableToMoveFile>([&] { Files::MoveFileEx(d / u"f", d / u"g", MOVEFILE_REPLACE_EXISTING); });
    EXPECT_NE(c.causeMessage.find("MoveFileEx"), std::string::npos);
    EXPECT_EQ(c.causeError, ERROR_IO_DEVICE);
  }
  {
    FI::ScopedFault f("DeleteFile", ERROR_ACCESS_DENIED);
    Caught c = Catch<UnableToDeleteFile>([&] { Files::DeleteFile(d / u"f"); });
    EXPECT_EQ(c.message, "Unable to delete file '" + OwTest::Narrow((d / u"f").str()) + "'");
    EXPECT_EQ(c.causeError, ERROR_ACCESS_DENIED);
    FI::Arm("DeleteFile", ERROR_ACCESS_DENIED);
    EXPECT_FALSE(Files::TryDeleteFile(d / u"f"));
  }
  {
    FI::ScopedFault f("GetFileAttributes", ERROR_IO_DEVICE);
    Caught c = Catch<UnableToGetAttributes>([&] { Files::GetAttributes(d / u"f"); });
    EXPECT_EQ(c.message, "Unable to get attributes for file '" + OwTest::Narrow((d / u"f").str()) + "'");
    EXPECT_EQ(c.causeError, ERROR_IO_DEVICE);
  }
  {
    FI::ScopedFault f("SetFileAttributes", ERROR_ACCESS_DENIED);
    Caught c = Catch<UnableToSetAttributes>([&] { Files::SetAttributes(d / u"f", FILE_ATTRIBUTE_READONLY); });
    EXPECT_EQ(c.message, "Unable to set attributes for file '" + OwTest::Narrow((d / u"f").str()) + "'");
    FI::Arm("SetFileAttributes", ERROR_ACCESS_DENIED);
    EXPECT_FALSE(Files::TrySetAttributes(d / u"f", FILE_ATTRIBUTE_READONLY));
  }
  EXPECT_TRUE(NativeExists(d.Native("f")));
}

TEST(Files, MoveDeleteAndAttributesSucceed) {
  Folder d;
  Write(d.Native("a"), "A");
  Files::MoveFile(d / u"a", d / u"b");
  EXPECT_FALSE(Files::Exists(d / u"a"));
  Write(d.Native("c"), "C");
  EXPECT_FALSE(Files::TryMoveFile(d / u"c", d / u"b"));  // exists
  EXPECT_TRUE(Files::TryMoveFileEx(d / u"c", d / u"b", MOVEFILE_REPLACE_EXISTING));
  EXPECT_EQ(Read(d.Native("b")), "C");
  Files::SetAttributes(d / u"b", FILE_ATTRIBUTE_READONLY);
  EXPECT_EQ(Files::GetAttributes(d / u"b"), static_cast<DWORD>(FILE_ATTRIBUTE_READONLY));
  EXPECT_FALSE(Files::TryDeleteFile(d / u"b"));  // read-only
  Files::SetAttributes(d / u"b", FILE_ATTRIBUTE_NORMAL);
  Files::DeleteFile(d / u"b");
  EXPECT_EQ(Files::TryGetAttributes(d / u"b"), INVALID_FILE_ATTRIBUTES);
  WIN32_FILE_ATTRIBUTE_DATA data{};
  EXPECT_FALSE(Files::TryGetAttributesEx(d / u"b", data));
  EXPECT_THROW(Files::DeleteFile(u""), LumoException::PreconditionFailed0);
}

TEST(Files, SizesIncludingBeyondFourGiB) {
  Folder d;
  EXPECT_EQ(Files::GetSize(d / u"missing"), 0u);
  Write(d.Native("small"), std::string(1234, 'x'));
  EXPECT_EQ(Files::GetSize(d / u"small"), 1234u);
  // A sparse file of 5 GiB + 7 bytes takes no room.
  ASSERT_EQ(::truncate((Write(d.Native("big"), ""), d.Native("big")).c_str(), (5ll << 30) + 7), 0);
  EXPECT_EQ(Files::GetSize(d / u"big"), (5ull << 30) + 7);
}

TEST(Files, InUseWhileAnotherHandleIsOpen) {
  Folder d;
  EXPECT_THROW(Files::IsInUse(d / u"missing"), FileDoesNotExist);
  Write(d.Native("f"), "x");
  EXPECT_FALSE(Files::IsInUse(d / u"f"));
  HANDLE h = Platform::CreateFileW(Paths::ToLongPath(d / u"f"), GENERIC_READ, FILE_SHARE_READ, nullptr,
                                   OPEN_EXISTING, 0, nullptr);
  ASSERT_NE(h, INVALID_HANDLE_VALUE);
  EXPECT_TRUE(Files::IsInUse(d / u"f"));
  Platform::CloseHandle(h);
  EXPECT_FALSE(Files::IsInUse(d / u"f"));
}

TEST(Files, CreateFileMakesTheParentChain) {
  Folder d;
  HANDLE h = Files::CreateFile(d / u"p\\q\\f.bin", GENERIC_WRITE, 0, nullptr, CREATE_NEW, 0, nullptr);
  ASSERT_NE(h, INVALID_HANDLE_VALUE);
  Platform::CloseHandle(h);
  EXPECT_TRUE(NativeExists(d.Native("p/q/f.bin")));
  EXPECT_EQ(Files::CreateFile(d / u"p\\q\\f.bin", GENERIC_WRITE, 0, nullptr, CREATE_NEW, 0, nullptr),
            INVALID_HANDLE_VALUE);  // returned, not raised
  Write(d.Native("file"), "x");
  Caught c = Catch<UnableToCreateDirectory>(
      [&] { Files::CreateFile(d / u"file\\f.bin", GENERIC_WRITE, 0, nullptr, CREATE_NEW, 0, nullptr); });
  EXPECT_EQ(c.message, "Unable to create directory '" + OwTest::Narrow((d / u"file").str()) + "'");
}

TEST(Files, ReadTextFileJoinsLines) {
  Folder d;
  Write(d.Native("t.txt"), "ab\ncd");
  EXPECT_EQ(Files::ReadTextFile(d / u"t.txt"), u"abcd");
  Write(d.Native("crlf.txt"), "\xEF\xBB\xBFl\xC3\xBC" "1\r\nline2\r\n\r\nend\n");
  EXPECT_EQ(Files::ReadTextFile(d / u"crlf.txt"), u"l\u00FC1line2end");
  Caught c = Catch<UnableToOpenFile>([&] { Files::ReadTextFile(d / u"missing.txt"); });
  EXPECT_EQ(c.message, "Unable to open file '" + OwTest::Narrow((d / u"missing.txt").str()) + "'");
  EXPECT_EQ(c.causeName, "MFCException");
  FI::ScopedFault f("ReadFile", ERROR_IO_DEVICE);
  EXPECT_THROW(Files::ReadTextFile(d / u"t.txt"), UnableToOpenFile);  // never a partial text
}

TEST(Files, TemporaryFilesAreCreatedInTheTemporaryDirectory) {
  Folder d;
  setenv("TMPDIR", d.native.c_str(), 1);
  CString a = Files::GetTempFileName();
  CString b = Files::GetTempFileName();
  EXPECT_NE(a, b);
  EXPECT_EQ(a.Left(d.path.GetLength() + 1), d.path + u"\\");
  EXPECT_EQ(Files::GetExtension(a), u"TMP");
  EXPECT_TRUE(Files::Exists(a));
  {
    FI::ScopedFault f("GetTempFileName", ERROR_DISK_FULL);
    Caught c = Catch<FileSystemException>([] { Files::GetTempFileName(); });
    EXPECT_EQ(c.message, "Unable to get temporary file");
    EXPECT_EQ(c.causeError, ERROR_DISK_FULL);
  }
  // A temporary directory too long for the buffer is an error, not an empty directory.
  std::string deep = d.native + "/" + std::string(250, 'x');
  setenv("TMPDIR", deep.c_str(), 1);
  EXPECT_THROW(Files::GetTempFileName(), FileSystemException);
  unsetenv("TMPDIR");
}

TEST(Files, FindFileInTreeSearchesSubdirectoriesMetFirst) {
  Folder d;
  Write(d.Native("a/target.dat"), "in a");
  Write(d.Native("b/target.dat"), "in b");
  Write(d.Native("m.txt"), "");
  Write(d.Native("target.dat"), "top");
  CString found = u"unchanged";
  // "a" comes before the first file ("m.txt"), so its candidate is found first.
  EXPECT_TRUE(Files::FindFileInTree(d.path + u"\\", u"target", u".dat", found));
  EXPECT_EQ(found, d / u"a\\target.dat");
  found = u"unchanged";
  EXPECT_FALSE(Files::FindFileInTree(d.path, u"none", u".dat", found));
  EXPECT_EQ(found, u"unchanged");
  Folder empty;
  ASSERT_EQ(::symlink(d.native.c_str(), empty.Native("link").c_str()), 0);
  EXPECT_FALSE(Files::FindFileInTree(empty.path, u"target", u".dat", found));  // links are not followed
}

TEST(Files, NameDissection) {
  EXPECT_EQ(Files::GetFileName(u"C:\\a\\b.txt"), u"b.txt");
  EXPECT_EQ(Files::GetFileName(u"b.txt"), u"b.txt");
  EXPECT_EQ(Files::GetExtension(u"C:\\a.b\\file"), u"b\\file");
  EXPECT_EQ(Files::GetExtension(u"file"), u"");
  EXPECT_EQ(Files::RemoveExtension(u"C:\\a.b\\file"), u"C:\\a.b\\file");
  EXPECT_EQ(Files::RemoveExtension(u"x.tar.gz"), u"x.tar");
  try {
    Files::GetExtension(u"");
    FAIL();
  } catch (LumoException::PreconditionFailed0& e) {
    EXPECT_EQ(OwTest::Narrow(e.m_expression), "!strPathFileName.IsEmpty()");
  }
}

TEST(Files, AutoDeleteFileDeletesAndNeverRaises) {
  Folder d;
  Write(d.Native("tmp"), "x");
  { AutoDeleteFile holder(d / u"tmp"); }
  EXPECT_FALSE(NativeExists(d.Native("tmp")));
  { AutoDeleteFile empty; }
  std::string reported;
  Platform::SetOutputHook([&](const char*, const std::u16string& text) { reported += OwTest::Narrow(text); });
  { AutoDeleteFile missing(d / u"never-there"); }
  Platform::SetOutputHook(nullptr);
  EXPECT_NE(reported.find("Unable to delete file"), std::string::npos);
}
