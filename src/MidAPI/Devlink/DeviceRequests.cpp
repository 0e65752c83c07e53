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
    if (error == EPERM) return {Flashable::NotPermitted, kTakesPrivilege};
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
    const bool isAccepted = !answer.isLost && answer.result.offset == fileName;
    return isAccepted ? "" : describe(answer);
}

ToldInfo askInfo(DevlinkConnection& connection, const std::string& address) {
    const Answer answer = connection.ask(DEVLINK_CMD_INFO_GET, address);
    if (!answer.isLost && answer.result.error == 0) return {.info = readDeviceInfo(answer.attributes)};
    // A driver need not tell anything.
    if (!answer.isLost && answer.result.error == EOPNOTSUPP) return {};
    return {.error = describe(answer)};
}

ToldInfo askInfoAnew(Machine& machine, const std::string& address) try {
    DevlinkConnection connection(machine);
    if (connection.family().number == 0) return {.error = "this kernel has no devlink any more"};
    return askInfo(connection, address);
} catch (const std::system_error& error) {
    return {.error = error.what()};
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
    const auto& [error, text, offset, missingType] = answer.result;
    std::string reason = std::generic_category().message(error);
    if (error == ENOENT && text == "failed to locate the requested firmware file")
        return text + " (" + reason +
               "). The kernel looks for the file in the machine's own folders: outside a container it finds "
               "it";
    if (!text.empty()) return text + " (" + reason + ")";
    if (error == EPERM) return reason + "; " + kTakesPrivilege;
    if (error == ENODEV) return reason + ". The device is gone, or in another network namespace";
    return reason;
}

}  // namespace ma::devlink
