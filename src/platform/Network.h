// Platform service: network reachability.
//
// The two wininet queries the environment probes rest on, reproduced over the platform's own
// network facilities.
#pragma once

#include "owutils/WinTypes.h"

namespace Platform {

// Connection kinds written by InternetGetConnectedState.
constexpr DWORD kInternetConnectionLan = 0x02;
constexpr DWORD kInternetConnectionOffline = 0x20;

// Flag of InternetCheckConnectionW: make a real connection instead of consulting a cache.
constexpr DWORD kFlagIccForceConnection = 0x01;

// How long InternetCheckConnectionW waits for a connection to be made, in milliseconds.
constexpr long kConnectTimeoutMs = 5000;

// InternetGetConnectedState: TRUE when the system is connected, with *flags set to
// INTERNET_CONNECTION_LAN; FALSE with *flags INTERNET_CONNECTION_OFFLINE otherwise. Connected
// means: a network interface that is up and not loopback holds a routable address (not loopback,
// link-local or unspecified) and carries a default route. `flags` may be null.
BOOL InternetGetConnectedState(DWORD* flags, DWORD reserved) noexcept;

// InternetCheckConnectionW with FLAG_ICC_FORCE_CONNECTION: makes a TCP connection to the host and
// port of `url` (the scheme's default port when none is given) and closes it again at once,
// waiting at most kConnectTimeoutMs. TRUE when the connection was made. Fails with
// ERROR_INVALID_PARAMETER for a null url or without kFlagIccForceConnection,
// ERROR_INTERNET_INVALID_URL for an address that cannot be read (no scheme, host or port),
// ERROR_INTERNET_NAME_NOT_RESOLVED, ERROR_INTERNET_TIMEOUT or ERROR_INTERNET_CANNOT_CONNECT.
// Proxies are not used: the question is whether the host itself can be reached.
BOOL InternetCheckConnectionW(const char16_t* url, DWORD flags, DWORD reserved) noexcept;

}  // namespace Platform
