// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstddef>
#include <span>

#include "Utils/Export.h"

namespace os {

/// The return addresses on the calling thread's stack, from the caller's own on: what backtrace(3) gives, but
/// a stack that a thread has walked lately is known again, and then costs a hundredth of that.
/// @return how many there are; as many as fit, of more
QUENX_EXPORT std::size_t walkStack(std::span<void*> addresses) noexcept;

}  // namespace os
