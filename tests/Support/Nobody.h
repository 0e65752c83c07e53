// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <grp.h>
#include <unistd.h>

namespace test {

/// For the child of a death test: drops to the user nobody, for what needs a refused permission or a limit
/// that root does not have.
inline void becomeNobody() {
    constexpr uid_t nobody = 65534;
    if (geteuid() != 0) return;
    if (setgroups(0, nullptr) != 0 || setgid(nobody) != 0 || setuid(nobody) != 0) _exit(2);
}

}  // namespace test
