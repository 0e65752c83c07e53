// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <gtest/gtest.h>
#include <sys/socket.h>
#include <sys/un.h>

#include <array>
#include <cstddef>
#include <string>

#include "Utils/Os/Linux/linux.h"

namespace test {

/// A Unix socket bound to a path, or with an @ in front to a name that is in no folder: that of another
/// program, or of the service manager.
class UnixSocket : public os::Descriptor {
  public:
    /// @param type  SOCK_STREAM or SOCK_DGRAM
    UnixSocket(int type, const std::string& path) : Descriptor(::socket(AF_UNIX, type | SOCK_CLOEXEC, 0)) {
        sockaddr_un address{};
        address.sun_family = AF_UNIX;
        const std::size_t length = path.copy(address.sun_path, sizeof address.sun_path - 1);
        if (path.front() == '@') address.sun_path[0] = '\0';
        EXPECT_EQ(::bind(number(), reinterpret_cast<const sockaddr*>(&address),
                         static_cast<socklen_t>(offsetof(sockaddr_un, sun_path) + length)),
                  0);
    }

    /// What has been sent to it so far, a line for each message.
    std::string received() const {
        std::string text;
        std::array<char, 512> bytes{};
        for (ssize_t length = 0; (length = ::recv(number(), bytes.data(), bytes.size(), MSG_DONTWAIT)) > 0;)
            text.append(bytes.data(), static_cast<std::size_t>(length)).append("\n");
        return text;
    }
};

}  // namespace test
