// Directories: path text, the current directory, chains, deletion, copies and walks, with the
// examples of drive C (mapped into the sandbox) and of a UNC share under a temporary root.
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdlib>
#include <vector>

#include "FsTestSupport.h"
#include "owutils/Directories.h"
#include "owutils/Paths.h"
#include "platform/Debug.h"
#include "platform/FaultInjection.h"

using namespace FsTest;
namespace FI = Platform::FaultInjection;
namespace fs = std::filesystem;

namespace {
std::string DriveC(const std::string& child) { return OwTest::SandboxDirectory() + "/drive-c/" + child; }
}  // namespace

TEST(Directories, PathText) {
  CString dir(u"C:\\a");
  Directories::AddTrailingBackslash(dir);
  Directories::AddTrailingBackslash(dir);
  EXPECT_EQ(dir, u"C:\\a\\");
  EXPECT_EQ(Directories::RemoveTrailingBackslash(u"C:\\a\\\\"), u"C:\\a\\");
  EXPECT_TRUE(Directories::IsRoot(u"C:\\"));
  EXPECT_TRUE(Directories::IsRoot(u"C:"));
  EXPECT_TRUE(Directories::IsRoot(u"\\\\srv\\share"));
  EXPECT_FALSE(Directories::IsRoot(u"C:\\a"));
  EXPECT_THROW(Directories::IsRoot(u"\\\\srv"), InvalidUncPath);
  EXPECT_EQ(Directories::GetParentDirectory(u"C:\\dir\\file.txt"), u"C:\\dir");
  EXPECT_EQ(Directories::GetParentDirectory(u"C:\\dir\\"), u"C:");
  EXPECT_EQ(Directories::GetParentDirectory(u"C:\\dir"), u"C:");
  EXPECT_EQ(Directories::GetParentDirectory(u"C:\\"), u"C:\\");
  EXPECT_EQ(Directories::GetParentDirectory(u"\\\\srv\\share\\x"), u"\\\\srv\\share");
  EXPECT_EQ(Directories::GetParentDirectory(u"\\\\srv\\share"), u"\\\\srv\\share\\");
  EXPECT_EQ(Directories::GetContainingPath(u"C:\\"), u"");
  EXPECT_EQ(Directories::GetContainingPath(u"C:\\a\\b"), u"C:\\a");
  EXPECT_EQ(Directories::GetDirectoryName(u"C:\\a\\b\\"), u"b");
  Caught c = Catch<FileSystemException>([] { Directories::GetDirectoryName(u"C:\\"); });
  EXPECT_EQ(c.message, "Directory is a root path");
  EXPECT_EQ(Directories::GetDrive(u"C:\\a"), u"C");
  EXPECT_EQ(Directories::GetDrive(u"\\\\srv\\share"), u"");
  EXPECT_EQ(Directories::StripDrive(u"C:\\a\\b\\"), u"\\a\\b");
  EXPECT_EQ(Directories::StripDrive(u"name"), u"name");
  EXPECT_TRUE(Directories::IsDotsName(u".."));
  EXPECT_FALSE(Directories::IsDotsName(u"..."));
  try {
    Directories::IsDotsName(u"");
    FAIL();
  } catch (LumoException::PreconditionFailed0& e) {
    EXPECT_EQ(OwTest::Narrow(e.m_expression), "!strDirectory.IsEmpty()");
  }
}

