// SPDX-License-Identifier: Apache-2.0
#include "History/Place.h"

#include <unistd.h>

#include <string_view>

#include "History/Store.h"
#include "MidAPI/ma.h"
#include "Utils/Os/Linux/linux.h"

namespace history {

namespace {

constexpr const char* kVariable = "QUENX_HISTORY";
constexpr const char* kRootsFolder = "/var/lib/quenx/history";

/// "adapters.history" beside "adapters.state", and "rack1.history" beside "rack1".
std::string besideState(std::string state) {
    constexpr std::string_view kEnding = ".state";
    while (state.size() > 1 && state.ends_with('/'))
        state.pop_back();
    if (state.ends_with(kEnding)) state.resize(state.size() - kEnding.size());
    return state + ".history";
}

}  // namespace

bool isWanted() {
    const char* named = os::getEnvVariable(kVariable);
    return named == nullptr || named != std::string("off");
}

std::string chooseFolder() {
    if (const char* named = os::getEnvVariable(kVariable); named != nullptr && *named != '\0') return named;
    // What was tried on simulated adapters is not mixed with what was done to the machine's own.
    if (const std::string state = ma::stateFolder(); !state.empty()) return besideState(state);
    if (::geteuid() == 0) return kRootsFolder;
    throw HistoryError(std::string("an ordinary user has no place for it; name a folder with ") + kVariable);
}

}  // namespace history
