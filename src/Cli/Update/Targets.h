// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>
#include <vector>

#include "Cli/Update/Candidate.h"

/// Which adapters get which image, where nobody names a single one.
namespace cli {

/// A function of a card that another function stands for.
struct SameCard {
    Adapter adapter;
    std::string target;  ///< the name of the other one
};

struct Targets {
    std::vector<Candidate> candidates;  ///< in the order of the adapters, one a card
    std::vector<SameCard> sameCard;
    std::vector<std::string> unused;  ///< images that fit none of the adapters
};

/// The same for all functions of a card, and for nothing else: the serial number of its board, else that of
/// the PCI function, else the place of the slot.
std::string cardOf(const Adapter& adapter);

/// Those whose name or PCI address matches a shell's pattern; all for an empty one. Throws CommandError where
/// there is none.
std::vector<Adapter> matchingAdapters(const Connection& connection, const std::string& pattern);

/// Chooses the adapters, and looks at each image for each of them. Throws CommandError when there is none,
/// for an image that cannot be read or is none, and when two images fit one adapter.
/// @param update  the options that hold for each adapter
Targets chooseTargets(const Connection& connection, const ManyOptions& many, const UpdateOptions& update);

}  // namespace cli
