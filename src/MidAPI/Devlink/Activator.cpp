// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Devlink/Activator.h"

#include <linux/devlink.h>

#include <cerrno>
#include <chrono>
#include <thread>

#include "MidAPI/Devlink/DeviceRequests.h"
#include "MidAPI/Devlink/NetworkUse.h"
#include "Utils/Utils.h"

namespace ma::devlink {
namespace {

/// A link takes its time to be agreed on, and a device to start.
utils::StringArray waitForLinks(Machine& machine, const std::vector<LinkState>& before) {
    constexpr int kPatience = 12;
    constexpr int kLooks = 100;
    for (int look = 0;; ++look) {
        utils::StringArray missing = missingLinks(machine, before);
        if (missing.empty() || look == kLooks) return missing;
        std::this_thread::sleep_for(machine.patience() * kPatience / kLooks);
    }
}

/// Whether one of the nested attributes says that the driver knows the action.
bool namesActivation(ByteView actions) {
    for (const Attribute& action : readAttributes(actions)) {
        if (action.type != DEVLINK_ATTR_RELOAD_ACTION_INFO) continue;
        for (const Attribute& each : readAttributes(action.payload))
            if (each.type == DEVLINK_ATTR_RELOAD_ACTION &&
                each.number<std::uint8_t>() == DEVLINK_RELOAD_ACTION_FW_ACTIVATE)
                return true;
    }
    return false;
}

std::string refusalText(const Answer& answer) {
    return describe(answer) + (answer.result.error == EPERM ? "; run it as root" : "");
}

}  // namespace

bool offersActivation(DevlinkConnection& connection, const std::string& address) {
    // The kernel counts the resets, by each action that the driver knows.
    const Answer answer = connection.ask(DEVLINK_CMD_GET, address);
    if (answer.isLost || answer.result.error != 0) return false;
    for (const Attribute& statistics : readAttributes(answer.attributes)) {
        if (statistics.type != DEVLINK_ATTR_DEV_STATS) continue;
        for (const Attribute& own : readAttributes(statistics.payload))
            if (own.type == DEVLINK_ATTR_RELOAD_STATS && namesActivation(own.payload)) return true;
    }
    return false;
}

Activation activateDevice(Machine& machine, const std::string& address, const utils::StringArray& functions) {
    const std::vector<LinkState> before = linksOf(machine, functions);
    DevlinkConnection connection(machine);
    const Answer answer = connection.ask(DEVLINK_CMD_RELOAD, address, [](RequestWriter& request) {
        request.putByte(DEVLINK_ATTR_RELOAD_ACTION, DEVLINK_RELOAD_ACTION_FW_ACTIVATE);
    });
    const bool isDone = !answer.isLost && answer.result.error == 0;
    if (!isDone && !answer.isLost && answer.result.error == EOPNOTSUPP)
        return {Activation::NotOffered, refusalText(answer)};
    // A reset that failed half-way takes the interfaces along.
    const utils::StringArray missing = isDone ? waitForLinks(machine, before) : missingLinks(machine, before);
    utils::StringArray texts = missing;
    if (!isDone) texts.insert(texts.begin(), refusalText(answer));
    const std::string text = utils::joined(texts, "; ");
    if (!isDone) return {Activation::Failed, text};
    return {missing.empty() ? Activation::Done : Activation::NotBack, text};
}

}  // namespace ma::devlink
