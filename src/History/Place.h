// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>

namespace history {

/// Whether one is wanted at all: not where the variable QUENX_HISTORY is "off".
bool isWanted();

/// The folder of the history of the adapters in use: QUENX_HISTORY where that is set; beside the state of
/// simulated adapters; else, for root, in /var/lib/quenx. Throws HistoryError where there is no place for
/// one, and what the adapter API throws.
std::string chooseFolder();

}  // namespace history
