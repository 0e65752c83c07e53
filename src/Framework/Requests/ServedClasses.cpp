// SPDX-License-Identifier: Apache-2.0
#include "Framework/Requests/ServedClasses.h"

#include <algorithm>
#include <iterator>

#include "Framework/Requests/CimOperations.h"

namespace core {

ServedClasses::ServedClasses(const std::string& servedNamespace) : m_scope(servedNamespace) {
    // The scope goes on using the agents.
    for (const AgentUse& use : GetCimBroker()->useAgents()) {
        const auto classes = use.agent().getClasses().getAll();
        m_classes.insert(m_classes.end(), classes.begin(), classes.end());
    }
    for (const ServedClass* each : m_classes) {
        m_chains.push_back(&each->chain);
        for (const ClassChain& mentioned : each->mentioned)
            m_chains.push_back(&mentioned);
    }
}

template <class Predicate>
std::vector<const ServedClass*> ServedClasses::select(Predicate&& isSelected) const {
    std::vector<const ServedClass*> result;
    std::copy_if(m_classes.begin(), m_classes.end(), std::back_inserter(result),
                 [&](const ServedClass* each) { return isSelected(*each); });
    return result;
}

std::vector<const ServedClass*> ServedClasses::derivedFrom(std::string_view className) const {
    auto result = select([&](const ServedClass& each) { return core::derivesFrom(each.chain, className); });
    if (result.empty()) requireChain(className);
    return result;
}

std::vector<const ServedClass*> ServedClasses::named(std::string_view className) const {
    return select([&](const ServedClass& each) { return sameName(each.name, className); });
}

std::vector<const ServedClass*> ServedClasses::associations(std::string_view className) const {
    return select([&](const ServedClass& each) {
        return isAssociation(each.chain) && (className.empty() || core::derivesFrom(each.chain, className));
    });
}

ClassChain ServedClasses::chainOf(std::string_view className) const {
    for (const ClassChain* chain : m_chains) {
        const auto found = std::find_if(chain->begin(), chain->end(), [&](const auto& declaration) {
            return sameName(declaration->name, className);
        });
        if (found != chain->end()) return {found, chain->end()};
    }
    return {};
}

ClassChain ServedClasses::requireChain(std::string_view className) const {
    ClassChain chain = chainOf(className);
    if (!chain.empty()) return chain;
    throw CimError(CimStatus::InvalidClass, "no class \"" + std::string(className) + "\" is served");
}

CimPath ServedClasses::typed(const CimPath& path) const {
    return typedPath(path, [this](const std::string& name) { return chainOf(name); });
}

CimInstance& ServedClasses::requireInstance(CimPath& path) const {
    if (CimInstance* instance = GetCimBroker()->getInstanceByPath(path)) return *instance;
    throw CimError(CimStatus::NotFound, shownPath(path) + " names no instance");
}

}  // namespace core
