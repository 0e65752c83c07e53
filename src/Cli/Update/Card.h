// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <functional>
#include <nlohmann/json_fwd.hpp>
#include <ostream>
#include <string>

#include "Cli/Connection/Connection.h"
#include "MidAPI/Activation.h"

/// The card behind an adapter port: what stands and falls with it, and what it waits for after an update.
namespace cli {

/// The network address from which the user of this process has logged in, as the environment of the process
/// or of one that it descends from tells it; empty for a user at the machine. What is not to be read counts
/// as nothing, so this finds who is there, and keeps out nobody.
/// @param read  the content of a file of /proc; empty where it cannot be read
std::string findCaller(const std::function<std::string(const std::string& path)>& read);

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
