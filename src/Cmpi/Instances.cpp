// SPDX-License-Identifier: Apache-2.0
#include "Cmpi/Instances.h"

#include "Cmpi/Slots.h"
#include "Framework/Events/LifecycleIndication.h"

namespace cmpi {

namespace {

/// The properties that the client gets. Given to the instance before anything is set, as object managers
/// want it.
void setFilter(Instance* instance, const core::InstanceValue& value, const core::PropertyFilter& filter,
               FilterNames& names) {
    for (const std::string& name : *filter)
        names.wanted.push_back(name.c_str());
    names.wanted.push_back(nullptr);
    for (const core::PropertyValue& property : value.properties) {
        if (property.isKey) names.keys.push_back(property.name.c_str());
    }
    names.keys.push_back(nullptr);
    call(instance, &InstanceTable::setPropertyFilter, names.wanted.data(), names.keys.data());
}

/// An instance within another one. Without it an indication would say nothing.
void embed(const Place& place, Instance* outer, const char* name, const core::InstanceSnapshot& inner) {
    FilterNames unused;
    Value value{};
    value.inst = newInstance(place, *inner, std::nullopt, unused);
    requireTaken(call(outer, &InstanceTable::setProperty, name, &value, kInstance), name);
}

}  // namespace

Instance* newInstance(const Place& place, const core::InstanceValue& value,
                      const core::PropertyFilter& filter, FilterNames& names) {
    Instance* instance = made(call(place.broker, place.broker.eft, &BrokerEncTable::newInstance,
                                   newPath(place, value.path), nullptr),
                              ("an instance of " + value.path.getClassName()).c_str());
    if (filter) setFilter(instance, value, filter, names);
    const core::WantedProperties wanted(filter);
    for (const core::PropertyValue& property : value.properties) {
        if (!property.isKey && !wanted.includes(property.name)) continue;
        const Given given(place, property.value);
        // A property that the object manager's classes do not have is no reason to give none of the others.
        call(instance, &InstanceTable::setProperty, property.name.c_str(), given.value(), given.type());
    }
    return instance;
}

Instance* newIndication(const Place& place, const core::InstanceEvent& event, const std::string& identifier,
                        const std::string& host) {
    FilterNames unused;
    const core::InstanceValue plain{core::CimPath(core::indicationClassOf(event), {}),
                                    core::indicationProperties(event, identifier, host, place.requested)};
    Instance* indication = newInstance(place, plain, std::nullopt, unused);
    embed(place, indication, "SourceInstance", core::sourceOf(event));
    if (const core::InstanceSnapshot previous = core::previousOf(event))
        embed(place, indication, "PreviousInstance", previous);
    return indication;
}

}  // namespace cmpi
