// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <chrono>
#include <cstdint>
#include <functional>
#include <optional>
#include <string>
#include <vector>

#include "MidAPI/Devlink/DevlinkMessages.h"
#include "MidAPI/Devlink/GenericNetlink.h"
#include "MidAPI/Devlink/Machine.h"
#include "Utils/Export.h"

namespace ma::devlink {

/// What came of a request.
struct Answer {
    /// No acknowledgement came, so that nobody knows what the kernel did; the rest then means nothing.
    bool isLost = false;
    Acknowledgement result = {};
    Bytes attributes = {};  ///< of the kernel's reply, if the command has one
};

/// A socket for requests to devlink. One thread at a time.
class QUENX_EXPORT DevlinkConnection {
  public:
    /// Opens the socket and asks the kernel for devlink. @throws std::system_error
    explicit DevlinkConnection(Machine& machine);

    /// Its number is 0 where the kernel has no devlink.
    const Family& family() const { return m_family; }

    /// Puts what a request has beside the address of its function.
    using Writer = std::function<void(RequestWriter&)>;

    /// One request about a PCI function. Waits for as long as somebody else keeps the device busy: a flash
    /// makes all other requests wait until it is over. @throws std::system_error when it cannot be sent, and
    /// never once it was: then an answer that cannot be had is lost
    Answer ask(std::uint8_t command, const std::string& address, const Writer& write = {});

  private:
    Answer exchange(std::uint16_t family, RequestWriter request);
    bool read(ByteView datagram, std::uint16_t family, Answer& answer) const;

    Machine& m_machine;
    const os::Descriptor m_socket;
    std::uint32_t m_sequence = 0;
    Family m_family;
};

/// A socket for what devlink tells everybody about the devices of this network namespace. One thread at a
/// time.
class QUENX_EXPORT Notifications {
  public:
    /// From here on none is missed. @throws std::system_error
    Notifications(Machine& machine, const Family& family);

    struct Batch {
        std::vector<Notification> messages;
        bool lostSome = false;  ///< the kernel had more than this socket could take
    };
    /// The next ones, or nothing when none comes in time. @throws std::system_error
    std::optional<Batch> next(std::chrono::milliseconds patience);

  private:
    Machine& m_machine;
    const std::uint16_t m_family;
    const os::Descriptor m_socket;
    Bytes m_buffer;
};

}  // namespace ma::devlink
