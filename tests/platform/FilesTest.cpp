// The POSIX file backend against the Win32 behaviour the library relies on. Paths go through
// drive C, which the test support maps into the sandbox.
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>
#include <string>
#include <vector>

#include "platform/Errors.h"
#include "platform/FaultInjection.h"
#include "platform/Files.h"
#include "platform/Process.h"
#include "support/TestEnvironment.h"

namespace fs = std::filesystem;
using namespace Platform;

namespace {

// A fresh folder on drive C: its native path and its library path.
struct Folder {
  Folder() {
    static int n = 0;
    name = "pf" + std::to_string(n++);
    native = OwTest::SandboxDirectory() + "/drive-c/" + name;
    fs::create_directories(native);
    path = u"C:\\" + OwTest::Widen(name);
  }
  std::u16string operator/(const char16_t* child) const { return path + u"\\" + child; }
  std::string Native(const char* child) const { return native + "/" + child; }
  std::string name, native;
  std::u16string path;
};

void WriteText(const std::string& native, const std::string& text) { std::ofstream(native, std::ios::binary) << text; }
std::string ReadText(const std::string& native) {
  std::ifstream in(native, std::ios::binary);
  return std::string((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
}

TEST(PlatformFiles, DispositionsAndTheirLastErrors) {
  Folder d;
  std::u16string f = d / u"a.txt";
  HANDLE h = CreateFileW(f.c_str(), GENERIC_WRITE, 0, nullptr, OPEN_EXISTING, 0, nullptr);
  EXPECT_EQ(h, INVALID_HANDLE_VALUE);
  EXPECT_EQ(GetLastError(), 2u);
  EXPECT_EQ(CreateFileW((d / u"missing\\a.txt").c_str(), GENERIC_WRITE, 0, nullptr, CREATE_NEW, 0, nullptr), INVALID_HANDLE_VALUE);
  EXPECT_EQ(GetLastError(), 3u);

  h = CreateFileW(f.c_str(), GENERIC_WRITE, 0, nullptr, CREATE_NEW, 0, nullptr);
  ASSERT_NE(h, INVALID_HANDLE_VALUE);
  DWORD written = 0;
  EXPECT_TRUE(WriteFile(h, "hello", 5, &written, nullptr));
  EXPECT_EQ(written, 5u);
  EXPECT_TRUE(CloseHandle(h));
  EXPECT_EQ(CreateFileW(f.c_str(), GENERIC_WRITE, 0, nullptr, CREATE_NEW, 0, nullptr), INVALID_HANDLE_VALUE);
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_FILE_EXISTS));

  h = CreateFileW(f.c_str(), GENERIC_READ, FILE_SHARE_READ, nullptr, OPEN_ALWAYS, 0, nullptr);
  ASSERT_NE(h, INVALID_HANDLE_VALUE);
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_ALREADY_EXISTS));
  CloseHandle(h);
  h = CreateFileW(f.c_str(), GENERIC_WRITE, 0, nullptr, CREATE_ALWAYS, 0, nullptr);
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_ALREADY_EXISTS));
  CloseHandle(h);
  EXPECT_EQ(ReadText(d.Native("a.txt")), "");  // truncated
  EXPECT_EQ(CreateFileW(d.path.c_str(), GENERIC_READ, 0, nullptr, OPEN_EXISTING, 0, nullptr), INVALID_HANDLE_VALUE);
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_ACCESS_DENIED));  // a directory without backup semantics
  EXPECT_FALSE(CloseHandle(INVALID_HANDLE_VALUE));
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_INVALID_HANDLE));
}

TEST(PlatformFiles, ExclusiveShareExcludesEveryOtherHandleWhileItLives) {
  Folder d;
  WriteText(d.Native("f"), "x");
  std::u16string f = d / u"f";
  HANDLE shared = CreateFileW(f.c_str(), GENERIC_READ, FILE_SHARE_READ, nullptr, OPEN_EXISTING, 0, nullptr);
  ASSERT_NE(shared, INVALID_HANDLE_VALUE);
  EXPECT_EQ(CreateFileW(f.c_str(), FILE_ALL_ACCESS, 0, nullptr, OPEN_EXISTING, 0, nullptr), INVALID_HANDLE_VALUE);
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_SHARING_VIOLATION));
  CloseHandle(shared);
  HANDLE exclusive = CreateFileW(f.c_str(), GENERIC_READ, 0, nullptr, OPEN_EXISTING, 0, nullptr);
  ASSERT_NE(exclusive, INVALID_HANDLE_VALUE);
  EXPECT_EQ(CreateFileW(f.c_str(), GENERIC_READ, FILE_SHARE_READ | FILE_SHARE_WRITE, nullptr, OPEN_EXISTING, 0, nullptr),
            INVALID_HANDLE_VALUE);
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_SHARING_VIOLATION));
  CloseHandle(exclusive);
  HANDLE again = CreateFileW(f.c_str(), GENERIC_READ, FILE_SHARE_READ, nullptr, OPEN_EXISTING, 0, nullptr);
  EXPECT_NE(again, INVALID_HANDLE_VALUE);
  CloseHandle(again);
}

