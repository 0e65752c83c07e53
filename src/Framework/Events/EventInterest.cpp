// SPDX-License-Identifier: Apache-2.0
#include "Framework/Events/EventInterest.h"

#include <algorithm>
#include <exception>

#include "Framework/Classes/CimBroker.h"
#include "Framework/Events/EventTable.h"
#include "Framework/Model/CimError.h"
#include "Utils/Log.h"

namespace core {

namespace {

/// One beginning or end at a time, so that an agent hears of them in their order. Held while agents are
/// called.
utils::Mutex switching;

std::vector<std::string> servedClassesOf(const std::string& className) {
    std::vector<std::string> names;
    for (const AgentUse& use : GetCimBroker()->useAgents()) {
        for (const ServedClass* each : use.agent().getClasses().getAll()) {
            const bool isKnown =
                std::ranges::any_of(names, [&](const auto& name) { return sameName(name, each->name); });
            if (!isKnown && derivesFrom(each->chain, className)) names.push_back(each->name);
        }
    }
    return names;
}

void switchAgents(const std::string& className, void (CimAgent::*call)(std::string)) {
    for (const AgentUse& use : GetCimBroker()->useAgents()) {
        if (use.agent().getClasses().find(className) != nullptr) (use.agent().*call)(className);
    }
}

void disable(const std::string& className) noexcept {
    try {
        switchAgents(className, &CimAgent::disableIndications);
    } catch (const std::exception& error) {
        QUENX_ERROR("Indications of %s could not be disabled: %s", className.c_str(), error.what());
    } catch (...) {
        QUENX_ERROR("Indications of %s could not be disabled", className.c_str());
    }
}

void endInterest(const std::vector<std::string>& classes) noexcept {
    EventTable& table = EventTable::theOne();
    for (const std::string& each : classes)
        if (table.dropInterest(each)) disable(each);
    table.stopWhereNobodyListens();
}

}  // namespace

EventInterest::EventInterest(const std::string& className) {
    const RequestScope scope;
    const std::vector<std::string> served = servedClassesOf(className);
    if (served.empty()) {
        throw CimError(CimStatus::InvalidClass, "no class \"" + className + "\" is served, whose instances " +
                                                    "anybody could be told of");
    }
    const utils::Mutex::AutoLocker lock(switching);
    EventTable& table = EventTable::theOne();
    m_classes.reserve(served.size());
    try {
        for (const std::string& each : served) {
            const bool isFirst = table.addInterest(each);
            m_classes.push_back(each);
            if (isFirst) switchAgents(each, &CimAgent::enableIndications);
        }
        table.startWhereSomebodyListens();
    } catch (...) {
        endInterest(m_classes);
        throw;
    }
}

EventInterest::~EventInterest() {
    const RequestScope scope;
    const utils::Mutex::AutoLocker lock(switching);
    endInterest(m_classes);
}

}  // namespace core
