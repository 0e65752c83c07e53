// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <array>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "MidAPI/AdapterTypes.h"
#include "MidAPI/Devlink/Machine.h"
#include "Utils/Export.h"
#include "Utils/FirmwareTypes.h"
#include "Utils/StringArray.h"

/// The Ethernet adapters of a machine as sysfs shows them: PCI functions of class 0x0200. Any thread may
/// call; nothing here waits for a device.
namespace ma::devlink {

/// One PCI function with a network device on it.
struct PciFunction {
    std::string address;  ///< "0000:05:00.0": what sysfs and devlink call it, and the adapter's name
    PciIds ids = {};
    std::string driver = {};             ///< empty when none drives it
    utils::StringArray interfaces = {};  ///< its own, sorted; not those that stand for virtual functions

    /// The address without the function's number: what functions of one card have in common.
    QUENX_EXPORT std::string card() const;
};

/// All functions by ascending address. Left out are virtual functions, which have no flash of their own, and
/// those whose interfaces were all given to another network namespace. Nothing where they cannot be read.
QUENX_EXPORT std::optional<std::vector<PciFunction>> findPciFunctions(Machine& machine);

/// What stands and falls with the functions of a card.
struct CardFunctions {
    utils::StringArray functions = {};  ///< of the card's place on the bus, those in other namespaces, too
    utils::StringArray interfaces =
        {};  ///< their own, and those that are of, or stand for, virtual functions
};
/// @param addresses  further functions that are known to be on the card
/// @throws AdapterError where that cannot be read
QUENX_EXPORT CardFunctions readCard(Machine& machine, const std::string& card,
                                    const utils::StringArray& addresses);

/// What the interfaces of a function tell: nothing where it has none.
struct InterfaceState {
    std::array<std::uint8_t, 6> mac{};
    std::uint64_t speed = 0;  ///< bits per second, 0 when unknown
    bool linkUp = false;
};
QUENX_EXPORT InterfaceState readInterfaceState(Machine& machine, const PciFunction& function);

/// Takes "0000:05:00.0" apart; the domain may have up to eight digits. Nothing for any other text.
QUENX_EXPORT std::optional<utils::PCIAddr> parseFunctionAddress(std::string_view address);

}  // namespace ma::devlink