TEST(Directories, CreateChainsOnDriveC) {
  fs::create_directories(DriveC("a"));
  EXPECT_TRUE(Directories::TryCreateDirectories(u"C:\\a\\b\\c"));
  EXPECT_TRUE(fs::is_directory(DriveC("a/b/c")));
  EXPECT_TRUE(Directories::TryCreateDirectories(u"C:\\a\\b\\c\\"));  // exists
  EXPECT_TRUE(Directories::Exists(u"C:\\a\\b\\c\\"));
  EXPECT_TRUE(Directories::Exists(u"C:\\"));
  EXPECT_TRUE(Directories::TryCreateDirectories(u"C:\\"));
  EXPECT_FALSE(Directories::TryCreateDirectories(u"Q:\\"));  // a drive that does not exist
  EXPECT_FALSE(Directories::TryCreateDirectories(u"Q:\\x\\y"));

  Write(DriveC("f/b"), "file");
  EXPECT_FALSE(Directories::TryCreateDirectories(u"C:\\f\\b\\c"));
  Caught c = Catch<FileSystemException>([] { Directories::CreateDirectories(u"C:\\f\\b"); });
  EXPECT_EQ(c.message, "Cannot create directory 'C:\\f\\b', exists as file");
  c = Catch<FileSystemException>([] { Directories::CreateDirectories(u"Q:\\"); });
  EXPECT_EQ(c.message, "Cannot create root directory 'Q:\\'");
  c = Catch<FileSystemException>([] { Directories::CreateDirectories(u"C:\\f\\b\\c"); });
  EXPECT_EQ(c.message, "Cannot create directory 'C:\\f\\b\\c'");
  EXPECT_EQ(c.causeName, "Win32ErrorCode");
  EXPECT_EQ(c.causeError, ERROR_PATH_NOT_FOUND);
  {
    FI::ScopedFault full("CreateDirectory", ERROR_DISK_FULL);
    c = Catch<FileSystemException>([] { Directories::CreateDirectories(u"C:\\g\\h"); });
    EXPECT_EQ(c.causeError, ERROR_DISK_FULL);
    FI::Arm("CreateDirectory", ERROR_DISK_FULL);
    EXPECT_FALSE(Directories::TryCreateDirectories(u"C:\\g\\h"));
  }
  Directories::CreateDirectories(u"C:\\g\\h\\i");
  EXPECT_TRUE(fs::is_directory(DriveC("g/h/i")));
}

TEST(Directories, CreateChainsOnAShare) {
  std::string unc = OwTest::MakeTempDirectory("unc");
  fs::create_directories(unc + "/srv/share");
  setenv("OWUTILS_UNC_ROOT", unc.c_str(), 1);
  EXPECT_TRUE(Directories::TryCreateDirectories(u"\\\\srv\\share\\dir\\sub"));
  EXPECT_TRUE(Directories::Exists(u"\\\\srv\\share\\dir"));
  EXPECT_TRUE(Directories::HasEntries(u"\\\\srv\\share\\dir\\"));
  EXPECT_FALSE(Directories::HasEntries(u"\\\\srv\\share\\dir\\sub"));
  unsetenv("OWUTILS_UNC_ROOT");
  EXPECT_TRUE(fs::is_directory(unc + "/srv/share/dir/sub"));
  EXPECT_FALSE(Directories::TryCreateDirectories(u"\\\\srv\\share\\other"));  // no UNC root now
}

TEST(Directories, CurrentDirectoryForAScope) {
  Folder d;
  CString before = Directories::GetCurrentDirectory();
  EXPECT_TRUE(Paths::IsLongPath(before));
  {
    Directories::ScopedCurrentDirectory scope(d.path);
    EXPECT_EQ(Directories::GetCurrentDirectory(), Paths::ToLongPath(d.path));
  }
  EXPECT_EQ(Directories::GetCurrentDirectory(), before);
  Caught c = Catch<UnableToSetWorkingDirectory>([&] { Directories::ScopedCurrentDirectory scope(d / u"missing"); });
  EXPECT_EQ(c.causeName, "Win32Error");
  EXPECT_EQ(Directories::GetCurrentDirectory(), before);
  try {
    Directories::ScopedCurrentDirectory scope(nullptr);
    FAIL();
  } catch (LumoException::PreconditionFailed0& e) {
    EXPECT_EQ(OwTest::Narrow(e.m_expression), "pNewCwd != NULL");
  }
  // A failed restore is reported, not raised.
  std::string reported;
  Platform::SetOutputHook([&](const char*, const std::u16string& text) { reported += OwTest::Narrow(text); });
  {
    Directories::ScopedCurrentDirectory scope(d.path);
    FI::Arm("SetCurrentDirectory", ERROR_ACCESS_DENIED);
  }
  FI::Disarm();
  Platform::SetOutputHook(nullptr);
  EXPECT_NE(reported.find("SetCurrentDirectory"), std::string::npos);
  Directories::SetCurrentDirectory(before);
}

TEST(Directories, DeleteFilesByPatternIncludingReadOnly) {
  Folder d;
  Write(d.Native("a.tmp"), "");
  Write(d.Native("b.tmp"), "");
  Write(d.Native("keep.txt"), "");
  ::chmod(d.Native("b.tmp").c_str(), 0444);
  EXPECT_TRUE(Directories::TryDeleteFiles(d.path, u"*.tmp"));
  EXPECT_FALSE(NativeExists(d.Native("a.tmp")));
  EXPECT_FALSE(NativeExists(d.Native("b.tmp")));
  EXPECT_TRUE(NativeExists(d.Native("keep.txt")));
}

