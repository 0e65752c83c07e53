// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <memory>

#include "MidAPI/AdapterTypes.h"
#include "MidAPI/Backend.h"

namespace ma {

/// How much speaks for a backend that nobody has asked for by its name, least first. Of the backends there
/// are, the one with the strongest claim is taken.
enum class Claim {
    None,
    Possible,   ///< it finds adapters by itself, if only there were any
    Described,  ///< a description of such adapters is installed, perhaps a forgotten one
    Present,    ///< the machine has adapters of this kind
    Named,      ///< somebody has named such adapters
};

/// A backend that can be chosen. Backends.cpp has one row for each.
struct BackendKind {
    const char* name;       ///< by which options, settings, variables and AdapterInfo::backend call it
    bool takesDescription;  ///< its adapters are described in a file
    Claim (*claim)(const BackendChoice& choice);
    /// Throws AdapterError.
    std::shared_ptr<Backend> (*make)(const BackendChoice& choice);
};

/// Makes the backend that is chosen; ma::selectBackend() has the rules. Throws AdapterError; the text begins
/// with the name of the variable that is at fault, if one is.
std::shared_ptr<Backend> makeBackend(const BackendChoice& choice);

}  // namespace ma
