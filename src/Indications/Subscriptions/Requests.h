// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>
#include <vector>

#include "Framework/Requests/CimOperations.h"
#include "Indications/Subscriptions/Records.h"

/// What clients send, as records. Whatever is wrong with it is CimError; a record that was read from a file
/// is looked at by the same checks.
namespace indications {

/// Where filters may look for events.
struct EventSources {
    std::vector<std::string> namespaces;  ///< all that are served
    std::string eventNamespace;           ///< the one that events come from
    std::vector<core::ClassChain> classes;
};

/// The properties that the class declares, in its types. Others are passed over, since older clients send
/// some that are in no schema. CimError (type mismatch) for a value of another type.
core::InstanceValue typedInstance(const core::InstanceValue& given, const core::ClassChain& chain);

// From typed instances. A name that is missing is made up.

Filter readFilter(const core::InstanceValue& instance, const std::string& eventNamespace);
Destination readDestination(const core::InstanceValue& instance);
/// Without its keys.
Subscription readSubscription(const core::InstanceValue& instance);

/// The new values of what a client may change; CimError (not supported) where another differs.
/// @param current  as the client sees it
/// @param only     those that count; all that are given without it
void change(Subscription& subscription, const core::InstanceValue& instance,
            const core::InstanceValue& current, const core::PropertyFilter& only);

/// Compiles the query, too.
void check(Filter& filter, const EventSources& sources);
void check(const Destination& destination);
void check(const Subscription& subscription);

/// CimError (not supported) for a filter that no event will ever match.
void requireEvents(const Filter& filter, const EventSources& sources);

/// Microseconds since the Unix epoch.
std::uint64_t currentTime();

}  // namespace indications