TEST(Directories, RemoveTrees) {
  Folder d;
  Write(d.Native("t/x/y/f"), "1");
  Write(d.Native("t/g"), "2");
  ::chmod(d.Native("t/x/y/f").c_str(), 0444);
  EXPECT_TRUE(Directories::TryRemoveDirectoryTree(d / u"t"));
  EXPECT_FALSE(NativeExists(d.Native("t")));
  EXPECT_TRUE(Directories::TryRemoveDirectoryTree(d / u"t"));  // missing is fine here
  EXPECT_TRUE(Directories::TryRemoveDirectory(d / u"t"));
  Caught c = Catch<UnableToDeleteDirectory>([&] { Directories::RemoveDirectoryTree(d / u"t"); });
  EXPECT_EQ(c.message, "Unable to delete directory '" + OwTest::Narrow((d / u"t").str()) + "'");
  EXPECT_EQ(c.causeError, ERROR_PATH_NOT_FOUND);

  Write(d.Native("u/v/f"), "1");
  {
    FI::ScopedFault denied("DeleteFile", ERROR_ACCESS_DENIED);
    c = Catch<UnableToDeleteDirectory>([&] { Directories::RemoveDirectoryTree(d / u"u"); });
    ASSERT_TRUE(c.thrown);
    EXPECT_EQ(c.causeName, "UnableToDeleteFiles");
    FI::Arm("DeleteFile", ERROR_ACCESS_DENIED);
    EXPECT_FALSE(Directories::TryRemoveDirectoryTree(d / u"u"));  // leftovers show at the end
  }
  Directories::RemoveDirectoryTree(d / u"u\\");
  EXPECT_FALSE(NativeExists(d.Native("u")));
}

TEST(Directories, TreeOperationsNeverFollowLinksOutOfTheTree) {
  Folder outside;
  Write(outside.Native("precious/file"), "keep me");
  Write(outside.Native("single"), "keep me too");
  Folder d;
  Write(d.Native("tree/own"), "x");
  ASSERT_EQ(::symlink(outside.Native("precious").c_str(), d.Native("tree/dirlink").c_str()), 0);
  ASSERT_EQ(::symlink(outside.Native("single").c_str(), d.Native("tree/filelink").c_str()), 0);

  ULONGLONG dirs = 0, files = 0;
  bool stop = false;
  Directories::CountEntries(d / u"tree", true, stop, dirs, files);
  EXPECT_EQ(dirs, 1u);  // the directory link counts, its content does not
  EXPECT_EQ(files, 2u);

  Directories::CopyDirectory(d / u"tree", d / u"copy");
  EXPECT_TRUE(fs::is_symlink(d.Native("copy/dirlink")));
  EXPECT_EQ(fs::read_symlink(d.Native("copy/dirlink")), outside.Native("precious"));
  EXPECT_TRUE(fs::is_symlink(d.Native("copy/filelink")));
  EXPECT_EQ(Directories::TryCopyDirectory(d / u"tree", d / u"copy2"), 0u);
  EXPECT_TRUE(fs::is_symlink(d.Native("copy2/dirlink")));

  Directories::RemoveDirectoryTree(d / u"tree");
  EXPECT_TRUE(Directories::TryRemoveDirectoryTree(d / u"copy"));
  EXPECT_FALSE(NativeExists(d.Native("tree")));
  EXPECT_EQ(Read(outside.Native("precious/file")), "keep me");
  EXPECT_EQ(Read(outside.Native("single")), "keep me too");

  // A tree that is itself a link loses the link only.
  ASSERT_EQ(::symlink(outside.Native("precious").c_str(), d.Native("rootlink").c_str()), 0);
  Directories::RemoveDirectoryTree(d / u"rootlink");
  EXPECT_FALSE(NativeExists(d.Native("rootlink")));
  EXPECT_EQ(Read(outside.Native("precious/file")), "keep me");
}

