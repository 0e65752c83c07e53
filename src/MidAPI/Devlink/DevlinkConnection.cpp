// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Devlink/DevlinkConnection.h"

#include <linux/devlink.h>
#include <linux/genetlink.h>
#include <linux/netlink.h>

#include <algorithm>
#include <cerrno>
#include <system_error>

#include "Utils/Log.h"

namespace ma::devlink {
namespace {

// The kernel's datagrams have 32 KiB at most.
constexpr std::size_t kLargestDatagram = std::size_t{64} * 1024;

/// One datagram, in the buffer; nothing when none comes in time. An empty one where the kernel says that some
/// were lost.
std::optional<ByteView> receive(Machine& machine, const os::Descriptor& socket, Bytes& buffer,
                                std::chrono::milliseconds patience) try {
    const auto length = machine.receive(socket, buffer, patience);
    if (!length || *length == 0) return std::nullopt;
    return ByteView(buffer).first(*length);
} catch (const std::system_error& error) {
    if (error.code().value() != ENOBUFS) throw;
    return ByteView();
}

}  // namespace

DevlinkConnection::DevlinkConnection(Machine& machine) : m_machine(machine), m_socket(machine.openNetlink()) {
    RequestWriter request(GENL_ID_CTRL, CTRL_CMD_GETFAMILY, ++m_sequence);
    request.putText(CTRL_ATTR_FAMILY_NAME, DEVLINK_GENL_NAME);
    const Answer answer = exchange(GENL_ID_CTRL, std::move(request));
    if (answer.isLost)
        throw std::system_error(ETIMEDOUT, std::generic_category(),
                                "the kernel does not say whether it has devlink");
    if (answer.result.error == ENOENT) return;
    if (answer.result.error != 0)
        throw std::system_error(answer.result.error, std::generic_category(),
                                "cannot ask the kernel for devlink");
    m_family = readFamily(answer.attributes);
}

Answer DevlinkConnection::ask(std::uint8_t command, const std::string& address, const Writer& write) {
    RequestWriter request(m_family.number, command, ++m_sequence);
    request.putText(DEVLINK_ATTR_BUS_NAME, kPciBus);
    request.putText(DEVLINK_ATTR_DEV_NAME, address);
    if (write) write(request);
    return exchange(m_family.number, std::move(request));
}

Answer DevlinkConnection::exchange(std::uint16_t family, RequestWriter request) {
    using Clock = std::chrono::steady_clock;
    const Bytes message = request.take();
    // Beforehand: when the kernel has done what it was asked for, that must not count as a failure.
    Bytes buffer(kLargestDatagram);
    m_machine.send(m_socket, message);
    // Not before: what was asked for is done within the sending, and may take minutes.
    const auto end = Clock::now() + m_machine.patience();
    const auto rest = [end] {
        return std::max(std::chrono::floor<std::chrono::milliseconds>(end - Clock::now()),
                        std::chrono::milliseconds(0));
    };
    try {
        Answer answer;
        // What has come by then is read, too: an answer is of two datagrams.
        while (const auto datagram = receive(m_machine, m_socket, buffer, rest()))
            if (read(*datagram, family, answer)) return answer;
    } catch (const std::exception& error) {
        // An answer that cannot be read is as good as none: the request may have been done.
        QUENX_ERROR("what the kernel answers to a request cannot be read: %s", error.what());
    }
    return {.isLost = true};
}

/// True when the answer is complete. What belongs to an earlier request is left alone.
bool DevlinkConnection::read(ByteView datagram, std::uint16_t family, Answer& answer) const {
    for (const Message& message : readMessages(datagram)) {
        if (message.sequence != m_sequence) continue;
        if (message.type == family)
            answer.attributes = Bytes(message.attributes().begin(), message.attributes().end());
        if (message.type != NLMSG_ERROR) continue;
        auto result = readAcknowledgement(message);
        if (!result) continue;
        answer.result = *std::move(result);
        return true;
    }
    return false;
}

Notifications::Notifications(Machine& machine, const Family& family)
    : m_machine(machine),
      m_family(family.number),
      m_socket(machine.openNetlink()),
      m_buffer(kLargestDatagram) {
    machine.joinGroup(m_socket, family.notifications);
}

std::optional<Notifications::Batch> Notifications::next(std::chrono::milliseconds patience) {
    const auto datagram = receive(m_machine, m_socket, m_buffer, patience);
    if (!datagram) return std::nullopt;
    Batch batch{.messages = {}, .lostSome = datagram->empty()};
    for (const Message& message : readMessages(*datagram))
        if (message.type == m_family) batch.messages.push_back(readNotification(message));
    return batch;
}

}  // namespace ma::devlink
