// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "MidAPI/AdapterTypes.h"
#include "Utils/FirmwareTypes.h"
#include "Utils/Os/Linux/linux.h"

/// Ports and cards: how they are read, where an adapter that does not answer never hides the others, and what
/// both say of themselves. Each template is for a binding class that derives from CIM_LogicalDevice, and sets
/// the members of that class.
namespace inventory {

/// The name under which this provider registers.
inline constexpr const char* kProviderName = "Software Inventory";

/// A port, by what identifies it.
struct Port {
    std::string adapter;
    utils::PCIAddr address;

    bool operator==(const Port&) const = default;
};

/// All ports in the adapter API's order, without those that go away meanwhile.
/// @throws utils::Exception when the adapters cannot be had at all
std::vector<Port> readPorts();

/// What is known of the port; nothing when it does not answer.
std::optional<ma::AdapterInfo> readInfo(const std::string& adapter);

/// "0001:" of an address whose text begins so; empty for the first domain, which is all that most machines
/// have, and for a text that is no full address.
std::string domainOf(const utils::PCIAddr& address);

/// A row of OtherIdentifyingInfo with its row of IdentifyingDescriptions.
struct Identification {
    std::string description;
    std::string info;
};

/// How a port or a card is identified beside its keys: where it is, what it is, whether its firmware can be
/// updated, which backend and driver reach it, and which reset it waits for. What is not known is left out.
std::vector<Identification> identify(const std::string& address, const std::optional<ma::AdapterInfo>& info,
                                     bool updatable);

/// "Power Cycle"
const char* resetText(ma::ResetNeeded reset);

/// Puts the rows into the two arrays that stand for them.
template <class Device>
void setIdentification(Device& device, std::vector<Identification> rows) {
    std::vector<std::string> infos;
    std::vector<std::string> descriptions;
    for (Identification& row : rows) {
        infos.push_back(std::move(row.info));
        descriptions.push_back(std::move(row.description));
    }
    device.OtherIdentifyingInfo = std::move(infos);
    device.IdentifyingDescriptions = std::move(descriptions);
}

/// Sets the keys and the names. Called once, so that the path stays what it was when the host gets another
/// name.
template <class Device>
void setDeviceKeys(Device& device, const std::string& uniqId) {
    device.SystemCreationClassName = "CIM_ComputerSystem";
    device.SystemName = os::getHostname();
    device.CreationClassName = device.getClassName();
    device.DeviceID = "Quenx:" + uniqId;
    device.Name = uniqId;
    device.ElementName = uniqId;
}

/// Values of CIM_EnabledLogicalElement.EnabledState.
enum class EnabledState : std::uint16_t { Unknown = 0, Enabled = 2, EnabledButOffline = 6 };

/// Sets the states: a device that does not answer is in a state not known.
template <class Device>
void setDeviceState(Device& device, EnabledState state) {
    const bool isKnown = state != EnabledState::Unknown;
    device.EnabledState = static_cast<std::uint16_t>(state);
    device.RequestedState = 12;  // not applicable: nobody can enable or disable it here
    device.OperationalStatus = {static_cast<std::uint16_t>(isKnown ? 2 : 0)};  // OK
    device.HealthState = isKnown ? 5 : 0;                                      // OK
}

}  // namespace inventory
