#include "owutils/LmProbes.h"

#include <gtest/gtest.h>

// The connection tests need a listening socket of their own; only 127.0.0.1 is ever reached.
#include <arpa/inet.h>
#include <netinet/in.h>
#include <sys/socket.h>
#include <unistd.h>

#include <string>

#include "owutils/Exceptions.h"
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

TEST(IsQRWApp, OnlyKindTwo) {
  EXPECT_TRUE(IsQRWApp(2));
  EXPECT_FALSE(IsQRWApp(0));
  EXPECT_FALSE(IsQRWApp(1));
  EXPECT_FALSE(IsQRWApp(3));
  EXPECT_FALSE(IsQRWApp(-2));
}

}  // namespace
