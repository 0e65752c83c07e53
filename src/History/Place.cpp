// SPDX-License-Identifier: Apache-2.0
#include "History/Place.h"

#include <unistd.h>

#include <filesystem>

#include "History/Store.h"
#include "MidAPI/ma.h"
#include "Utils/Os/Linux/linux.h"

namespace history {

namespace {

constexpr const char* kVariable = "QUENX_HISTORY";
constexpr const char* kRootsFolder = "/var/lib/quenx/history";

}  // namespace

bool isWanted() {
    const char* named = os::getEnvVariable(kVariable);
    return named == nullptr || named != std::string("off");
}

std::string chooseFolder() {
    if (const char* named = os::getEnvVariable(kVariable); named != nullptr && *named != '\0') return named;
    // What was tried on simulated adapters is not mixed with what was done to the machine's own.
    const std::string state = ma::stateFolder();
    if (!state.empty()) return std::filesystem::path(state).replace_extension(".history").string();
    if (::geteuid() == 0) return kRootsFolder;
    throw HistoryError(std::string("an ordinary user has no place for it; name a folder with ") + kVariable);
}

}  // namespace history
