// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <string>

#include "Framework/Requests/CimOperations.h"
#include "Indications/Delivery/Queue.h"
#include "Indications/Subscriptions/Records.h"

/// Records as clients see them: instances, their paths and references without a namespace.
namespace indications {

/// @param systemName  of this machine, whatever the client called it
core::CimPath pathOf(const Filter& filter, const std::string& systemName);
core::CimPath pathOf(const DestinationKey& destination, const std::string& systemName);
core::CimPath pathOf(const Subscription& subscription, const std::string& systemName);

core::InstanceValue instanceOf(const Filter& filter, const std::string& systemName);
core::InstanceValue instanceOf(const Destination& destination, const std::string& systemName);
/// @param state  what it comes to: that of the record, or one that says why nothing arrives
/// @param now    microseconds since the Unix epoch
core::InstanceValue instanceOf(const Subscription& subscription, std::uint64_t state,
                               const std::string& systemName, std::uint64_t now);

core::InstanceValue serviceInstance(const DeliverySettings& settings, const std::string& systemName);
/// @param most  destinations, and subscriptions
core::InstanceValue capabilitiesInstance(std::size_t most, bool isPersisted);

}  // namespace indications
