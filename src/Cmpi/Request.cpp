// SPDX-License-Identifier: Apache-2.0
#include "Cmpi/Request.h"

#include "Cmpi/BrokerScopes.h"
#include "Cmpi/Instances.h"
#include "Cmpi/Slots.h"
#include "Framework/Requests/Audit.h"
#include "Framework/Requests/Caller.h"

namespace cmpi {

namespace {

using core::CimError;

constexpr const char* kResult = "a result";

/// The namespace of the call; that which is served where the object manager does not say.
std::string requestedNamespace(const ObjectPath* object, const std::string& served) {
    const std::string given = textOf(call(object, &ObjectPathTable::getNameSpace, nullptr));
    return given.empty() ? served : given;
}

}  // namespace

Request::Request(const Sender& sender)
    : m_sender(sender),
      m_use(sender.interface),
      m_place{Front::theOne().broker(), requestedNamespace(sender.object, operations().getNamespace()),
              operations().getNamespace()},
      m_scope(caller()),
      m_object(pathFrom(m_place, sender.object)) {}

void Request::give(const core::CimPath& path) {
    const Temporaries temporaries(m_place.broker);
    requireTaken(call(m_sender.result, &ResultTable::returnObjectPath, newPath(m_place, path)), kResult);
}

void Request::give(const core::InstanceValue& instance, const core::PropertyFilter& filter) {
    FilterNames names;
    const Temporaries temporaries(m_place.broker);
    requireTaken(
        call(m_sender.result, &ResultTable::returnInstance, newInstance(m_place, instance, filter, names)),
        kResult);
}

void Request::give(core::CimType type, const core::CimScalar& value) {
    const Given given(m_place, type, value);
    requireTaken(call(m_sender.result, &ResultTable::returnData, given.value(), given.type()), kResult);
}

std::string Request::contextEntry(const char* name) const {
    const core::CimValue value =
        valueFrom(m_place, call(m_sender.context, &ContextTable::getEntry, name, nullptr));
    const std::string* text = value.get<std::string>();
    return text == nullptr ? "" : *text;
}

core::Caller Request::caller() const {
    const BrokerTable* table = m_place.broker.bft;
    const std::string manager = "cmpi:" + textOf(table == nullptr ? nullptr : table->brokerName);
    return {.principal = contextEntry("CMPIPrincipal"), .address = manager, .front = manager};
}

void Request::audited(const std::string& operation, const std::vector<core::Argument>& arguments,
                      const std::function<std::string()>& work) const {
    core::CimPath target = m_object;
    target.setNamespace(m_place.requested);
    core::AuditEvent event{core::CallerScope::current(), operation, target.toString(), ""};
    const core::NotedCall noted;
    try {
        event.outcome = work();
        event.notes = noted.notes();
    } catch (const CimError& error) {
        event.outcome = core::outcomeOf(error.status(), error.what());
        event.notes = noted.notes();
        core::audit(event, arguments);
        throw;
    }
    core::audit(event, arguments);
}

core::PropertyFilter filterFrom(const char** names) {
    if (names == nullptr) return std::nullopt;
    std::vector<std::string> filter;
    for (; *names != nullptr; ++names)
        filter.emplace_back(*names);
    return filter;
}

}  // namespace cmpi
