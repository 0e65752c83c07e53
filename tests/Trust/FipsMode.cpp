// SPDX-License-Identifier: Apache-2.0
// Says whether GnuTLS is in its FIPS mode, then becomes the program that its arguments name: not every build
// of the library obeys GNUTLS_FORCE_FIPS_MODE, and tests that ran without the mode must not look as if they
// had run in it.
#include <gnutls/gnutls.h>
#include <unistd.h>

#include <cstdio>

int main(int argc, char** argv) {
    const unsigned int mode = ::gnutls_fips140_mode_enabled();
    std::printf(
        "gnutls_fips140_mode_enabled() is %u: what follows runs %s\n", mode,
        mode != 0 ? "in FIPS mode" : "without FIPS mode, since this GnuTLS has none or was not asked");
    static_cast<void>(std::fflush(stdout));
    if (argc > 1) ::execv(argv[1], argv + 1);
    std::perror(argc > 1 ? argv[1] : "no program is named");
    return 127;
}