TEST(PlatformFiles, ReadWriteSeekTruncateAndInjectedFaults) {
  Folder d;
  std::u16string f = d / u"rw";
  HANDLE h = CreateFileW(f.c_str(), GENERIC_READ | GENERIC_WRITE, 0, nullptr, CREATE_NEW, 0, nullptr);
  ASSERT_NE(h, INVALID_HANDLE_VALUE);
  DWORD n = 0;
  ASSERT_TRUE(WriteFile(h, "0123456789", 10, &n, nullptr));
  LARGE_INTEGER size{}, pos{}, to{};
  EXPECT_TRUE(GetFileSizeEx(h, &size));
  EXPECT_EQ(size.QuadPart, 10);
  to.QuadPart = -20;
  EXPECT_FALSE(SetFilePointerEx(h, to, &pos, FILE_END));
  EXPECT_EQ(GetLastError(), 131u);
  to.QuadPart = 4;
  EXPECT_TRUE(SetFilePointerEx(h, to, &pos, FILE_BEGIN));
  EXPECT_TRUE(SetEndOfFile(h));
  EXPECT_TRUE(GetFileSizeEx(h, &size));
  EXPECT_EQ(size.QuadPart, 4);
  to.QuadPart = 0;
  SetFilePointerEx(h, to, nullptr, FILE_BEGIN);
  char buffer[16] = {};
  {
    FaultInjection::ScopedFault fault("ReadFile", ERROR_IO_DEVICE);
    EXPECT_FALSE(ReadFile(h, buffer, 16, &n, nullptr));
    EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_IO_DEVICE));
  }
  FaultInjection::ArmShort("ReadFile", 2);
  EXPECT_TRUE(ReadFile(h, buffer, 16, &n, nullptr));
  EXPECT_EQ(n, 2u);
  FaultInjection::Disarm();
  EXPECT_TRUE(ReadFile(h, buffer, 16, &n, nullptr));
  EXPECT_EQ(std::string(buffer, n), "23");
  EXPECT_TRUE(ReadFile(h, buffer, 16, &n, nullptr));
  EXPECT_EQ(n, 0u);  // end of file
  {
    FaultInjection::ScopedFault full("WriteFile", ERROR_DISK_FULL, 1);
    EXPECT_TRUE(WriteFile(h, "a", 1, &n, nullptr));
    EXPECT_FALSE(WriteFile(h, "b", 1, &n, nullptr));
    EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_DISK_FULL));
  }
  EXPECT_TRUE(FlushFileBuffers(h));
  EXPECT_TRUE(CloseHandle(h));
  EXPECT_EQ(ReadText(d.Native("rw")), "0123a");
}

TEST(PlatformFiles, CopyNeverDestroysTheSourceUnderAnotherName) {
  Folder d;
  WriteText(d.Native("src"), "content");
  ASSERT_EQ(::link(d.Native("src").c_str(), d.Native("alias").c_str()), 0);
  EXPECT_FALSE(CopyFileW((d / u"src").c_str(), (d / u"alias").c_str(), FALSE));
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_SHARING_VIOLATION));
  EXPECT_EQ(ReadText(d.Native("src")), "content");

  EXPECT_TRUE(CopyFileW((d / u"src").c_str(), (d / u"SRC").c_str(), TRUE));  // another file here
  EXPECT_FALSE(CopyFileW((d / u"src").c_str(), (d / u"SRC").c_str(), TRUE));
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_FILE_EXISTS));
  ::chmod(d.Native("SRC").c_str(), 0444);
  EXPECT_FALSE(CopyFileW((d / u"src").c_str(), (d / u"SRC").c_str(), FALSE));
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_ACCESS_DENIED));
  EXPECT_FALSE(CopyFileW((d / u"none").c_str(), (d / u"x").c_str(), FALSE));
  EXPECT_EQ(GetLastError(), 2u);
}

