// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <vector>

#include "Framework/Model/ClassDeclaration.h"

/// The classes of subscriptions and of indications. No provider has them, so they are declared here, with
/// the properties that are filled in alone.
namespace indications {

inline constexpr const char* kService = "CIM_IndicationService";
inline constexpr const char* kCapabilities = "CIM_IndicationServiceCapabilities";
inline constexpr const char* kFilter = "CIM_IndicationFilter";
inline constexpr const char* kDestination = "CIM_ListenerDestinationCIMXML";
inline constexpr const char* kHandler = "CIM_IndicationHandlerCIMXML";
inline constexpr const char* kSubscription = "CIM_IndicationSubscription";

/// Without their superclasses CIM_ManagedElement and CIM_Service, which others declare as well.
std::vector<core::ClassDeclaration> subscriptionClasses();

/// CIM_Indication and its subclasses, for queries.
const std::vector<core::ClassChain>& indicationClasses();

}  // namespace indications
