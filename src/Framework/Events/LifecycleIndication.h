// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>
#include <vector>

#include "Framework/Events/EventSink.h"
#include "Utils/Export.h"

namespace core {

struct PropertyValue;

/// CIM_InstCreation, CIM_InstModification or CIM_InstDeletion, by what the event has.
QUENX_EXPORT const char* indicationClassOf(const InstanceEvent& event);

/// The instance that an indication is about: as it is now, and as it was before a deletion.
inline const InstanceSnapshot& sourceOf(const InstanceEvent& event) {
    return event.after == nullptr ? event.before : event.after;
}
/// As it was before a modification; null for the others.
inline InstanceSnapshot previousOf(const InstanceEvent& event) {
    return event.after == nullptr ? nullptr : event.before;
}

/// What an indication says of its event beside the instances: IndicationIdentifier, IndicationTime,
/// SourceInstanceModelPath and SourceInstanceHost.
/// @param identifier  of this event alone
/// @param host        of this server
/// @param nameSpace   in which clients find the instance
QUENX_EXPORT std::vector<PropertyValue> indicationProperties(const InstanceEvent& event,
                                                             std::string identifier, std::string host,
                                                             const std::string& nameSpace);

}  // namespace core
