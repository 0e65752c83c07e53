// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>

namespace host {

/// Which versions of TLS, ciphers and key exchanges the server agrees to, as a priority string of GnuTLS.
/// Chosen when it is built, since a distribution decides that for all its programs alike.
const char* tlsPriorities();

/// Throws std::runtime_error, with what to do, where GnuTLS does not know what the text says: a word of it,
/// or the policy of this machine that it names ("@SYSTEM").
void requireTlsPriorities(const std::string& priorities);

}  // namespace host
