// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <optional>
#include <string>

#include "Cli/Update/Candidate.h"
#include "History/Record.h"

/// What the history of this machine says of the images that its adapters have had. Nothing on a server, and
/// where none is kept.
namespace cli {

/// The last image that was written to an adapter, and the one before.
struct PastImages {
    std::optional<history::Record> last;
    std::optional<history::Record> before;  ///< with another sum than the last
    /// One that failed or was broken off after the last, and may have left anything in the flash.
    std::optional<history::Record> failed;
    /// The flash holds what the last one left there: nothing else has written to it.
    bool isUnchanged = false;
};

/// Throws CommandError where the history cannot be read.
PastImages pastImagesOf(const Connection& connection, const Adapter& adapter);

/// Whether the image, by its bytes, was the last that was written to the adapter, and is there still. False
/// where the history cannot be read.
bool isLastWritten(const Connection& connection, const Candidate& candidate);

/// The id of the record of this process's last attempt on the adapter; 0 where there is none, or it cannot be
/// read.
std::int64_t ownRecordOf(const Connection& connection, const Adapter& adapter);

}  // namespace cli
