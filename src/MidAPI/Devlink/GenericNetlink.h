// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <cstring>
#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "Utils/Export.h"

/// Messages of generic netlink, as bytes: made to be sent, and read where they were received. What is read
/// points into the datagram, which must outlive it. Nothing here reads outside a datagram, whatever the
/// bytes: what does not fit ends the reading. Free of state; any thread may call.
namespace ma::devlink {

using Bytes = std::vector<std::uint8_t>;
using ByteView = std::span<const std::uint8_t>;

/// A request in the making.
class QUENX_EXPORT RequestWriter {
  public:
    /// @param family   message type: the number of the family
    /// @param command  of the family
    RequestWriter(std::uint16_t family, std::uint8_t command, std::uint32_t sequence);

    void putText(std::uint16_t type, std::string_view text);
    void putByte(std::uint16_t type, std::uint8_t value);
    /// Where in the message the next attribute will begin: what an Acknowledgement's offset is compared with.
    std::uint32_t position() const { return static_cast<std::uint32_t>(m_message.size()); }

    /// The message, with its length filled in.
    Bytes take();

  private:
    void put(std::uint16_t type, ByteView payload);

    Bytes m_message;
};

/// One attribute of a message.
struct Attribute {
    std::uint16_t type = 0;  ///< without the marks for nesting and byte order
    ByteView payload;

    /// The text as far as its first NUL. Drivers write what they like, and it goes to terminals and clients:
    /// what is not printable ASCII becomes a question mark.
    QUENX_EXPORT std::string text() const;

    /// The number, or nothing for a payload that is shorter; the rest of a longer one is ignored.
    template <class Number>
    std::optional<Number> number() const {
        Number value{};
        if (payload.size() < sizeof value) return std::nullopt;
        std::memcpy(&value, payload.data(), sizeof value);  // nothing aligns it
        return value;
    }
};

/// The attributes of a message, or of a nested attribute, in their order.
QUENX_EXPORT std::vector<Attribute> readAttributes(ByteView bytes);

/// One received message.
struct Message {
    std::uint16_t type = 0;
    std::uint16_t flags = 0;
    std::uint32_t sequence = 0;
    ByteView payload;

    /// Of a message of a family: its command, 0 where there is none, and what follows.
    QUENX_EXPORT std::uint8_t command() const;
    QUENX_EXPORT ByteView attributes() const;
};

/// The messages of a datagram.
QUENX_EXPORT std::vector<Message> readMessages(ByteView datagram);

/// How the kernel ended a request.
struct Acknowledgement {
    int error = 0;                             ///< an errno value; 0 is success
    std::string text = {};                     ///< the kernel's or the driver's words; often none
    std::optional<std::uint32_t> offset = {};  ///< of the attribute complained of, from the request's start
    std::optional<std::uint32_t> missingType = {};  ///< of the attribute that the request lacks
};

/// Reads a message of type NLMSG_ERROR; nothing when it is too short to be one.
QUENX_EXPORT std::optional<Acknowledgement> readAcknowledgement(const Message& message);

}  // namespace ma::devlink
