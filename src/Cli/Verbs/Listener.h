// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <chrono>
#include <cstdint>
#include <list>
#include <optional>
#include <string>

#include "Utils/Os/Linux/linux.h"

namespace cli {

/// A port on which a server delivers indications, one on each connection. Connections on which nothing comes
/// hold up nobody. Used from one thread.
class Listener {
  public:
    /// @param address  of this machine
    /// @param port     0 takes a free one
    /// @param path     what is asked for elsewhere is refused
    /// Throws CommandError where it cannot be listened on.
    Listener(const std::string& address, std::uint16_t port, std::string path);
    Listener(const Listener&) = delete;
    Listener& operator=(const Listener&) = delete;

    /// What a server has to be told.
    std::string url() const;

    /// A message that has come, and the connection on which it waits for its answer.
    struct Delivered {
        os::Descriptor connection;
        std::string body;
    };
    /// The next message; nothing when none has come in that time. What is no message is answered here.
    std::optional<Delivered> next(std::chrono::milliseconds patience);
    static void answer(const Delivered& delivered, const std::string& body);

  private:
    /// A connection on which a message is coming.
    struct Incoming {
        os::Descriptor connection;
        std::chrono::steady_clock::time_point deadline;
        std::string bytes = {};
        bool isOver = false;
    };
    void accept();
    bool readMore(Incoming& incoming) const;
    std::optional<Delivered> messageIn(Incoming& incoming) const;

    os::Descriptor m_socket;
    std::string m_address;
    std::string m_path;
    std::uint16_t m_port = 0;
    std::list<Incoming> m_incoming;  ///< the oldest first
};

}  // namespace cli
