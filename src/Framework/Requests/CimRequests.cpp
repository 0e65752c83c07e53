// SPDX-License-Identifier: Apache-2.0
// Instances: enumerating, reading, deleting. And the classes that they are of.
#include "Framework/Requests/CimRequests.h"

#include <functional>
#include <map>
#include <set>

#include "Framework/Classes/InstanceList.h"
#include "Framework/Model/CimError.h"
#include "Framework/Requests/ServedClasses.h"

namespace core {

namespace {

/// Calls the visitor once per path: two agents may serve the same instance, or one class list it twice.
void visitInstances(const ServedClasses& classes, const std::string& className,
                    const std::function<void(CimInstance&, CimPath)>& visit) {
    std::set<std::string> seen;
    for (const ServedClass* each : classes.derivedFrom(className)) {
        for (CimInstance* instance : InstanceRange(each->object->getInstances())) {
            CimPath path = CimPath::of(*instance);
            if (seen.insert(path.toString()).second) visit(*instance, std::move(path));
        }
    }
}

}  // namespace

CimOperations::~CimOperations() = default;

CimRequests::CimRequests(std::string namespaceName)
    : CimRequests(std::move(namespaceName), *GetCimBroker()) {}

CimRequests::CimRequests(std::string namespaceName, CimBroker& broker)
    : m_namespace(std::move(namespaceName)), m_broker(broker) {}

CimRequests::~CimRequests() = default;

std::vector<InstanceValue> CimRequests::enumerateInstances(const std::string& className,
                                                           const PropertyFilter& filter) {
    const ServedClasses classes(m_broker);
    return withCimErrors([&] {
        std::vector<InstanceValue> result;
        visitInstances(classes, className, [&](CimInstance& instance, CimPath path) {
            result.push_back(readInstance(instance, std::move(path), filter, m_namespace));
        });
        return result;
    });
}

std::vector<CimPath> CimRequests::enumerateInstanceNames(const std::string& className) {
    const ServedClasses classes(m_broker);
    return withCimErrors([&] {
        std::vector<CimPath> result;
        visitInstances(classes, className, [&](CimInstance&, CimPath path) {
            path.completeNamespace(m_namespace);
            result.push_back(std::move(path));
        });
        return result;
    });
}

InstanceValue CimRequests::getInstance(const CimPath& path, const PropertyFilter& filter) {
    const ServedClasses classes(m_broker);
    return withCimErrors([&] {
        CimPath typed = classes.typed(path);
        CimInstance& instance = classes.requireInstance(typed);
        return readInstance(instance, CimPath::of(instance), filter, m_namespace);
    });
}

void CimRequests::deleteInstance(const CimPath& path) {
    const ServedClasses classes(m_broker);
    withCimErrors([&] {
        CimPath typed = classes.typed(path);
        bool isSupported = false;
        for (const ServedClass* each : classes.named(typed.getClassName())) {
            if (each->deleteInstance == nullptr) continue;
            isSupported = true;
            const int code = each->deleteInstance(*each->object, typed);
            if (code == 0) return;
            // Another agent that serves the class may have it.
            if (code == kDeleteNotFound) continue;
            throw CimError(CimStatus::Failed, "the deletion of " + typed.toString() + " ended with code " +
                                                  std::to_string(code));
        }
        if (isSupported) throw CimError(CimStatus::NotFound, typed.toString() + " names no instance");
        classes.requireInstance(typed);
        throw CimError(CimStatus::NotSupported,
                       "instances of " + typed.getClassName() + " cannot be deleted");
    });
}

ClassChain CimRequests::getClass(const std::string& className) {
    return ServedClasses(m_broker).chainOf(className);
}

std::vector<ClassChain> CimRequests::enumerateClasses(const std::string& className, bool deep) {
    const ServedClasses classes(m_broker);
    if (!className.empty()) classes.requireChain(className);
    // By name, since many served classes share their superclasses.
    std::map<std::string, ClassChain> found;
    for (const ClassChain* chain : classes.chains()) {
        for (auto first = chain->begin(); first != chain->end(); ++first) {
            ClassChain rest(first, chain->end());
            if (isBelow(rest, className, deep)) found.emplace((*first)->name, std::move(rest));
        }
    }
    std::vector<ClassChain> result;
    for (auto& [name, chain] : found)
        result.push_back(std::move(chain));
    return result;
}

}  // namespace core
