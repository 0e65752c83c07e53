#include "Framework/Requests/ServedModel.h"

#include <algorithm>
#include <iterator>

#include "Framework/Model/CimError.h"

namespace core {

ServedModel::ServedModel(CimBroker& broker) : m_uses(broker.useAgents()) {
    for (const AgentUse& use : m_uses) {
        for (const ServedClass* served : use.agent().getClasses().getAll()) {
            m_classes.push_back({&use.agent(), served});
        }
    }
}

std::vector<ModelClass> ServedModel::derivedFrom(std::string_view className) const {
    std::vector<ModelClass> result;
    std::copy_if(
        m_classes.begin(), m_classes.end(), std::back_inserter(result),
        [&](const ModelClass& candidate) { return derivesFrom(candidate.served->chain, className); });
    return result;
}

std::vector<ModelClass> ServedModel::named(std::string_view className) const {
    std::vector<ModelClass> result;
    std::copy_if(m_classes.begin(), m_classes.end(), std::back_inserter(result),
                 [&](const ModelClass& candidate) { return sameName(candidate.served->name, className); });
    return result;
}

std::vector<ModelClass> ServedModel::associations(std::string_view className) const {
    std::vector<ModelClass> result;
    for (const ModelClass& candidate : m_classes) {
        const ClassChain& chain = candidate.served->chain;
        const bool isAssociation = std::any_of(
            chain.begin(), chain.end(), [](const auto& declaration) { return declaration->isAssociation; });
        if (isAssociation && (className.empty() || derivesFrom(chain, className)))
            result.push_back(candidate);
    }
    return result;
}

void ServedModel::requireClass(std::string_view className) const {
    if (!derivedFrom(className).empty()) return;
    throw CimError(CimStatus::InvalidClass, "no class " + std::string(className) + " is served");
}

ClassChain ServedModel::chainOf(std::string_view className) const {
    for (const ModelClass& candidate : m_classes) {
        const ClassChain& chain = candidate.served->chain;
        const auto found = std::find_if(chain.begin(), chain.end(), [&](const auto& declaration) {
            return sameName(declaration->name, className);
        });
        if (found != chain.end()) return {found, chain.end()};
    }
    return {};
}

}  // namespace core
