// SPDX-License-Identifier: Apache-2.0
#include <algorithm>

#include "Fuzz/Fuzz.h"
#include "MidAPI/Devlink/DevlinkMessages.h"
#include "MidAPI/Devlink/GenericNetlink.h"

namespace {

bool isPrintable(const std::string& text) {
    return std::ranges::all_of(text, [](char character) { return character >= ' ' && character <= '~'; });
}

/// What is within is whole, and no longer than what it is within.
void requireWithin(ma::devlink::ByteView inner, ma::devlink::ByteView outer) {
    require(inner.empty() ||
            (inner.data() >= outer.data() && inner.data() + inner.size() <= outer.data() + outer.size()));
}

}  // namespace

void fuzz(const std::string& bytes) {
    const ma::devlink::Bytes datagram(bytes.begin(), bytes.end());  // a block of its own
    for (const ma::devlink::Message& message : ma::devlink::readMessages(datagram)) {
        requireWithin(message.payload, datagram);
        requireWithin(message.attributes(), message.payload);
        for (const ma::devlink::Attribute& attribute : ma::devlink::readAttributes(message.attributes()))
            requireWithin(attribute.payload, message.payload);
        if (const auto result = ma::devlink::readAcknowledgement(message))
            require(result->error >= 0 && isPrintable(result->text));
        ma::devlink::readFamily(message.attributes());
        const ma::devlink::Notification notification = ma::devlink::readNotification(message);
        require(isPrintable(notification.device + notification.status.text));
        for (const ma::NamedVersion& version : ma::devlink::readDeviceInfo(message.attributes()).versions)
            require(!version.name.empty() && isPrintable(version.name + version.running + version.stored));
    }
}
