// SPDX-License-Identifier: Apache-2.0
#pragma once

namespace cli {

/// What the program tells the script that called it; the help text documents them.
enum class ExitStatus {
    Done = 0,
    Failed = 1,
    WrongUse = 2,
    AlreadyCurrent = 3,  ///< what was to be installed is what is installed
    NotFound = 4,        ///< what the command line names is not there: an adapter, a job, an image file
};

}  // namespace cli
