// SPDX-License-Identifier: Apache-2.0
#include "Host/Server/TlsPriorities.h"

#include <gnutls/gnutls.h>

#include <stdexcept>

namespace host {

const char* tlsPriorities() {
    return QUENX_TLS_PRIORITY;
}

void requireTlsPriorities(const std::string& priorities) {
    gnutls_priority_t read = nullptr;
    const char* rest = priorities.c_str();
    if (::gnutls_priority_init(&read, priorities.c_str(), &rest) == GNUTLS_E_SUCCESS) {
        ::gnutls_priority_deinit(read);
        return;
    }
    const bool isPolicy = priorities.starts_with('@');
    throw std::runtime_error("Cannot serve HTTPS: this quenx-cimd was built for the TLS priorities \"" +
                             priorities + "\", which GnuTLS does not take from \"" + rest + "\" on. " +
                             (isPolicy ? "Define them in the section [priorities] of " +
                                             std::string(::gnutls_get_system_config_file()) + ", or build it"
                                       : "Build it") +
                             " with another QUENX_TLS_PRIORITY.");
}

}  // namespace host
