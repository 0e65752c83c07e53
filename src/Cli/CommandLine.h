// SPDX-License-Identifier: Apache-2.0
#pragma once

namespace cli {

/// The whole program: reads the arguments, opens the way to the model, runs the verb, prints what went wrong.
/// Returns the exit status.
int runCommandLine(int argc, char** argv);

}  // namespace cli
