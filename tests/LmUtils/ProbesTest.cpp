#include "owutils/LmProbes.h"

#include <gtest/gtest.h>

// The connection tests need a listening socket of their own; only 127.0.0.1 is ever reached.
#include <arpa/inet.h>
#include <netinet/in.h>
#include <sys/socket.h>
#include <unistd.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <string>
#include <utility>
#include <vector>

#include "owutils/Exceptions.h"
#include "platform/Debug.h"
#include "platform/Errors.h"
#include "platform/Wow64.h"
#include "support/TestEnvironment.h"

namespace {

using Lumo::String;

// A TCP socket on 127.0.0.1 and an ephemeral port; listening unless told otherwise (then the
// port is released again at once, and stays closed for the test).
class LoopbackPort {
 public:
  explicit LoopbackPort(bool listening) {
    m_fd = socket(AF_INET, SOCK_STREAM, 0);
    EXPECT_GE(m_fd, 0);
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    address.sin_port = 0;
    EXPECT_EQ(bind(m_fd, reinterpret_cast<sockaddr*>(&address), sizeof address), 0);
    socklen_t length = sizeof address;
    EXPECT_EQ(getsockname(m_fd, reinterpret_cast<sockaddr*>(&address), &length), 0);
    m_port = ntohs(address.sin_port);
    if (listening) {
      EXPECT_EQ(listen(m_fd, 8), 0);
    } else {
      close(m_fd);
      m_fd = -1;
    }
  }
  ~LoopbackPort() {
    if (m_fd >= 0) close(m_fd);
  }
  std::u16string Url(const char* scheme, const char* rest = "/") const {
    return OwTest::Widen(std::string(scheme) + "://127.0.0.1:" + std::to_string(m_port) + rest);
  }

