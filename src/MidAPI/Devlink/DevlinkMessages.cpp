// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Devlink/DevlinkMessages.h"

#include <linux/devlink.h>
#include <linux/genetlink.h>

#include <algorithm>

namespace ma::devlink {
namespace {

/// The number of the wanted one of the family's multicast groups.
std::uint32_t findGroup(ByteView groups) {
    for (const Attribute& group : readAttributes(groups)) {
        std::string name;
        std::uint32_t number = 0;
        for (const Attribute& attribute : readAttributes(group.payload)) {
            if (attribute.type == CTRL_ATTR_MCAST_GRP_NAME) name = attribute.text();
            if (attribute.type == CTRL_ATTR_MCAST_GRP_ID)
                number = attribute.number<std::uint32_t>().value_or(0);
        }
        if (name == DEVLINK_GENL_MCGRP_CONFIG_NAME) return number;
    }
    return 0;
}

/// A driver tells a version's kinds in attributes of their own, which come together by their name.
NamedVersion& findVersion(std::vector<NamedVersion>& versions, const std::string& name) {
    const auto found = std::ranges::find(versions, name, &NamedVersion::name);
    if (found != versions.end()) return *found;
    versions.emplace_back().name = name;
    return versions.back();
}

void readVersion(std::vector<NamedVersion>& versions, ByteView nested, std::string NamedVersion::*kind) {
    std::string name;
    std::string value;
    for (const Attribute& attribute : readAttributes(nested)) {
        if (attribute.type == DEVLINK_ATTR_INFO_VERSION_NAME) name = attribute.text();
        if (attribute.type == DEVLINK_ATTR_INFO_VERSION_VALUE) value = attribute.text();
    }
    if (!name.empty()) findVersion(versions, name).*kind = std::move(value);
}

}  // namespace

Family readFamily(ByteView attributes) {
    Family family;
    for (const Attribute& attribute : readAttributes(attributes)) {
        if (attribute.type == CTRL_ATTR_FAMILY_ID)
            family.number = attribute.number<std::uint16_t>().value_or(0);
        if (attribute.type == CTRL_ATTR_MCAST_GROUPS) family.notifications = findGroup(attribute.payload);
    }
    return family;
}

DeviceInfo readDeviceInfo(ByteView attributes) {
    DeviceInfo info;
    for (const Attribute& attribute : readAttributes(attributes)) {
        switch (attribute.type) {
            case DEVLINK_ATTR_INFO_SERIAL_NUMBER:
                info.serialNumber = attribute.text();
                break;
            case DEVLINK_ATTR_INFO_BOARD_SERIAL_NUMBER:
                info.boardSerialNumber = attribute.text();
                break;
            case DEVLINK_ATTR_INFO_VERSION_FIXED:
                readVersion(info.versions, attribute.payload, &NamedVersion::fixed);
                break;
            case DEVLINK_ATTR_INFO_VERSION_RUNNING:
                readVersion(info.versions, attribute.payload, &NamedVersion::running);
                break;
            case DEVLINK_ATTR_INFO_VERSION_STORED:
                readVersion(info.versions, attribute.payload, &NamedVersion::stored);
                break;
            default:
                break;
        }
    }
    return info;
}

Notification readNotification(const Message& message) {
    Notification notification{.command = message.command()};
    std::string bus;
    std::string device;
    for (const Attribute& attribute : readAttributes(message.attributes())) {
        if (attribute.type == DEVLINK_ATTR_BUS_NAME) bus = attribute.text();
        if (attribute.type == DEVLINK_ATTR_DEV_NAME) device = attribute.text();
        FlashStatus& status = notification.status;
        if (attribute.type == DEVLINK_ATTR_FLASH_UPDATE_STATUS_MSG) status.text = attribute.text();
        const std::uint64_t number = attribute.number<std::uint64_t>().value_or(0);
        if (attribute.type == DEVLINK_ATTR_FLASH_UPDATE_STATUS_DONE) status.done = number;
        if (attribute.type == DEVLINK_ATTR_FLASH_UPDATE_STATUS_TOTAL) status.total = number;
    }
    if (bus == kPciBus) notification.device = std::move(device);
    return notification;
}

}  // namespace ma::devlink
