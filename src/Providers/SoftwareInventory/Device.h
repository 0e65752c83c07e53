#pragma once

#include <cstdint>
#include <string>

#include "Utils/Os/Linux/linux.h"

/// What all devices of the inventory have in common. Each function is for a binding class that derives from
/// CIM_LogicalDevice, and sets the members of that class.
namespace inventory {

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
    device.EnabledState = static_cast<unsigned short>(state);
    device.RequestedState = 12;  // not applicable: nobody can enable or disable it here
    device.OperationalStatus =
        std::vector<unsigned short>{static_cast<unsigned short>(isKnown ? 2 : 0)};  // OK
    device.HealthState = isKnown ? 5 : 0;                                           // OK
}

}  // namespace inventory
