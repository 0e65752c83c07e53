// Instances: enumerating, reading, deleting.
#include "Framework/Requests/CimRequests.h"

#include <algorithm>
#include <functional>
#include <set>

#include "Framework/Classes/RequestScope.h"
#include "Framework/Requests/RequestTools.h"
#include "Framework/Requests/ServedModel.h"

namespace core {

namespace {

/// Calls the visitor once per path; a class that lists one instance twice is no error of the client's.
void visitInstances(const ServedModel& model, const std::string& className,
                    const std::function<void(CimInstance&, CimPath)>& visit) {
    std::set<std::string> seen;
    for (const ModelClass& each : model.derivedFrom(className)) {
        auto instances = each.agent->getInstances(each.served->name);
        for (CimInstance* instance = instances.first(); instance != nullptr; instance = instances.next()) {
            CimPath path = CimPath::of(*instance);
            if (seen.insert(path.toString()).second) visit(*instance, std::move(path));
        }
    }
}

}  // namespace

const PropertyValue* InstanceValue::find(std::string_view name) const {
    const auto found = std::find_if(properties.begin(), properties.end(), [&](const PropertyValue& property) {
        return sameName(property.name, name);
    });
    return found == properties.end() ? nullptr : &*found;
}

CimRequests::CimRequests(std::string namespaceName, CimBroker* broker)
    : m_namespace(std::move(namespaceName)), m_broker(broker) {}

std::vector<InstanceValue> CimRequests::enumerateInstances(const std::string& className,
                                                           const PropertyFilter& filter) const {
    const RequestScope scope;
    return answering([&] {
        const ServedModel model(*m_broker);
        model.requireClass(className);
        std::vector<InstanceValue> result;
        visitInstances(model, className, [&](CimInstance& instance, CimPath path) {
            result.push_back(readInstance(instance, std::move(path), filter, m_namespace));
        });
        return result;
    });
}

std::vector<CimPath> CimRequests::enumerateInstanceNames(const std::string& className) const {
    const RequestScope scope;
    return answering([&] {
        const ServedModel model(*m_broker);
        model.requireClass(className);
        std::vector<CimPath> result;
        visitInstances(model, className, [&](CimInstance&, CimPath path) {
            path.completeNamespace(m_namespace);
            result.push_back(std::move(path));
        });
        return result;
    });
}

InstanceValue CimRequests::getInstance(CimPath path, const PropertyFilter& filter) const {
    const RequestScope scope;
    return answering([&] {
        CimInstance& instance = requireInstance(*m_broker, path);
        return readInstance(instance, CimPath::of(instance), filter, m_namespace);
    });
}

void CimRequests::deleteInstance(CimPath path) const {
    const RequestScope scope;
    answering([&] {
        const ServedModel model(*m_broker);
        const std::vector<ModelClass> candidates = model.named(path.getClassName());
        if (candidates.empty()) model.requireClass(path.getClassName());
        bool supported = false;
        for (const ModelClass& each : candidates) {
            if (each.served->deleteInstance == nullptr) continue;
            supported = true;
            const int code = each.served->deleteInstance(*each.served->object, path);
            if (code == 0) return;
            if (code == kDeleteNotFound) continue;
            throw CimError(CimStatus::Failed,
                           "the deletion of " + path.toString() + " ended with code " + std::to_string(code));
        }
        if (supported) throw CimError(CimStatus::NotFound, path.toString() + " names no instance");
        requireInstance(*m_broker, path);
        throw CimError(CimStatus::NotSupported, "instances of " + path.getClassName() + " cannot be deleted");
    });
}

}  // namespace core
