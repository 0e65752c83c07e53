// SPDX-License-Identifier: Apache-2.0
#include "Framework/Requests/RequestValues.h"

#include <algorithm>

#include "Framework/Model/CimInstance.h"

namespace core {

namespace {

PropertyValue readProperty(const CimProperty& property, const std::string& namespaceName) {
    PropertyValue result{property.getName(), property.getValue(), property.isKey(), {}};
    if (const char* target = property.getReferenceClass()) result.referenceClass = target;
    if (auto* scalar = std::get_if<CimScalar>(&result.value.data)) {
        if (auto* path = std::get_if<CimPath>(scalar)) path->completeNamespace(namespaceName);
    }
    return result;
}

}  // namespace

const PropertyValue* InstanceValue::find(std::string_view name) const {
    const auto found = std::find_if(properties.begin(), properties.end(), [&](const PropertyValue& property) {
        return sameName(property.name, name);
    });
    return found == properties.end() ? nullptr : &*found;
}

bool isWanted(const PropertyFilter& filter, std::string_view name) {
    return !filter || std::any_of(filter->begin(), filter->end(),
                                  [&](const std::string& wanted) { return sameName(wanted, name); });
}

InstanceValue readInstance(CimInstance& instance, CimPath path, const PropertyFilter& filter,
                           const std::string& namespaceName) {
    InstanceValue result{std::move(path), {}};
    result.path.completeNamespace(namespaceName);
    // One lock around all properties: a refresh on another thread shows whole or not at all.
    const RecursiveLocker lock(instance.getMutex());
    const std::vector<CimProperty*> properties = instance.getProperties();
    result.properties.reserve(properties.size());
    for (const CimProperty* property : properties) {
        if (isWanted(filter, property->getName()))
            result.properties.push_back(readProperty(*property, namespaceName));
    }
    return result;
}

}  // namespace core
