#include "Framework/Requests/RequestTools.h"

#include <algorithm>

#include "Framework/Model/CimPropertyRef.h"
#include "Framework/Requests/ServedModel.h"

namespace core {

namespace {

bool isWanted(const PropertyFilter& filter, const char* name) {
    return !filter || std::any_of(filter->begin(), filter->end(),
                                  [&](const std::string& wanted) { return sameName(wanted, name); });
}

PropertyValue readProperty(const CimProperty& property, const std::string& namespaceName) {
    PropertyValue result{property.getName(), property.getValue(), property.isKey(), {}};
    if (const char* target = property.getReferenceClass()) result.referenceClass = target;
    if (auto* scalar = std::get_if<CimScalar>(&result.value.data)) {
        if (auto* path = std::get_if<CimPath>(scalar)) path->completeNamespace(namespaceName);
    }
    return result;
}

}  // namespace

InstanceValue readInstance(CimInstance& instance, CimPath path, const PropertyFilter& filter,
                           const std::string& namespaceName) {
    InstanceValue result{std::move(path), {}};
    result.path.completeNamespace(namespaceName);
    const RecursiveLocker lock(instance.getMutex());
    const std::vector<CimProperty*> properties = instance.getProperties();
    result.properties.reserve(properties.size());
    for (const CimProperty* property : properties) {
        if (isWanted(filter, property->getName()))
            result.properties.push_back(readProperty(*property, namespaceName));
    }
    return result;
}

CimInstance& requireInstance(CimBroker& broker, CimPath& path) {
    if (!path.isValid()) {
        throw CimError(
            CimStatus::InvalidParameter,
            "'" + path.toString() + "' is no object path; one reads " + "namespace:Class.Key=\"value\"");
    }
    if (CimInstance* instance = broker.getInstanceByPath(path)) return *instance;
    ServedModel(broker).requireClass(path.getClassName());
    throw CimError(CimStatus::NotFound, path.toString() + " names no instance");
}

}  // namespace core
