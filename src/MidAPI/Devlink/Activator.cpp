// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Devlink/Activator.h"

#include <linux/devlink.h>

#include <algorithm>
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

/// What runs, with what waits: "fw 1.2.3 runs (1.3.0 is in the flash)". Empty where nothing waits.
std::string pendingText(const std::vector<NamedVersion>& versions) {
    utils::StringArray pending;
    for (const NamedVersion& version : versions)
        if (version.isPending())
            pending.push_back(version.name + ' ' + version.running + " runs (" + version.stored +
                              " is in the flash)");
    return utils::joined(pending);
}

bool tellsWhatRuns(const std::vector<NamedVersion>& versions) {
    return std::ranges::any_of(
        versions, [](const auto& version) { return !version.running.empty() && !version.stored.empty(); });
}

bool runsTheSame(const std::vector<NamedVersion>& before, const std::vector<NamedVersion>& now) {
    const auto runs = [](const auto& version) { return !version.running.empty(); };
    return std::ranges::any_of(now, runs) &&
           std::ranges::equal(before, now, {}, &NamedVersion::running, &NamedVersion::running);
}

/// What a reset that was acknowledged has brought.
Activation::Status statusWhenDone(const ToldInfo& now, bool isBack) {
    if (!isBack) return Activation::NotBack;
    if (!now.error.empty()) return Activation::Unknown;
    return pendingText(now.info.versions).empty() ? Activation::Done : Activation::StillPending;
}

/// What a reset that failed, or whose acknowledgement is lost, has come to: a driver may have begun it.
Activation::Status statusByVersions(const ToldInfo& before, const ToldInfo& now, bool isBack, bool isLost) {
    if (!now.error.empty()) return Activation::Unknown;
    if (runsTheSame(before.info.versions, now.info.versions)) return Activation::Failed;
    const bool isInForce = !pendingText(before.info.versions).empty() && tellsWhatRuns(now.info.versions) &&
                           pendingText(now.info.versions).empty();
    if (!isInForce) return Activation::Unknown;
    return isBack && isLost ? Activation::Done : Activation::NotBack;
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
    const std::vector<LinkState> links = linksOf(machine, functions);
    DevlinkConnection connection(machine);
    const ToldInfo before = askInfo(connection, address);
    const Answer answer = connection.ask(DEVLINK_CMD_RELOAD, address, [](RequestWriter& request) {
        request.putByte(DEVLINK_ATTR_RELOAD_ACTION, DEVLINK_RELOAD_ACTION_FW_ACTIVATE);
    });
    const bool isDone = !answer.isLost && answer.result.error == 0;
    if (!answer.isLost && answer.result.error == EOPNOTSUPP)
        return {Activation::NotOffered, describe(answer)};
    // A reset that failed half-way takes the interfaces along; one that was refused does not.
    utils::StringArray texts =
        isDone || answer.isLost ? waitForLinks(machine, links) : missingLinks(machine, links);
    const bool isBack = texts.empty();
    const ToldInfo now = askInfoAnew(machine, address);
    if (!isDone) texts.insert(texts.begin(), describe(answer));
    if (!now.error.empty()) texts.push_back("which firmware runs cannot be read: " + now.error);
    if (const std::string pending = pendingText(now.info.versions); !pending.empty())
        texts.push_back(pending);
    else if (now.error.empty() && !tellsWhatRuns(now.info.versions))
        texts.emplace_back("the driver does not tell which firmware runs");
    const auto status =
        isDone ? statusWhenDone(now, isBack) : statusByVersions(before, now, isBack, answer.isLost);
    // How it went is nothing to tell of any more where the new firmware is known to run.
    const bool isProven = status == Activation::Done && tellsWhatRuns(now.info.versions);
    return {status, isProven ? "" : utils::joined(texts, "; ")};
}

}  // namespace ma::devlink
