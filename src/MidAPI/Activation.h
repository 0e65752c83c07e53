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
        Done,          ///< the new firmware runs, and the interfaces are back
        NotOffered,    ///< this adapter takes a restart of the machine, or a power cycle
        WouldDisrupt,  ///< refused: the card's use has losses
        Failed,        ///< the driver refused or failed; the text says why
        NotBack,       ///< it was done, but an interface or a link of the card has not come back in time
    };
    Status status = NotOffered;
    std::string text;  ///< for people: a clause, or several with semicolons; empty when it is Done
};

}  // namespace ma
