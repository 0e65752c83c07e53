#pragma once

#include "Framework/InstanceRange.h"

/// Fills a list anew and publishes it in one step, so that two rebuilds at once neither double nor drop
/// anything. Where the builder throws, the list is left empty and the exception passes on.
template <class Builder>
void rebuild(core::InstanceList& instances, Builder&& build) {
    core::InstanceList rebuilt;
    try {
        build(rebuilt);
    } catch (...) {
        instances.clear();
        throw;
    }
    instances.publish(rebuilt);
}
