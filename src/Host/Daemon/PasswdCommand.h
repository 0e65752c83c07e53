// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Host/Daemon/CommandLine.h"

namespace host {

/// `quenx-cimd passwd`: asks for a password on the terminal, or reads a line where there is none, and writes
/// the users file. Returns the exit status, having said what went wrong.
int runPasswd(const PasswdRequest& request);

}  // namespace host