TEST(PlatformFiles, MoveDeleteAndAttributes) {
  Folder d;
  WriteText(d.Native("a"), "A");
  WriteText(d.Native("b"), "B");
  EXPECT_FALSE(MoveFileW((d / u"a").c_str(), (d / u"b").c_str()));
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_ALREADY_EXISTS));
  EXPECT_TRUE(MoveFileExW((d / u"a").c_str(), (d / u"b").c_str(), MOVEFILE_REPLACE_EXISTING | MOVEFILE_WRITE_THROUGH));
  EXPECT_EQ(ReadText(d.Native("b")), "A");
  fs::create_directories(d.Native("dir"));
  EXPECT_FALSE(MoveFileExW((d / u"b").c_str(), (d / u"dir").c_str(), MOVEFILE_REPLACE_EXISTING));
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_ACCESS_DENIED));

  EXPECT_EQ(GetFileAttributesW((d / u"b").c_str()), static_cast<DWORD>(FILE_ATTRIBUTE_NORMAL));
  EXPECT_EQ(GetFileAttributesW((d / u"dir").c_str()), static_cast<DWORD>(FILE_ATTRIBUTE_DIRECTORY));
  EXPECT_EQ(GetFileAttributesW((d / u"none\\x").c_str()), INVALID_FILE_ATTRIBUTES);
  EXPECT_EQ(GetLastError(), 3u);
  EXPECT_TRUE(SetFileAttributesW((d / u"b").c_str(), FILE_ATTRIBUTE_READONLY));
  EXPECT_EQ(GetFileAttributesW((d / u"b").c_str()), static_cast<DWORD>(FILE_ATTRIBUTE_READONLY));
  EXPECT_FALSE(DeleteFileW((d / u"b").c_str()));
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_ACCESS_DENIED));
  EXPECT_TRUE(SetFileAttributesW((d / u"b").c_str(), FILE_ATTRIBUTE_NORMAL));
  EXPECT_TRUE(DeleteFileW((d / u"b").c_str()));
  EXPECT_FALSE(DeleteFileW((d / u"dir").c_str()));
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_ACCESS_DENIED));

  WIN32_FILE_ATTRIBUTE_DATA data{};
  WriteText(d.Native("sized"), std::string(300, 'x'));
  EXPECT_TRUE(GetFileAttributesExW((d / u"sized").c_str(), GetFileExInfoStandard, &data));
  EXPECT_EQ(data.nFileSizeLow, 300u);
}

TEST(PlatformFiles, DirectoriesAndLinks) {
  Folder d;
  std::u16string sub = d / u"sub";
  EXPECT_TRUE(CreateDirectoryW(sub.c_str(), nullptr));
  EXPECT_FALSE(CreateDirectoryW(sub.c_str(), nullptr));
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_ALREADY_EXISTS));
  EXPECT_FALSE(CreateDirectoryW((d / u"x\\y").c_str(), nullptr));
  EXPECT_EQ(GetLastError(), 3u);
  WriteText(d.Native("sub/f"), "f");
  EXPECT_FALSE(RemoveDirectoryW(sub.c_str()));
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_DIR_NOT_EMPTY));
  EXPECT_FALSE(RemoveDirectoryW((d / u"gone").c_str()));
  EXPECT_EQ(GetLastError(), 3u);
  EXPECT_FALSE(RemoveDirectoryW((d / u"sub\\f").c_str()));
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_DIRECTORY));

  ASSERT_EQ(::symlink(d.Native("sub").c_str(), d.Native("link").c_str()), 0);
  EXPECT_EQ(GetFileAttributesW((d / u"link").c_str()),
            static_cast<DWORD>(FILE_ATTRIBUTE_DIRECTORY | FILE_ATTRIBUTE_REPARSE_POINT));
  EXPECT_TRUE(RemoveDirectoryW((d / u"link").c_str()));  // the link goes, the target stays
  EXPECT_TRUE(fs::exists(d.Native("sub/f")));

  ULARGE_INTEGER freeBytes{}, total{};
  EXPECT_TRUE(GetDiskFreeSpaceExW(d.path.c_str(), &freeBytes, &total, nullptr));
  EXPECT_GT(total.QuadPart, 0u);
  EXPECT_FALSE(GetDiskFreeSpaceExW((d / u"sub\\f").c_str(), &freeBytes, nullptr, nullptr));

  char16_t buffer[MAX_PATH];
  EXPECT_EQ(GetLongPathNameW(sub.c_str(), buffer, MAX_PATH), sub.size());
  EXPECT_EQ(std::u16string(buffer), sub);
  EXPECT_EQ(GetLongPathNameW(sub.c_str(), buffer, 3), sub.size() + 1);
  EXPECT_EQ(GetShortPathNameW((d / u"none").c_str(), buffer, MAX_PATH), 0u);
  EXPECT_EQ(GetLastError(), 2u);
  EXPECT_EQ(GetShortPathNameW((d / u"none\\x").c_str(), buffer, MAX_PATH), 0u);
  EXPECT_EQ(GetLastError(), 3u);
}

