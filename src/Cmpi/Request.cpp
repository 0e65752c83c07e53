// SPDX-License-Identifier: Apache-2.0
#include "Cmpi/Request.h"

#include "Cmpi/Slots.h"
#include "Framework/Requests/Audit.h"
#include "Framework/Requests/Caller.h"

namespace cmpi {

namespace {

using core::CimError;
using core::CimStatus;

/// What the object manager frees at the end of the call would grow with the number of results. Where it has
/// marks, what is made in the scope goes at once.
class Temporaries {
  public:
    explicit Temporaries(const Broker& broker) : m_broker(broker) {
        if (broker.mft != nullptr && broker.mft->release != nullptr)
            m_mark = call(broker, broker.mft, &BrokerMemTable::mark, nullptr);
    }
    ~Temporaries() {
        if (m_mark != nullptr) call(m_broker, m_broker.mft, &BrokerMemTable::release, m_mark);
    }
    Temporaries(const Temporaries&) = delete;
    Temporaries& operator=(const Temporaries&) = delete;

  private:
    const Broker& m_broker;
    void* m_mark = nullptr;
};

/// The lists of names by which an instance is filtered. Object managers may go on looking at them, so they
/// have to outlive it.
struct FilterNames {
    std::vector<const char*> wanted;
    std::vector<const char*> keys;
};

/// The properties that the client gets. Given to the instance before anything is set, as object managers
/// want it.
void setFilter(Instance* instance, const core::InstanceValue& value, const core::PropertyFilter& filter,
               FilterNames& names) {
    for (const std::string& name : *filter)
        names.wanted.push_back(name.c_str());
    names.wanted.push_back(nullptr);
    for (const core::PropertyValue& property : value.properties) {
        if (property.isKey) names.keys.push_back(property.name.c_str());
    }
    names.keys.push_back(nullptr);
    call(instance, &InstanceTable::setPropertyFilter, names.wanted.data(), names.keys.data());
}

Instance* newInstance(const Place& place, const core::InstanceValue& value,
                      const core::PropertyFilter& filter, FilterNames& names) {
    Instance* instance = call(place.broker, place.broker.eft, &BrokerEncTable::newInstance,
                              newPath(place, value.path), nullptr);
    if (instance == nullptr)
        throw CimError(CimStatus::Failed,
                       "the object manager could not make an instance of " + value.path.getClassName());
    if (filter) setFilter(instance, value, filter, names);
    const core::WantedProperties wanted(filter);
    for (const core::PropertyValue& property : value.properties) {
        if (!property.isKey && !wanted.includes(property.name)) continue;
        const Given given(place, property.value);
        // A property that the object manager's classes do not have is no reason to give none of the others.
        call(instance, &InstanceTable::setProperty, property.name.c_str(), given.value(), given.type());
    }
    return instance;
}

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

void Request::take(Status status) const {
    if (status.rc == ReturnCode::Ok) return;
    throw CimError(CimStatus::Failed, "the object manager did not take a result (code " +
                                          std::to_string(static_cast<int>(status.rc)) + ")");
}

void Request::give(const core::CimPath& path) {
    const Temporaries temporaries(m_place.broker);
    take(call(m_sender.result, &ResultTable::returnObjectPath, newPath(m_place, path)));
}

void Request::give(const core::InstanceValue& instance, const core::PropertyFilter& filter) {
    FilterNames names;
    const Temporaries temporaries(m_place.broker);
    take(call(m_sender.result, &ResultTable::returnInstance, newInstance(m_place, instance, filter, names)));
}

void Request::give(core::CimType type, const core::CimScalar& value) {
    const Given given(m_place, type, value);
    take(call(m_sender.result, &ResultTable::returnData, given.value(), given.type()));
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
