// POSIX backend: network reachability, from the interface list and the kernel's routing tables,
// and connection checks through libcurl.
#include "platform/Network.h"

#include <arpa/inet.h>
#include <curl/curl.h>
#include <ifaddrs.h>
#include <net/if.h>
#include <netinet/in.h>

#include <fstream>
#include <memory>
#include <mutex>
#include <set>
#include <sstream>
#include <string>

#include "platform/Errors.h"
#include "platform/Text.h"

namespace Platform {
namespace {

constexpr unsigned kRouteUp = 0x0001;      // RTF_UP
constexpr unsigned kRouteReject = 0x0200;  // RTF_REJECT

bool IsRoutable(const sockaddr* address) {
  if (address == nullptr) return false;
  if (address->sa_family == AF_INET) {
    const uint32_t a = ntohl(reinterpret_cast<const sockaddr_in*>(address)->sin_addr.s_addr);
    if (a == 0) return false;                          // unspecified
    if ((a >> 24) == 127) return false;                // loopback
    if ((a >> 16) == ((169u << 8) | 254u)) return false;  // link-local
    return true;
  }
  if (address->sa_family == AF_INET6) {
    const in6_addr& a = reinterpret_cast<const sockaddr_in6*>(address)->sin6_addr;
    if (IN6_IS_ADDR_UNSPECIFIED(&a) || IN6_IS_ADDR_LOOPBACK(&a) || IN6_IS_ADDR_LINKLOCAL(&a) ||
        IN6_IS_ADDR_MULTICAST(&a)) {
      return false;
    }
    return true;
  }
  return false;
}

// Names of the interfaces that are up, not loopback, and hold a routable address of `family`.
std::set<std::string> InterfacesWithRoutableAddress(int family) {
  std::set<std::string> names;
  ifaddrs* list = nullptr;
  if (getifaddrs(&list) != 0) return names;
  for (const ifaddrs* i = list; i != nullptr; i = i->ifa_next) {
    if (i->ifa_addr == nullptr || i->ifa_addr->sa_family != family) continue;
    if ((i->ifa_flags & IFF_UP) == 0 || (i->ifa_flags & IFF_LOOPBACK) != 0) continue;
    if (IsRoutable(i->ifa_addr)) names.insert(i->ifa_name);
  }
  freeifaddrs(list);
  return names;
}

// Interfaces carrying an IPv4 default route (/proc/net/route: Iface Destination Gateway Flags
// RefCnt Use Metric Mask ...).
std::set<std::string> Ipv4DefaultRouteInterfaces() {
  std::set<std::string> names;
  std::ifstream table("/proc/net/route");
  std::string line;
  std::getline(table, line);  // header
  while (std::getline(table, line)) {
    std::istringstream fields(line);
    std::string iface, destination, gateway, mask;
    unsigned flags = 0, refs = 0, use = 0, metric = 0;
    if (!(fields >> iface >> destination >> gateway >> std::hex >> flags >> std::dec >> refs >> use >> metric >> mask)) {
      continue;
    }
    if (destination == "00000000" && mask == "00000000" && (flags & kRouteUp) != 0 && (flags & kRouteReject) == 0) {
      names.insert(iface);
    }
  }
  return names;
}

// Interfaces carrying an IPv6 default route (/proc/net/ipv6_route: destination, prefix length,
// source, source prefix length, next hop, metric, reference count, use, flags, interface).
std::set<std::string> Ipv6DefaultRouteInterfaces() {
  std::set<std::string> names;
  std::ifstream table("/proc/net/ipv6_route");
  std::string line;
  while (std::getline(table, line)) {
    std::istringstream fields(line);
    std::string destination, prefix, source, sourcePrefix, nextHop, metric, refs, use, iface;
    unsigned flags = 0;
    if (!(fields >> destination >> prefix >> source >> sourcePrefix >> nextHop >> metric >> refs >> use >> std::hex >>
          flags >> iface)) {
      continue;
    }
    if (destination == std::string(32, '0') && prefix == "00" && (flags & kRouteUp) != 0 &&
        (flags & kRouteReject) == 0 && iface != "lo") {
      names.insert(iface);
    }
  }
  return names;
}

bool HasConnectedFamily(int family) {
  const std::set<std::string> routed = family == AF_INET ? Ipv4DefaultRouteInterfaces() : Ipv6DefaultRouteInterfaces();
  if (routed.empty()) return false;
  for (const std::string& name : InterfacesWithRoutableAddress(family)) {
    if (routed.count(name) != 0) return true;
  }
  return false;
}

void InitCurlOnce() {
  static std::once_flag once;
  std::call_once(once, [] { curl_global_init(CURL_GLOBAL_DEFAULT); });
}

struct UrlDeleter {
  void operator()(CURLU* url) const { curl_url_cleanup(url); }
};
struct EasyDeleter {
  void operator()(CURL* easy) const { curl_easy_cleanup(easy); }
};
struct CurlText {
  char* text = nullptr;
  ~CurlText() { curl_free(text); }
};

// "host:port" of `url`, the scheme's default port when none is given; false when the address
// cannot be read.
bool HostAndPort(const std::string& url, std::string& host, std::string& port) {
  std::unique_ptr<CURLU, UrlDeleter> parsed(curl_url());
  if (!parsed || curl_url_set(parsed.get(), CURLUPART_URL, url.c_str(), 0) != CURLUE_OK) return false;
  CurlText h, p;
  if (curl_url_get(parsed.get(), CURLUPART_HOST, &h.text, 0) != CURLUE_OK || h.text == nullptr || *h.text == 0) {
    return false;
  }
  if (curl_url_get(parsed.get(), CURLUPART_PORT, &p.text, CURLU_DEFAULT_PORT) != CURLUE_OK || p.text == nullptr) {
    return false;
  }
  host = h.text;
  port = p.text;
  return true;
}

}  // namespace

BOOL InternetGetConnectedState(DWORD* flags, DWORD) noexcept {
  bool connected = false;
  try {
    connected = HasConnectedFamily(AF_INET) || HasConnectedFamily(AF_INET6);
  } catch (...) {
    connected = false;
  }
  if (flags != nullptr) *flags = connected ? kInternetConnectionLan : kInternetConnectionOffline;
  SetLastError(ERROR_SUCCESS);
  return connected ? TRUE : FALSE;
}

BOOL InternetCheckConnectionW(const char16_t* url, DWORD flags, DWORD) noexcept {
  if (url == nullptr || (flags & kFlagIccForceConnection) == 0) {
    SetLastError(ERROR_INVALID_PARAMETER);
    return FALSE;
  }
  try {
    const int size = WideCharToMultiByte(kCodePageUtf8, kWcErrInvalidChars, url, -1, nullptr, 0, nullptr, nullptr);
    if (size <= 0) {
      SetLastError(ERROR_INTERNET_INVALID_URL);
      return FALSE;
    }
    std::string utf8(static_cast<size_t>(size), '\0');
    WideCharToMultiByte(kCodePageUtf8, kWcErrInvalidChars, url, -1, utf8.data(), size, nullptr, nullptr);
    utf8.pop_back();

    InitCurlOnce();
    std::string host, port;
    if (!HostAndPort(utf8, host, port)) {
      SetLastError(ERROR_INTERNET_INVALID_URL);
      return FALSE;
    }
    // Whatever the scheme, only the TCP connection is made: an http address with connect-only
    // set stops there (an https one would go on to the TLS handshake).
    const std::string target = "http://" + host + ":" + port + "/";
    std::unique_ptr<CURL, EasyDeleter> easy(curl_easy_init());
    if (!easy) {
      SetLastError(ERROR_NOT_ENOUGH_MEMORY);
      return FALSE;
    }
    curl_easy_setopt(easy.get(), CURLOPT_URL, target.c_str());
    curl_easy_setopt(easy.get(), CURLOPT_CONNECT_ONLY, 1L);
    curl_easy_setopt(easy.get(), CURLOPT_CONNECTTIMEOUT_MS, kConnectTimeoutMs);
    curl_easy_setopt(easy.get(), CURLOPT_TIMEOUT_MS, kConnectTimeoutMs);
    curl_easy_setopt(easy.get(), CURLOPT_NOSIGNAL, 1L);
    curl_easy_setopt(easy.get(), CURLOPT_PROXY, "");
    curl_easy_setopt(easy.get(), CURLOPT_NOPROXY, "*");
    const CURLcode result = curl_easy_perform(easy.get());
    switch (result) {
      case CURLE_OK:
        SetLastError(ERROR_SUCCESS);
        return TRUE;
      case CURLE_URL_MALFORMAT:
        SetLastError(ERROR_INTERNET_INVALID_URL);
        return FALSE;
      case CURLE_COULDNT_RESOLVE_HOST:
        SetLastError(ERROR_INTERNET_NAME_NOT_RESOLVED);
        return FALSE;
      case CURLE_OPERATION_TIMEDOUT:
        SetLastError(ERROR_INTERNET_TIMEOUT);
        return FALSE;
      default:
        SetLastError(ERROR_INTERNET_CANNOT_CONNECT);
        return FALSE;
    }
  } catch (...) {
    SetLastError(ERROR_NOT_ENOUGH_MEMORY);
    return FALSE;
  }
}

}  // namespace Platform
