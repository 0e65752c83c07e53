// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>
#include <vector>

namespace ma {

/// What stands and falls with the card of an adapter port.
struct CardUse {
    std::vector<std::string> functions = {};   ///< adapter names of all ports of the card
    std::vector<std::string> interfaces = {};  ///< network interfaces of these
    std::vector<std::string> bonds = {};       ///< that have one of the interfaces
    std::vector<std::string> bridges = {};     ///< likewise
    /// What the machine would be cut off from while the card is reset, each a clause: "the default route goes
    /// through eth0".
    std::vector<std::string> losses = {};
};

/// Who asks for an activation, and how far it may go.
struct ActivationRequest {
    bool mayDisrupt = false;  ///< also where the card's use has losses
    std::string caller = {};  ///< the network address of who asks; empty for somebody at the machine
};

/// How an activation ended.
struct Activation {
    enum Status {
        Done,          ///< the new firmware runs, as far as the driver tells it, and the interfaces are back
        NotOffered,    ///< this adapter takes a restart of the machine, or a power cycle
        WouldDisrupt,  ///< refused: the card's use has losses
        Failed,        ///< the driver refused or failed, and what ran before runs still
        NotBack,       ///< it was done, but an interface or a link of the card has not come back in time
        StillPending,  ///< it was done, but the driver tells that what ran before runs still
        Unknown,       ///< nobody has told whether it was done, and what runs now cannot be read
    };
    Status status = NotOffered;
    std::string text;  ///< for people: a clause, or several with semicolons; Done has one where the driver
                       ///< does not tell which firmware runs
};

}  // namespace ma
