// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Devlink/DeviceRequests.h"

#include <linux/devlink.h>

#include <cerrno>
#include <system_error>

namespace ma::devlink {

FlashVerdict askFlashable(DevlinkConnection& connection, const std::string& address) {
    const Answer answer = connection.ask(DEVLINK_CMD_FLASH_UPDATE, address);
    const auto& [error, text, offset, missingType] = answer.result;
    if (answer.isLost) return {Flashable::Unknown, describe(answer)};
    // The kernel misses the file only after it has found device, permission and the driver's operation.
    if (error == EINVAL && missingType == DEVLINK_ATTR_FLASH_UPDATE_FILE_NAME) return {Flashable::Yes, ""};
    if (error == EOPNOTSUPP)
        return {Flashable::NotOffered, "its driver does not offer updates through devlink"};
    if (error == EPERM)
        return {
            Flashable::NotPermitted,
            "this takes the capability CAP_NET_ADMIN in the machine's own user namespace; run it as root"};
    if (error == ENODEV)
        return {Flashable::Absent,
                "devlink does not know it; its driver has no devlink, or it is in another network namespace"};
    return {Flashable::Unknown, describe(answer)};
}

std::string refusalOfComponent(DevlinkConnection& connection, const std::string& address,
                               const std::string& component) {
    std::uint32_t fileName = 0;
    const Answer answer = connection.ask(DEVLINK_CMD_FLASH_UPDATE, address, [&](RequestWriter& request) {
        request.putText(DEVLINK_ATTR_FLASH_UPDATE_COMPONENT, component);
        fileName = request.position();
        // An empty name is never looked for, and it is looked at last.
        request.putText(DEVLINK_ATTR_FLASH_UPDATE_FILE_NAME, "");
    });
    const bool isAccepted = !answer.isLost && answer.result.error != 0 && answer.result.offset == fileName;
    return isAccepted ? "" : describe(answer);
}

Answer askInfo(DevlinkConnection& connection, const std::string& address) {
    return connection.ask(DEVLINK_CMD_INFO_GET, address);
}

Answer flash(DevlinkConnection& connection, const std::string& address, const std::string& file,
             const std::string& component) {
    return connection.ask(DEVLINK_CMD_FLASH_UPDATE, address, [&](RequestWriter& request) {
        request.putText(DEVLINK_ATTR_FLASH_UPDATE_FILE_NAME, file);
        if (!component.empty()) request.putText(DEVLINK_ATTR_FLASH_UPDATE_COMPONENT, component);
    });
}

std::string describe(const Answer& answer) {
    if (answer.isLost) return "the kernel's answer did not come";
    const std::string reason = std::generic_category().message(answer.result.error);
    return answer.result.text.empty() ? reason : answer.result.text + " (" + reason + ")";
}

}  // namespace ma::devlink
