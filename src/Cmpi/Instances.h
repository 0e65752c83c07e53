// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>
#include <vector>

#include "Cmpi/Values.h"
#include "Framework/Events/EventSink.h"
#include "Framework/Requests/CimOperations.h"

/// Instances on their way to the object manager. Nothing here may be kept beyond the call, or the attachment,
/// that it is made in. All throw core::CimError where the object manager does not make what is asked of it.
namespace cmpi {

/// The lists of names by which an instance is filtered. Object managers may go on looking at them, so they
/// have to outlive it.
struct FilterNames {
    std::vector<const char*> wanted = {};
    std::vector<const char*> keys = {};
};

/// @param filter  the client's; must outlive the instance
Instance* newInstance(const Place& place, const core::InstanceValue& value,
                      const core::PropertyFilter& filter, FilterNames& names);

/// CIM_InstCreation, CIM_InstModification or CIM_InstDeletion with the instances in it.
/// @param identifier  of this event alone
/// @param host        of this server
Instance* newIndication(const Place& place, const core::InstanceEvent& event, const std::string& identifier,
                        const std::string& host);

}  // namespace cmpi
