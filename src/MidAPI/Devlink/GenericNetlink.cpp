// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Devlink/GenericNetlink.h"

#include <linux/genetlink.h>
#include <linux/netlink.h>

#include <algorithm>
#include <functional>

namespace ma::devlink {
namespace {

constexpr std::size_t kAlignment = 4;
// The header's macro of this name sets the upper bits of an int.
constexpr std::uint16_t kTypeMask = 0x3fff;

constexpr std::size_t aligned(std::size_t length) {
    return (length + kAlignment - 1) / kAlignment * kAlignment;
}

template <class Record>
void append(Bytes& bytes, const Record& record) {
    const auto* const begin = reinterpret_cast<const std::uint8_t*>(&record);
    bytes.insert(bytes.end(), begin, begin + sizeof record);
}

/// Takes a record from the front; nothing when the bytes are too few.
template <class Record>
std::optional<Record> read(ByteView bytes) {
    if (bytes.size() < sizeof(Record)) return std::nullopt;
    Record record{};
    std::memcpy(&record, bytes.data(), sizeof record);
    return record;
}

/// What follows the first `length` bytes and their padding.
ByteView after(ByteView bytes, std::size_t length) {
    return bytes.subspan(std::min(aligned(length), bytes.size()));
}

}  // namespace

RequestWriter::RequestWriter(std::uint16_t family, std::uint8_t command, std::uint32_t sequence) {
    append(m_message, nlmsghdr{.nlmsg_len = 0,
                               .nlmsg_type = family,
                               .nlmsg_flags = NLM_F_REQUEST | NLM_F_ACK,
                               .nlmsg_seq = sequence,
                               .nlmsg_pid = 0});
    append(m_message, genlmsghdr{.cmd = command, .version = 1, .reserved = 0});
}

void RequestWriter::putText(std::uint16_t type, std::string_view text) {
    Bytes payload(text.begin(), text.end());
    payload.push_back(0);
    put(type, payload);
}

void RequestWriter::putByte(std::uint16_t type, std::uint8_t value) {
    put(type, {&value, 1});
}

void RequestWriter::put(std::uint16_t type, ByteView payload) {
    append(m_message,
           nlattr{.nla_len = static_cast<std::uint16_t>(sizeof(nlattr) + payload.size()), .nla_type = type});
    m_message.insert(m_message.end(), payload.begin(), payload.end());
    m_message.resize(aligned(m_message.size()));
}

Bytes RequestWriter::take() {
    const std::uint32_t length = position();
    std::memcpy(m_message.data(), &length, sizeof length);
    return std::move(m_message);
}

std::string Attribute::text() const {
    std::string text(payload.begin(), std::find(payload.begin(), payload.end(), 0));
    const auto isPrintable = [](char character) { return character >= ' ' && character <= '~'; };
    std::replace_if(text.begin(), text.end(), std::not_fn(isPrintable), '?');
    return text;
}

std::vector<Attribute> readAttributes(ByteView bytes) {
    std::vector<Attribute> attributes;
    while (const auto header = read<nlattr>(bytes)) {
        if (header->nla_len < sizeof(nlattr) || header->nla_len > bytes.size()) break;
        attributes.push_back({static_cast<std::uint16_t>(header->nla_type & kTypeMask),
                              bytes.subspan(sizeof(nlattr), header->nla_len - sizeof(nlattr))});
        bytes = after(bytes, header->nla_len);
    }
    return attributes;
}

std::uint8_t Message::command() const {
    const auto header = read<genlmsghdr>(payload);
    return header ? header->cmd : std::uint8_t{0};
}

ByteView Message::attributes() const {
    return after(payload, sizeof(genlmsghdr));
}

std::vector<Message> readMessages(ByteView datagram) {
    std::vector<Message> messages;
    while (const auto header = read<nlmsghdr>(datagram)) {
        if (header->nlmsg_len < sizeof(nlmsghdr) || header->nlmsg_len > datagram.size()) break;
        messages.push_back({header->nlmsg_type, header->nlmsg_flags, header->nlmsg_seq,
                            datagram.subspan(sizeof(nlmsghdr), header->nlmsg_len - sizeof(nlmsghdr))});
        datagram = after(datagram, header->nlmsg_len);
    }
    return messages;
}

std::optional<Acknowledgement> readAcknowledgement(const Message& message) {
    const auto header = read<nlmsgerr>(message.payload);
    // The kernel counts downwards; the least int has no positive value.
    if (!header || header->error > 0 || header->error == INT32_MIN) return std::nullopt;
    Acknowledgement result{.error = -header->error};
    if ((message.flags & NLM_F_ACK_TLVS) == 0) return result;
    // A kernel that does not cap them repeats the whole request first.
    const bool isCapped = (message.flags & NLM_F_CAPPED) != 0 || header->error == 0;
    const std::size_t echoed = isCapped ? sizeof(nlmsghdr) : header->msg.nlmsg_len;
    if (echoed > message.payload.size()) return result;
    for (const Attribute& attribute : readAttributes(after(message.payload, sizeof(int) + echoed))) {
        if (attribute.type == NLMSGERR_ATTR_MSG) result.text = attribute.text();
        if (attribute.type == NLMSGERR_ATTR_OFFS) result.offset = attribute.number<std::uint32_t>();
        if (attribute.type == NLMSGERR_ATTR_MISS_TYPE) result.missingType = attribute.number<std::uint32_t>();
    }
    return result;
}

}  // namespace ma::devlink
