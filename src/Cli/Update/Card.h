// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <nlohmann/json_fwd.hpp>
#include <ostream>
#include <string>

#include "Cli/Connection/Connection.h"
#include "MidAPI/Activation.h"

/// The card behind an adapter port: what stands and falls with it, and what it waits for after an update.
namespace cli {

/// What runs over the card of an adapter, as far as the machine tells it. Nothing on a server.
ma::CardUse readCard(const Connection& connection, const std::string& adapter);
nlohmann::ordered_json cardJson(const ma::CardUse& card);

/// One line for each kind of thing that the card has, indented; nothing for a card of which nothing is known.
void printCard(std::ostream& out, const ma::CardUse& card);

/// Puts the firmware in force that is in the flash, with an audit line. Only in process.
/// @param mayDisrupt  also where the machine, or who asks, would be cut off
ma::Activation activateFirmware(const std::string& adapter, bool mayDisrupt);

/// What to do so that written firmware takes effect; empty when it has done so.
/// @param resetNeeded  as the model tells it: "none", "reload", "reboot", "power cycle", "unknown"
std::string resetAdvice(const std::string& adapter, const std::string& resetNeeded);

}  // namespace cli