TEST(Directories, CopyTrees) {
  Folder d;
  Write(d.Native("src/a.txt"), "A");
  Write(d.Native("src/sub/b.txt"), "B");
  fs::create_directories(d.Native("src/empty"));
  Write(d.Native("dst/a.txt"), "old");
  EXPECT_EQ(Directories::TryCopyDirectory(d / u"src\\", d / u"dst"), 0u);
  EXPECT_EQ(Read(d.Native("dst/a.txt")), "A");
  EXPECT_EQ(Read(d.Native("dst/sub/b.txt")), "B");
  EXPECT_TRUE(fs::is_directory(d.Native("dst/empty")));

  EXPECT_EQ(Directories::TryCopyDirectory(d / u"none", d / u"made"), 0u);  // missing source
  EXPECT_TRUE(fs::is_directory(d.Native("made")));
  Caught c = Catch<UnableToCopyDirectory>([&] { Directories::CopyDirectory(d / u"none", d / u"made2"); });
  EXPECT_EQ(c.message, "Unable to copy directory from '" + OwTest::Narrow((d / u"none").str()) + "' to '" +
                           OwTest::Narrow((d / u"made2").str()) + "'");

  Directories::CopyDirectory(d / u"src", d / u"raised");
  EXPECT_EQ(Read(d.Native("raised/sub/b.txt")), "B");
  {
    FI::ScopedFault full("CopyFile", ERROR_DISK_FULL, 1);
    c = Catch<UnableToCopyDirectory>([&] { Directories::CopyDirectory(d / u"src", d / u"full"); });
    EXPECT_EQ(c.causeName, "UnableToCopyDirectory");  // from the subdirectory's copy
    FI::Arm("CopyFile", ERROR_DISK_FULL);
    EXPECT_EQ(Directories::TryCopyDirectory(d / u"src", d / u"full2"), static_cast<DWORD>(ERROR_DISK_FULL));
  }
  Write(d.Native("plainfile"), "");
  EXPECT_NE(Directories::TryCopyDirectory(d / u"src", d / u"plainfile"), 0u);  // never success
}

TEST(Directories, CopyOntoItselfOrIntoItselfLosesNothingAndEnds) {
  Folder d;
  Write(d.Native("src/a.txt"), "A");
  Write(d.Native("src/sub/b.txt"), "B");
  EXPECT_EQ(Directories::TryCopyDirectory(d / u"src", d / u"src"), 0u);
  Directories::CopyDirectory(d / u"src", d / u"src");
  EXPECT_EQ(Read(d.Native("src/a.txt")), "A");
  EXPECT_EQ(Directories::TryCopyDirectory(d / u"src", d / u"src\\inner"), 0u);
  EXPECT_EQ(Read(d.Native("src/inner/sub/b.txt")), "B");
  EXPECT_FALSE(NativeExists(d.Native("src/inner/inner")));
  Directories::CopyDirectory(d / u"src\\sub", d / u"src\\sub\\again");
  EXPECT_EQ(Read(d.Native("src/sub/again/b.txt")), "B");
  EXPECT_FALSE(NativeExists(d.Native("src/sub/again/again")));
}

namespace {
struct Seen {
  std::vector<std::string> paths;
  size_t stopAt = 0;
};
bool Record(const char16_t* path, const WIN32_FIND_DATAW&, void* context) {
  auto* seen = static_cast<Seen*>(context);
  seen->paths.push_back(OwTest::Narrow(path));
  return seen->stopAt == 0 || seen->paths.size() < seen->stopAt;
}
}  // namespace

TEST(Directories, EnumerateWalksPreOrderAndStops) {
  Folder d;
  Write(d.Native("w/a"), "12");
  Write(d.Native("w/b/c"), "345");
  Write(d.Native("w/d"), "6");
  Seen seen;
  bool stop = false;
  Directories::Enumerate(d / u"w", &Record, &seen, stop, true);
  std::string base = OwTest::Narrow((d / u"w").str());
  EXPECT_EQ(seen.paths, (std::vector<std::string>{base + "\\a", base + "\\b", base + "\\b\\c", base + "\\d"}));
  EXPECT_FALSE(stop);

  Seen three;
  three.stopAt = 3;
  Directories::Enumerate(d / u"w", &Record, &three, stop, true);
  EXPECT_EQ(three.paths.size(), 3u);
  EXPECT_TRUE(stop);
  Seen none;
  Directories::Enumerate(d / u"w", &Record, &none, stop, true);
  EXPECT_TRUE(none.paths.empty());

  stop = false;
  EXPECT_EQ(Directories::GetTreeSize(d / u"w", stop), 6u);
  ULONGLONG dirs = 9, files = 9;
  Directories::CountEntries(d / u"w", false, stop, dirs, files);
  EXPECT_EQ(dirs, 1u);
  EXPECT_EQ(files, 2u);
  Directories::CountEntries(d / u"w", true, stop, dirs, files);
  EXPECT_EQ(files, 3u);
  EXPECT_THROW(Directories::Enumerate(d / u"w", nullptr, nullptr, stop, true), LumoException::PreconditionFailed0);
}
