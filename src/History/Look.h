// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <string>

#include "Framework/Requests/UpdateSink.h"

/// What adapters and images tell of themselves, as a record has it.
namespace history {

/// An adapter as it is now. A text that it does not tell is empty.
struct AdapterLook {
    std::string backend;
    std::string pciAddress;
    std::string serial;
    std::string running;         ///< its versions that are in force: "IMG_PXE 1, IMG_UEFI 0"
    std::string stored;          ///< its versions in the flash, in force after a reset if not yet
    bool isStoredKnown = false;  ///< false where the adapter does not tell what waits for a reset
};

/// Nothing for an adapter that cannot be asked.
std::optional<AdapterLook> lookAt(const std::string& adapter);

/// The sum of the bytes, and the versions in them where they are of a format that is known.
core::ImageFacts factsOf(std::span<const std::uint8_t> file);

}  // namespace history