std::vector<std::u16string> FindAll(const std::u16string& pattern) {
  std::vector<std::u16string> names;
  WIN32_FIND_DATAW data;
  HANDLE h = FindFirstFileW(pattern.c_str(), &data);
  if (h == INVALID_HANDLE_VALUE) return names;
  do {
    names.emplace_back(data.cFileName);
  } while (FindNextFileW(h, &data));
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_NO_MORE_FILES));
  FindClose(h);
  return names;
}

TEST(PlatformFiles, FindUsesWindowsWildcardsInNameOrder) {
  Folder d;
  for (const char* n : {"b.tmp", "a.tmp", "c", "x.tar.gz"}) WriteText(d.Native(n), "1");
  using V = std::vector<std::u16string>;
  EXPECT_EQ(FindAll(d / u"*.*"), (V{u".", u"..", u"a.tmp", u"b.tmp", u"c", u"x.tar.gz"}));
  EXPECT_EQ(FindAll(d / u"*.tmp"), (V{u"a.tmp", u"b.tmp"}));
  EXPECT_EQ(FindAll(d / u"?.tmp"), (V{u"a.tmp", u"b.tmp"}));
  EXPECT_EQ(FindAll(d / u"c.*"), (V{u"c"}));
  EXPECT_EQ(FindAll(d / u"*.gz"), (V{u"x.tar.gz"}));
  EXPECT_EQ(FindAll(d / u"c"), (V{u"c"}));
  WIN32_FIND_DATAW data;
  EXPECT_EQ(FindFirstFileW((d / u"*.none").c_str(), &data), INVALID_HANDLE_VALUE);
  EXPECT_EQ(GetLastError(), 2u);
  EXPECT_EQ(FindFirstFileW((d / u"missing\\*.*").c_str(), &data), INVALID_HANDLE_VALUE);
  EXPECT_EQ(GetLastError(), 3u);
  FaultInjection::ScopedFault denied("FindFirstFile", ERROR_ACCESS_DENIED);
  EXPECT_EQ(FindFirstFileW((d / u"*.*").c_str(), &data), INVALID_HANDLE_VALUE);
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_ACCESS_DENIED));
}

TEST(PlatformFiles, NamesAndTypesLevelSkipsTheDetails) {
  Folder d;
  WriteText(d.Native("f"), "12345");
  fs::create_directories(d.Native("sub"));
  ASSERT_EQ(::symlink(d.Native("sub").c_str(), d.Native("link").c_str()), 0);
  WIN32_FIND_DATAW data;
  HANDLE h = FindFirstFileExW((d / u"*").c_str(), kFindExInfoNamesAndTypes, &data, FindExSearchNameMatch, nullptr, 0);
  ASSERT_NE(h, INVALID_HANDLE_VALUE);
  std::vector<std::pair<std::u16string, DWORD>> seen;
  do {
    seen.emplace_back(data.cFileName, data.dwFileAttributes);
    EXPECT_EQ(data.nFileSizeLow, 0u);
  } while (FindNextFileW(h, &data));
  FindClose(h);
  using P = std::pair<std::u16string, DWORD>;
  EXPECT_EQ(seen, (std::vector<P>{{u".", FILE_ATTRIBUTE_DIRECTORY},
                                  {u"..", FILE_ATTRIBUTE_DIRECTORY},
                                  {u"f", FILE_ATTRIBUTE_NORMAL},
                                  {u"link", FILE_ATTRIBUTE_DIRECTORY | FILE_ATTRIBUTE_REPARSE_POINT},
                                  {u"sub", FILE_ATTRIBUTE_DIRECTORY}}));
  EXPECT_EQ(FindFirstFileExW((d / u"*").c_str(), 7, &data, FindExSearchNameMatch, nullptr, 0), INVALID_HANDLE_VALUE);
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_INVALID_PARAMETER));
}

