// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>
#include <vector>

#include "MidAPI/Activation.h"
#include "Utils/Export.h"
#include "Utils/StringArray.h"

namespace ma::devlink {

class Machine;

/// Fills in what of the machine's network runs over the interfaces of a card, as sysfs and procfs tell it:
/// bonds and bridges, VLANs and the like in between, and what would be cut off without them. Changes nothing.
/// @param use     with the card's functions and interfaces
/// @param caller  the network address of who asks; empty for somebody at the machine
QUENX_EXPORT void findNetworkUse(Machine& machine, const std::string& caller, CardUse& use);

/// An interface of a card before its firmware is activated: names may change in that, places do not.
struct LinkState {
    std::string function;  ///< the PCI address
    std::string interface;
    bool isUp = false;  ///< it has a link
};

/// The interfaces of the functions, with the state of their links.
QUENX_EXPORT std::vector<LinkState> linksOf(Machine& machine, const utils::StringArray& functions);

/// What of `before` is not there again: "0000:05:00.0 has no interface (eth0)", "eth0 has no link". Empty
/// when all is.
QUENX_EXPORT utils::StringArray missingLinks(Machine& machine, const std::vector<LinkState>& before);

}  // namespace ma::devlink
