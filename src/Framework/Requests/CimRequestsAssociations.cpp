// SPDX-License-Identifier: Apache-2.0
// Walking associations.
#include <functional>
#include <map>
#include <set>
#include <unordered_map>

#include "Framework/Classes/InstanceList.h"
#include "Framework/Model/CimError.h"
#include "Framework/Model/CimInstance.h"
#include "Framework/Model/CimProperty.h"
#include "Framework/Requests/AnswerMeter.h"
#include "Framework/Requests/CimRequests.h"
#include "Framework/Requests/ServedClasses.h"

namespace core {

namespace {

/// A reference property of an association instance.
struct End {
    std::string role;
    CimPath path;
};

std::vector<End> endsOf(const CimInstance& association) {
    std::vector<End> ends;
    // One lock around all ends: a rebuild on another thread shows whole or not at all.
    const RecursiveLocker lock(association.getMutex());
    for (const CimProperty* property : association.getProperties()) {
        const auto* reference = dynamic_cast<const CimPropertyRef*>(property);
        if (reference != nullptr && !reference->IsNull())
            ends.push_back({property->getName(), reference->getPath()});
    }
    return ends;
}

bool isRole(const std::string& wanted, const End& end) {
    return wanted.empty() || sameName(wanted, end.role);
}

/// Visits every association instance that refers to the path in the wanted role, with the index of that end.
void visitReferences(const ServedClasses& classes, const CimPath& path, const std::string& associationClass,
                     const std::string& role,
                     const std::function<void(CimInstance&, const std::vector<End>&, std::size_t)>& visit) {
    // Every association is looked at, whatever classes it joins: only its instances tell what they refer to.
    for (const ServedClass* each : classes.associations(associationClass)) {
        for (CimInstance* instance : InstanceRange(each->object->getInstances())) {
            const std::vector<End> ends = endsOf(*instance);
            for (std::size_t i = 0; i < ends.size(); ++i) {
                if (isRole(role, ends[i]) && ends[i].path.isSameObjectAs(path)) visit(*instance, ends, i);
            }
        }
    }
}

bool leadsTo(const ServedClasses& classes, const AssociationFilter& by, const End& end) {
    if (!isRole(by.resultRole, end)) return false;
    return by.resultClass.empty() || derivesFrom(classes.chainOf(end.path.getClassName()), by.resultClass);
}

/// The path of the object that the walk starts at, which need not exist. The classes in the filter must.
CimPath startOf(const ServedClasses& classes, const CimPath& path, const AssociationFilter& by) {
    CimPath typed = classes.typed(path);
    if (!RequestScope::serves(typed.getNamespace()))
        throw CimError(CimStatus::NotFound, shownPath(typed) + " names no instance");
    for (const std::string& name : {by.associationClass, by.resultClass}) {
        if (!name.empty() && classes.chainOf(name).empty()) {
            throw CimError(CimStatus::InvalidParameter, "no class \"" + name + "\"");
        }
    }
    return typed;
}

/// The paths at the other ends, each once.
std::vector<CimPath> farEnds(const ServedClasses& classes, const CimPath& path, const AssociationFilter& by) {
    std::set<std::string> seen;
    std::vector<CimPath> result;
    visitReferences(classes, startOf(classes, path, by), by.associationClass, by.role,
                    [&](CimInstance&, const std::vector<End>& ends, std::size_t near) {
                        for (std::size_t i = 0; i < ends.size(); ++i) {
                            // An association of an object with itself is visited once for each end.
                            if (i == near || !leadsTo(classes, by, ends[i])) continue;
                            if (seen.insert(ends[i].path.toString()).second)
                                AnswerMeter::append(result, ends[i].path);
                        }
                    });
    return result;
}

/// Finds instances by their paths: one alone by its keys, many by enumerating their class once for all of
/// them. The request scope holds what it finds.
class InstanceFinder {
  public:
    explicit InstanceFinder(const std::vector<CimPath>& paths) {
        for (const CimPath& path : paths)
            ++m_wanted[foldName(path.getClassName())];
    }

    CimInstance* find(CimPath& path) {
        const std::string className = foldName(path.getClassName());
        if (m_wanted[className] == 1) return GetCimBroker()->getInstanceByPath(path);
        const auto [entry, isNew] = m_classes.try_emplace(className);
        if (isNew) enumerate(path.getClassName(), entry->second);
        const auto found = entry->second.find(path.toString());
        // A path may be spelled otherwise than its instance spells it.
        return found == entry->second.end() ? GetCimBroker()->getInstanceByPath(path) : found->second;
    }

  private:
    using Instances = std::unordered_map<std::string, CimInstance*>;

    void enumerate(const std::string& className, Instances& instances) {
        for (CimInstance* instance : InstanceRange(GetCimBroker()->getInstances(className, ""))) {
            instances.emplace(CimPath::of(*instance).toString(), instance);
        }
    }

    std::map<std::string, std::size_t> m_wanted;
    std::map<std::string, Instances> m_classes;
};

/// The association instances that refer to the path, each once.
void visitAssociations(const ServedClasses& classes, const CimPath& path, const AssociationFilter& by,
                       const std::function<void(CimInstance&, CimPath)>& visit) {
    // The results are the associations, so ResultClass means their class (DSP0200 5.4.2.10).
    const std::string& wanted = by.associationClass.empty() ? by.resultClass : by.associationClass;
    std::set<std::string> seen;
    visitReferences(classes, startOf(classes, path, by), wanted, by.role,
                    [&](CimInstance& association, const std::vector<End>&, std::size_t) {
                        CimPath own = CimPath::of(association);
                        if (seen.insert(own.toString()).second) visit(association, std::move(own));
                    });
}

}  // namespace

std::vector<InstanceValue> CimRequests::associators(const CimPath& path, const AssociationFilter& by,
                                                    const PropertyFilter& filter) {
    return answerRequest(m_namespace, [&](const ServedClasses& classes) {
        WantedProperties wanted(filter);
        std::vector<InstanceValue> result;
        std::vector<CimPath> ends = farEnds(classes, path, by);
        InstanceFinder finder(ends);
        for (CimPath& far : ends) {
            if (CimInstance* instance = finder.find(far)) {
                AnswerMeter::append(result, readInstance(*instance, std::move(far), wanted, m_namespace));
            }
        }
        return result;
    });
}

std::vector<CimPath> CimRequests::associatorNames(const CimPath& path, const AssociationFilter& by) {
    return answerRequest(m_namespace, [&](const ServedClasses& classes) {
        std::vector<CimPath> result = farEnds(classes, path, by);
        for (CimPath& far : result)
            far.completeNamespace(m_namespace);
        return result;
    });
}

std::vector<InstanceValue> CimRequests::references(const CimPath& path, const AssociationFilter& by,
                                                   const PropertyFilter& filter) {
    return answerRequest(m_namespace, [&](const ServedClasses& classes) {
        WantedProperties wanted(filter);
        std::vector<InstanceValue> result;
        visitAssociations(classes, path, by, [&](CimInstance& association, CimPath own) {
            AnswerMeter::append(result, readInstance(association, std::move(own), wanted, m_namespace));
        });
        return result;
    });
}

std::vector<CimPath> CimRequests::referenceNames(const CimPath& path, const AssociationFilter& by) {
    return answerRequest(m_namespace, [&](const ServedClasses& classes) {
        std::vector<CimPath> result;
        visitAssociations(classes, path, by, [&](CimInstance&, CimPath own) {
            own.completeNamespace(m_namespace);
            AnswerMeter::append(result, std::move(own));
        });
        return result;
    });
}

}  // namespace core
