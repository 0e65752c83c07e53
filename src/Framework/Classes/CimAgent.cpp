// SPDX-License-Identifier: Apache-2.0
#include "Framework/Classes/CimAgent.h"

#include "Framework/Classes/CimBroker.h"
#include "Framework/Classes/InstanceReaper.h"
#include "Framework/Model/CimInstance.h"

namespace core {

CimAgent::CimAgent(std::string providerName) : m_providerName(std::move(providerName)) {
    // An agent of static storage that is never unloaded destroys its instances when the process exits.
    prepareReaper();
}

CimAgent::~CimAgent() {
    leaveBroker();
}

bool CimAgent::isClassSupported(std::string className) {
    return m_classes.find(className) != nullptr;
}

utils::SafeList<CimInstance*>::Iterator CimAgent::getInstances(std::string className) {
    if (const ServedClass* served = m_classes.find(className)) return served->object->getInstances();
    using List = utils::SafeList<CimInstance*>;
    return List::Iterator(std::make_unique<List::SimpleIteratorImplementation>(nullptr));
}

void CimAgent::createInstance(CimInstance* instance) {
    if (const ServedClass* served = m_classes.find(instance->getClassName()))
        served->object->createInstance(instance);
}

void CimAgent::enableIndications(std::string className) {
    if (const ServedClass* served = m_classes.find(className)) served->object->enableIndications();
}

void CimAgent::disableIndications(std::string className) {
    if (const ServedClass* served = m_classes.find(className)) served->object->disableIndications();
}

void CimAgent::leaveBroker() noexcept {
    GetCimBroker()->removeAgent(this);
    m_classes.clear();
    drainReaper();
}

}  // namespace core
