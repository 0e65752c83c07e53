// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <sys/socket.h>

#include <string>

namespace host {

/// The address of clients of the Unix socket. They are this machine's root.
inline constexpr const char* kLocalAddress = "local";

/// The address as text: that of a machine alone, without the port. An IPv4 client of an IPv6 socket has its
/// IPv4 address; one of a Unix socket kLocalAddress.
std::string addressText(const sockaddr& address);

/// What is one client as far as connections are counted: an IPv4 address, or the network (/64) of an IPv6
/// one, since a single machine has all its 2^64 addresses.
std::string networkOf(const std::string& address);

bool isLoopback(const std::string& address);

/// What is one client as far as wrong passwords are counted: as networkOf(), but all of loopback is one. Any
/// user of this machine has the 2^24 addresses of 127.0.0.0/8 to guess from.
std::string placeOf(const std::string& address);

}  // namespace host
