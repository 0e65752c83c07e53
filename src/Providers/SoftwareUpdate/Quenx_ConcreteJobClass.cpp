// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareUpdate/Quenx_ConcreteJobClass.h"

#include "Framework/Classes/RequestScope.h"
#include "Framework/Requests/PolicyDecision.h"
#include "Providers/SoftwareUpdate/MethodResults.h"
#include "Providers/SoftwareUpdate/UpdateReport.h"

namespace {

constexpr std::uint32_t kStartTimeout = 100;  // seconds

void bringUpToDate(Quenx_ConcreteJob& job) {
    QUENX_DEBUG("Refreshing job: %s", job.getUniqId().c_str());
    try {
        // A worker cannot destroy itself, so it is kept until somebody looks at the job.
        job.threadControl(ThreadDispose, 0);
    } catch (...) {
        QUENX_DEBUG("Exception happened");
    }
    job.refresh();
}

}  // namespace

Quenx_ConcreteJobClass::Quenx_ConcreteJobClass() : m_factory(this) {}

utils::SafeList<core::CimInstance*>::Iterator Quenx_ConcreteJobClass::getInstances() {
    const utils::TimeStamp timing("ConcreteJob::getInstances");
    core::InstanceRange jobs(m_instances.getElements(false));
    QUENX_DEBUG("All jobs: %d", static_cast<int>(jobs.size()));
    for (core::CimInstance* each : jobs)
        bringUpToDate(*static_cast<Quenx_ConcreteJob*>(each));
    QUENX_DEBUG("return %d", static_cast<int>(m_instances.size()));
    return m_instances.getElements(false);
}

core::CimInstance* Quenx_ConcreteJobClass::findInstance(const core::CimPath& path) {
    auto* job = static_cast<Quenx_ConcreteJob*>(m_instances.find(path));
    if (job != nullptr) bringUpToDate(*job);
    return job;
}

int Quenx_ConcreteJobClass::verifyOrCreateNewJob(std::string adapterName, std::string uri,
                                                 std::vector<std::uint16_t>& installOptions,
                                                 std::vector<std::string>& installOptionValues,
                                                 Quenx_ConcreteJob*& job, bool create) {
    const utils::TimeStamp timing("Quenx_ConcreteJobClass::createNewJob");
    const core::RequestScope scope;  // a client may delete the job as soon as it is listed
    job = nullptr;
    return resultOf([&]() -> int {
        UpdateOrder order{std::move(adapterName), std::move(uri), installOptions, installOptionValues};
        if (create) return createJob(order, job);
        verifyImage(order).claim.releaseIfConfigured();
        return VerifyJobResult::Success;
    });
}

int Quenx_ConcreteJobClass::createJob(UpdateOrder& order, Quenx_ConcreteJob*& job) {
    // Taken even if no job comes of it, so ids can have gaps.
    const std::int32_t id = m_nextJobId++;
    QUENX_DEBUG("Creating new job for %s with id #%d", order.adapterName.c_str(), id);
    auto* created = new Quenx_ConcreteJob(order.adapterName, id, order.uri, order.options, order.values);
    bool listed = false;
    try {
        // Listed before it starts: whoever hears of its end must find it.
        m_instances.add(created);
        listed = true;
        created->refresh();
        // Before the flash, so that one that never ends has its record.
        if (!UpdateReport::begin(*created)) {
            created->setJobState(JobStateException);  // gives the claim back; nobody has been told of it
            m_instances.remove(created);
            return VerifyJobResult::UnspecifiedError;
        }
        created->events().created();
        utils::Time timeout;
        timeout.setIntervalInSeconds(kStartTimeout);
        if (created->requestStateChange(RequestedStateStart, timeout) == 0) {
            job = created;
            return VerifyJobResult::Success;
        }
    } catch (...) {
        if (listed) unlist(*created);
        // Where listing it failed, the job has gone already, and only the name is left.
        AdapterClaim::releaseIfConfigured(Quenx_ConcreteJob::m_servicedAdapter, order.adapterName);
        throw;
    }
    core::NotedCall::noteReason(core::ReasonId::WorkerNotStarted);
    // Its destruction waits for a thread that never ran, so it is left to the list's release.
    unlist(*created);
    return VerifyJobResult::JobStartFailed;
}

void Quenx_ConcreteJobClass::unlist(Quenx_ConcreteJob& job) {
    const JobEvents::Deletion told(job.events());
    m_instances.remove(&job);
}

int Quenx_ConcreteJobClass::DeleteInstance(core::CimPath& path) {
    QUENX_DEBUG("DeleteInstance");
    const core::PolicyDecision decision;  // for callers that come without the request layer
    const core::RequestScope scope;       // another request may delete the same job meanwhile
    QUENX_DEBUG("All jobs: %d", static_cast<int>(m_instances.size()));
    Quenx_ConcreteJob* job = nullptr;
    try {
        job = dynamic_cast<Quenx_ConcreteJob*>(core::GetCimBroker()->getInstanceByPath(path));
    } catch (...) {
        // The same as a path that names nothing.
    }
    if (job == nullptr) {
        // Word for word what those who watch the log look for; the last place never had a value.
        QUENX_ERROR("Quenx_ConcreteJobe_Provider.DeleteInstance: instance not found '%s' (%%s)",
                    path.toString().c_str());
        return core::kDeleteNotFound;
    }
    QUENX_DEBUG("Removing job: %s", job->getUniqId().c_str());
    // The job is not stopped: a flash that breaks off leaves a card without firmware.
    const JobEvents::Deletion told(job->events());
    job->setDeleted(true);
    return 0;
}
