// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <ostream>

#include "Cli/JobFollower.h"
#include "Cli/Management.h"
#include "Cli/UpdateObserver.h"

namespace cli {

/// What every verb works with.
struct Context {
    Management& management;
    std::ostream& out;    ///< results
    std::ostream& error;  ///< what went wrong
    bool json = false;    ///< results, failures included, as one JSON document
    UpdateObserver& observer;
    Following following;
};

}  // namespace cli
