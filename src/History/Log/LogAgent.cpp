// SPDX-License-Identifier: Apache-2.0
#include "History/Log/LogAgent.h"

#include <algorithm>
#include <atomic>

#include "Framework/Requests/Caller.h"
#include "History/Log/LogClasses.h"
#include "Providers/ClassObjects.h"
#include "Utils/Os/Linux/PolicyFile.h"

namespace history {

namespace {

constexpr const char* kProviderName = "Update History";

std::shared_ptr<const utils::Policy> policyOfProcess() try {
    utils::PolicyFile* const file = utils::PolicyFile::ofProcess();
    return file == nullptr ? std::make_shared<utils::Policy>() : file->current();
} catch (const utils::PolicyError&) {
    return std::make_shared<utils::Policy>();
}

/// Those whom the front knows as administrators, and those whom the policy names.
bool isAdministrator(const core::Caller& caller) {
    if (caller.isAdministrator) return true;
    const auto policy = policyOfProcess();
    return !caller.principal.empty() && policy->administrators &&
           std::ranges::find(*policy->administrators, caller.principal) != policy->administrators->end();
}

class LogClass : public ListedClass<Quenx_RecordLog> {
  public:
    explicit LogClass(std::shared_ptr<History> history) : m_history(std::move(history)) {}

    core::InstanceList::Iterator getInstances() override {
        Rebuild rebuilt(m_instances);
        rebuilt.add<Quenx_RecordLog>().refresh(m_history->count(), policyOfProcess()->historyRecords);
        return rebuilt.publish();
    }

  private:
    const std::shared_ptr<History> m_history;
};

/// With a list for each kind of caller, so that what one may see reaches no other.
class EntryClass : public ListedClass<Quenx_LogEntry> {
  public:
    explicit EntryClass(std::shared_ptr<History> history) : m_history(std::move(history)) {}

    core::InstanceList::Iterator getInstances() override {
        const bool showsPersons = isAdministrator(core::CallerScope::current());
        Rebuild rebuilt(showsPersons ? m_instances : m_forOthers);
        for (const Record& record : m_history->find({.most = kServedRecords}))
            rebuilt.add<Quenx_LogEntry>().refresh(record, showsPersons);
        return rebuilt.publish();
    }

  private:
    const std::shared_ptr<History> m_history;
    core::InstanceList m_forOthers;
};

class ManagesClass : public ListedClass<Quenx_LogManagesRecord> {
  public:
    core::InstanceList::Iterator getInstances() override {
        const InstancesOf<Quenx_RecordLog> logs(Quenx_RecordLog::classInfo.name, kProviderName);
        const InstancesOf<Quenx_LogEntry> entries(Quenx_LogEntry::classInfo.name, kProviderName);
        Rebuild rebuilt(m_instances);
        for (const Quenx_LogEntry* entry : entries) {
            auto& association = rebuilt.add<Quenx_LogManagesRecord>();
            association.Log.refer(*logs.first());
            association.Record.refer(*entry);
        }
        return rebuilt.publish();
    }
};

class LogAgent : public core::CimAgent {
  public:
    explicit LogAgent(const std::shared_ptr<History>& history) : CimAgent(kProviderName) {
        core::GetCimBroker()->addAgent(this);
        m_classes.add(new LogClass(history));
        m_classes.add(new EntryClass(history));
        m_classes.add(new ManagesClass);
    }
    ~LogAgent() override { leaveBroker(); }
};

std::atomic<LogAgent*> agentOfProcess{nullptr};

void endAgent() {
    delete agentOfProcess.exchange(nullptr);
}

/// A session that is still open at the end of the process may end after the broker, which must know no agent
/// then.
struct EndOfProcess {
    ~EndOfProcess() { endAgent(); }
};

}  // namespace

void serveLog(core::ProviderSession& session, const std::shared_ptr<History>& history) {
    if (history == nullptr || !policyOfProcess()->historyServed) return;
    agentOfProcess = new LogAgent(history);
    static const EndOfProcess end;  // made after the broker, so ends before it
    session.serve(std::shared_ptr<void>(agentOfProcess.load(), [](void*) { endAgent(); }));
}

}  // namespace history
