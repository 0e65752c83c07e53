// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Utils/Export.h"

namespace core {

class CimInstance;

/// Destroys an instance that nobody holds any more: at once, or on a thread of its own when the instance's
/// destructor waits. Never fails and never waits; where that thread cannot be had, the instance stays queued
/// until the next one comes, or drainReaper().
void destroyInstance(CimInstance* instance) noexcept;

/// Makes sure that the thread's owner is built, and so destroyed after the object that is being built now.
void prepareReaper();

/// Returns when every instance that was queued is destroyed, code of its library included.
QUENX_EXPORT void drainReaper() noexcept;

/// Whether the thread still has instances to destroy.
QUENX_EXPORT bool isReaperBusy() noexcept;

/// The deleter of listed instances.
struct InstanceRelease {
    void operator()(CimInstance* instance) const noexcept { destroyInstance(instance); }
};

}  // namespace core