 private:
  int m_fd = -1;
  int m_port = 0;
};

TEST(LmInternetCheckConnection, TrueWhenTheHostAcceptsAConnection) {
  LoopbackPort listener(true);
  EXPECT_TRUE(LmInternetCheckConnection(listener.Url("http").c_str()));
  // Only the connection is made: no TLS handshake for https, nothing sent for the path.
  EXPECT_TRUE(LmInternetCheckConnection(listener.Url("https").c_str()));
  EXPECT_TRUE(LmInternetCheckConnection(listener.Url("http", "/reports/submit?x=1&y=%20").c_str()));
}

TEST(LmInternetCheckConnection, FalseForAClosedPort) {
  LoopbackPort closed(false);
  EXPECT_FALSE(LmInternetCheckConnection(closed.Url("http").c_str()));
}

TEST(LmInternetCheckConnection, FalseForMalformedAddresses) {
  EXPECT_FALSE(LmInternetCheckConnection(nullptr));
  for (const char16_t* url : {u"", u"not a url", u"127.0.0.1:80", u"http://", u"http://[::1", u"http://127.0.0.1:99999/",
                              u"http://127.0.0.1:port/", u"unknown-scheme://127.0.0.1/"}) {
    EXPECT_FALSE(LmInternetCheckConnection(url)) << OwTest::Narrow(url);
  }
}

TEST(LmHasInternetConnection, AnswersWithoutFailing) {
  // The answer depends on the machine; it must be stable and must not throw.
  const bool first = LmHasInternetConnection();
  EXPECT_EQ(LmHasInternetConnection(), first);
}

TEST(LmGetExchangeWriterNameForVssQvr, FixedNamesAndUnexpectedValues) {
  EXPECT_EQ(std::u16string(LmGetExchangeWriterNameForVssQvr(Exchange2010)), u"MS-EX2010");
  EXPECT_EQ(std::u16string(LmGetExchangeWriterNameForVssQvr(Exchange2013)), u"MS-EX2013");
  EXPECT_EQ(std::u16string(LmGetExchangeWriterNameForVssQvr(Exchange2016)), u"ms-ex2016");
  EXPECT_EQ(LmGetExchangeWriterNameForVssQvr(Exchange2016), LmGetExchangeWriterNameForVssQvr(Exchange2016));
  for (int bad : {0, 4, -1}) {
    try {
      LmGetExchangeWriterNameForVssQvr(static_cast<ExchangeServerVersion>(bad));
      ADD_FAILURE() << bad;
    } catch (LumoException::UnexpectedValue& e) {
      EXPECT_EQ(e.m_value, bad);
      EXPECT_EQ(e.GetMessage(), String(u"Value '" + OwTest::Widen(std::to_string(bad)) +
                                       u"' was not expected for Exchange server version"));
      ASSERT_FALSE(e.GetHistory().empty());
      EXPECT_EQ(e.GetHistory().front().file.substr(0, 8), String(u"LmUtils") + u'/');
    }
  }
}

TEST(ParseToDomainAndUser, SplitsAtTheFirstSeparator) {
  struct Case {
    const char16_t* account;
    const char16_t* domain;
    const char16_t* user;
  } cases[] = {
      {u"CORP\\alice", u"CORP", u"alice"},
      {u"CORP/alice", u"CORP", u"alice"},
      {u"a\\b\\c", u"a", u"b\\c"},
      {u"a/b\\c", u"a/b", u"c"},  // the backslash wins wherever it stands
      {u"\\alice", u"", u"alice"},
      {u"CORP\\", u"CORP", u""},
      {u"\u0420\u041e\u0413\\\u0430\u043b\u0438\u0441\u0430", u"\u0420\u041e\u0413", u"\u0430\u043b\u0438\u0441\u0430"},
  };
  for (const Case& c : cases) {
    String domain(u"old-domain"), user(u"old-user");
    ParseToDomainAndUser(c.account, domain, user);
    EXPECT_EQ(domain, String(c.domain)) << OwTest::Narrow(c.account);
    EXPECT_EQ(user, String(c.user)) << OwTest::Narrow(c.account);
  }
}

TEST(ParseToDomainAndUser, NoSeparatorLeavesOutputsAlone) {
  for (const char16_t* account : {u"alice@corp.example", u"alice", u""}) {
    String domain(u"keep-d"), user(u"keep-u");
    ParseToDomainAndUser(account, domain, user);
    EXPECT_EQ(domain, String(u"keep-d"));
    EXPECT_EQ(user, String(u"keep-u"));
  }
}

TEST(ParseToDomainAndUser, OutputMayAliasTheInput) {
  String account(u"CORP\\alice");
  String user;
  ParseToDomainAndUser(account, account, user);
  EXPECT_EQ(account, String(u"CORP"));
  EXPECT_EQ(user, String(u"alice"));
}

// The file-system type and mount point of every mount of this process.
std::vector<std::pair<std::string, std::string>> Mounts() {
  std::vector<std::pair<std::string, std::string>> mounts;
  std::ifstream table("/proc/self/mountinfo");
  for (std::string line; std::getline(table, line);) {
    std::istringstream fields(line);
    std::string id, parent, device, root, point, field, type;
    fields >> id >> parent >> device >> root >> point;
    while (fields >> field && field != "-") {
    }
    if (fields >> type && point.find('\\') == std::string::npos) mounts.emplace_back(type, point);
  }
  return mounts;
}

std::string FsTypeOf(const std::string& mountPoint) {
  std::string type;
  for (const auto& [fs, point] : Mounts()) {
    if (point == mountPoint) type = fs;  // a later mount hides an earlier one
  }
  return type;
}

// Adds drives to the sandbox's drive map for one test.
class DriveMap {
 public:
  explicit DriveMap(const std::string& extra) : m_saved(std::getenv("OWUTILS_DRIVES")) {
    setenv("OWUTILS_DRIVES", (m_saved + ";" + extra).c_str(), 1);
  }
  ~DriveMap() { setenv("OWUTILS_DRIVES", m_saved.c_str(), 1); }

