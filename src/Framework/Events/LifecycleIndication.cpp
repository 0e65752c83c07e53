// SPDX-License-Identifier: Apache-2.0
#include "Framework/Events/LifecycleIndication.h"

#include <utility>

#include "Framework/Requests/CimOperations.h"

namespace core {

namespace {

PropertyValue textProperty(const char* name, std::string text) {
    return {name, CimValue::of(CimType::String, std::move(text)), false, {}};
}

}  // namespace

const char* indicationClassOf(const InstanceEvent& event) {
    if (event.before == nullptr) return "CIM_InstCreation";
    return event.after == nullptr ? "CIM_InstDeletion" : "CIM_InstModification";
}

std::vector<PropertyValue> indicationProperties(const InstanceEvent& event, std::string identifier,
                                                std::string host, const std::string& nameSpace) {
    CimPath path = sourceOf(event)->path;
    path.setNamespace(nameSpace);
    path.setHost(host);
    std::vector<PropertyValue> properties;
    properties.push_back(textProperty("IndicationIdentifier", std::move(identifier)));
    properties.push_back(
        {"IndicationTime", CimValue::of(CimType::Datetime, utils::Time::fromEpoch(event.time)), false, {}});
    properties.push_back(textProperty("SourceInstanceModelPath", path.toString()));
    properties.push_back(textProperty("SourceInstanceHost", std::move(host)));
    return properties;
}

}  // namespace core
