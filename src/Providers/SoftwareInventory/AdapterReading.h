#pragma once

#include <optional>
#include <string>
#include <vector>

#include "MidAPI/AdapterTypes.h"
#include "Utils/FirmwareTypes.h"

/// How the inventory reads adapters. One that does not answer never hides the others.
namespace inventory {

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

/// A row of OtherIdentifyingInfo with its row of IdentifyingDescriptions.
struct Identification {
    const char* description;
    std::string info;
};

/// How a port or a card is identified beside its keys: where it is, what it is, and whether its firmware can
/// be updated. What is not known is left out.
std::vector<Identification> identify(const std::string& address, const std::optional<ma::AdapterInfo>& info,
                                     bool updatable);

/// Puts the rows into the two arrays of a CIM_LogicalDevice.
template <class Device>
void setIdentification(Device& device, std::vector<Identification> rows) {
    std::vector<std::string> infos;
    std::vector<std::string> descriptions;
    for (Identification& row : rows) {
        infos.push_back(std::move(row.info));
        descriptions.emplace_back(row.description);
    }
    device.OtherIdentifyingInfo = std::move(infos);
    device.IdentifyingDescriptions = std::move(descriptions);
}

}  // namespace inventory