 private:
  std::string m_saved;
};

TEST(GetDriveDeviceType, UnmappedOrMissingDrivesAreUnknown) {
  DriveMap map("M=" + OwTest::SandboxDirectory() + "/no-such-folder");
  EXPECT_EQ(GetDriveDeviceType(u"Q:\\"), LmDriveUnknown);
  EXPECT_EQ(GetDriveDeviceType(u"M:\\"), LmDriveUnknown);
  EXPECT_EQ(GetDriveDeviceType(u""), LmDriveUnknown);
  EXPECT_EQ(GetDriveDeviceType(u"\\\\noserver\\share\\"), LmDriveUnknown);  // no UNC root configured
}

TEST(GetDriveDeviceType, RamDiskFromTmpfs) {
  std::string tmpfs;
  for (const auto& [fs, point] : Mounts()) {
    if (fs == "tmpfs" && FsTypeOf(point) == "tmpfs") tmpfs = point;
  }
  if (tmpfs.empty()) GTEST_SKIP() << "no tmpfs mount here";
  DriveMap map("R=" + tmpfs);
  EXPECT_EQ(GetDriveDeviceType(u"R:\\"), LmDriveRamDisk) << tmpfs;
  EXPECT_EQ(GetDriveDeviceType(u"r:"), LmDriveRamDisk) << tmpfs;  // only the letter counts
}

TEST(GetDriveDeviceType, DiskFileSystemsAreFixed) {
  std::string disk;
  for (const auto& [fs, point] : Mounts()) {
    if ((fs == "ext4" || fs == "xfs" || fs == "btrfs" || fs == "overlay") && FsTypeOf(point) == fs) disk = point;
  }
  if (disk.empty()) GTEST_SKIP() << "no disk-backed mount here";
  DriveMap map("F=" + disk);
  // A removable disk would be classified by its medium; the disks of a build machine are fixed.
  const LmDriveType type = GetDriveDeviceType(u"F:\\");
  EXPECT_TRUE(type == LmDriveFixed || type == LmDriveRemovable) << disk << " gave " << type;
}

TEST(GetDriveDeviceType, UncRootsAreRemote) {
  const std::string unc = OwTest::MakeTempDirectory("unc");
  std::filesystem::create_directories(unc + "/server/share");
  setenv("OWUTILS_UNC_ROOT", unc.c_str(), 1);
  EXPECT_EQ(GetDriveDeviceType(u"\\\\server\\share\\"), LmDriveRemote);
  unsetenv("OWUTILS_UNC_ROOT");
}

// Stand-ins for the system's IsWow64Process.
BOOL AnswerWow64(HANDLE, BOOL* isWow64) {
  *isWow64 = TRUE;
  return TRUE;
}
BOOL FailWow64(HANDLE, BOOL*) {
  Platform::SetLastError(ERROR_ACCESS_DENIED);
  return FALSE;
}

class IsWow64Test : public ::testing::Test {
 protected:
  void TearDown() override {
    Platform::ClearKernelFunctionOverrides();
    Platform::SetOutputHook({});
  }
};

TEST_F(IsWow64Test, AnswersOneOrZero) {
  Platform::SetKernelFunctionOverride("IsWow64Process", nullptr);
  EXPECT_EQ(IsWow64(), 0);
  Platform::SetKernelFunctionOverride("IsWow64Process", reinterpret_cast<void*>(&AnswerWow64));
  EXPECT_EQ(IsWow64(), 1);
}

TEST_F(IsWow64Test, FailureIsReportedAndAnswersZero) {
  std::u16string reported;
  Platform::SetOutputHook([&](const char*, const std::u16string& text) { reported += text; });
  Platform::SetKernelFunctionOverride("IsWow64Process", reinterpret_cast<void*>(&FailWow64));
  EXPECT_EQ(IsWow64(), 0);
  const std::string text = OwTest::Narrow(reported);
  EXPECT_NE(text.find("IsWow64"), std::string::npos) << text;
  EXPECT_NE(text.find("IsWow64Process"), std::string::npos) << text;
}

}  // namespace
