// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdlib>

/// What must hold for every input: a finding of the fuzzer when it does not.
inline void require(bool condition) {
    if (!condition) std::abort();
}
