// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstddef>

namespace bench {

/// How often the process has allocated memory so far, its libraries included.
std::size_t allocations() noexcept;

}  // namespace bench