TEST(PlatformProcess, ModuleFileNames) {
  char16_t buffer[4096];
  DWORD n = GetModuleFileNameW(nullptr, buffer, 4096);
  ASSERT_GT(n, 0u);
  std::u16string path(buffer, n);
  EXPECT_EQ(path.substr(path.size() - 15), u"\\tests_platform");
  // Truncated, terminated, and reported as such.
  EXPECT_EQ(GetModuleFileNameW(nullptr, buffer, 4), 4u);
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_INSUFFICIENT_BUFFER));
  EXPECT_EQ(buffer[3], 0);
  // A handle that names no loaded module is refused, not followed.
  int notAModule = 0;
  EXPECT_EQ(GetModuleFileNameW(reinterpret_cast<HMODULE>(&notAModule), buffer, 4096), 0u);
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_MOD_NOT_FOUND));
  HMODULE self = GetModuleHandleFromAddress(reinterpret_cast<const void*>(&GetModuleFileNameW), false);
  ASSERT_NE(self, nullptr);
  EXPECT_EQ(GetModuleFileNameW(self, buffer, 4096), n);
  EXPECT_EQ(GetModuleHandleFromAddress(nullptr, false), nullptr);
}

TEST(PlatformFiles, TemporaryNamesAreCreatedAndUnique) {
  Folder d;
  char16_t name1[MAX_PATH], name2[MAX_PATH];
  UINT a = GetTempFileNameW(d.path.c_str(), u"owtmp", 0, name1);
  UINT b = GetTempFileNameW(d.path.c_str(), u"owtmp", 0, name2);
  ASSERT_NE(a, 0u);
  ASSERT_NE(b, 0u);
  EXPECT_NE(std::u16string(name1), std::u16string(name2));
  EXPECT_EQ(std::u16string(name1).substr(0, d.path.size() + 4), d.path + u"\\owt");
  EXPECT_NE(GetFileAttributesW(name1), INVALID_FILE_ATTRIBUTES);
  EXPECT_EQ(GetTempFileNameW(d.path.c_str(), u"x", 0x1234, name1), 0x1234u);
  EXPECT_EQ(std::u16string(name1), d.path + u"\\x1234.TMP");
  EXPECT_EQ(GetTempFileNameW((d / u"none").c_str(), u"x", 0, name1), 0u);
  EXPECT_EQ(GetLastError(), 3u);
  std::u16string longDir = d.path + u"\\" + std::u16string(300, u'a');
  EXPECT_EQ(GetTempFileNameW(longDir.c_str(), u"x", 0, name1), 0u);
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_BUFFER_OVERFLOW));
}

TEST(PlatformProcess, CommandLineSplitsByWindowsRules) {
  int argc = 0;
  char16_t** argv = CommandLineToArgvW(u"C:\\a\\prog.exe a \"b c\" d\\\\\"e f\" g\\\"h i\\j", &argc);
  ASSERT_NE(argv, nullptr);
  ASSERT_EQ(argc, 6);
  EXPECT_EQ(std::u16string(argv[0]), u"C:\\a\\prog.exe");
  EXPECT_EQ(std::u16string(argv[1]), u"a");
  EXPECT_EQ(std::u16string(argv[2]), u"b c");
  EXPECT_EQ(std::u16string(argv[3]), u"d\\e f");
  EXPECT_EQ(std::u16string(argv[4]), u"g\"h");
  EXPECT_EQ(std::u16string(argv[5]), u"i\\j");
  LocalFree(argv);
  // The process's own line splits back into its arguments.
  argv = CommandLineToArgvW(GetCommandLineW(), &argc);
  ASSERT_NE(argv, nullptr);
  EXPECT_GE(argc, 1);
  LocalFree(argv);
}

TEST(PlatformProcess, CurrentDirectoryAndTempPathAreInLibraryForm) {
  Folder d;
  char16_t saved[4096];
  ASSERT_GT(GetCurrentDirectoryW(4096, saved), 0u);
  ASSERT_TRUE(SetCurrentDirectoryW(d.path.c_str()));
  char16_t now[4096];
  DWORD n = GetCurrentDirectoryW(4096, now);
  EXPECT_EQ(std::u16string(now, n), d.path);
  EXPECT_EQ(GetCurrentDirectoryW(2, now), d.path.size() + 1);
  EXPECT_TRUE(SetCurrentDirectoryW(saved));
  EXPECT_FALSE(SetCurrentDirectoryW((d / u"none").c_str()));

  setenv("TMPDIR", d.native.c_str(), 1);
  n = GetTempPathW(4096, now);
  unsetenv("TMPDIR");
  EXPECT_EQ(std::u16string(now, n), d.path + u"\\");
}

}  // namespace
