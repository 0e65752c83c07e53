// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <atomic>
#include <string>
#include <vector>

#include "Providers/ClassObjects.h"
#include "Providers/SoftwareUpdate/ImageVerification.h"
#include "Providers/SoftwareUpdate/Quenx_ConcreteJob.h"
#include "Utils/Singleton.h"

/// How the installation methods reach the job registry. The registry owns its factory; constructing it makes
/// it the current one.
class ConcreteJobFactory : public utils::Singleton<ConcreteJobFactory> {
  public:
    explicit ConcreteJobFactory(core::CimClass* cimClass) : m_cimClass(cimClass) {}

    /// The registry; not owned.
    core::CimClass* getCimClass() const { return m_cimClass; }

    static const char* GetSingletonName() { return "ConcreteJobFactory"; }

  private:
    core::CimClass* m_cimClass;
};

/// The registry of all jobs. Jobs stay listed until a client deletes them; ids start at 1 with every load of
/// the library. Thread-safe.
class Quenx_ConcreteJobClass : public ListedClass<Quenx_ConcreteJob> {
  public:
    Quenx_ConcreteJobClass();

    /// Refreshes every job, and disposes of workers that have finished.
    utils::SafeList<core::CimInstance*>::Iterator getInstances() override;

    /// Does the same for the one job that the path names; null when it names none.
    core::CimInstance* findInstance(const core::CimPath& path);

    /// Verifies an image for an adapter, and with `create` makes a job of it and starts it. Never throws for
    /// a refusal: returns a VerifyJobResult code.
    /// @param job  set with `create` and code 0 only, else null; stays owned by the registry
    /// A successful check without `create` leaves the adapter claimed: no update can start until the process
    /// ends, unless the configuration says ReleaseClaimAfterCheck.
    virtual int verifyOrCreateNewJob(std::string adapterName, std::string uri,
                                     std::vector<std::uint16_t>& installOptions,
                                     std::vector<std::string>& installOptionValues, Quenx_ConcreteJob*& job,
                                     bool create);

    /// 0, or 90 when the path names no job. The job disappears at once; a flash that has begun goes on to its
    /// end.
    int DeleteInstance(core::CimPath& path);

    /// Lists a job that was built elsewhere; takes ownership.
    void addJob(Quenx_ConcreteJob* job) { m_instances.add(job); }

  private:
    int createJob(UpdateOrder& order, Quenx_ConcreteJob*& job);
    void unlist(Quenx_ConcreteJob& job);

    std::atomic<std::int32_t> m_nextJobId{1};
    ConcreteJobFactory m_factory;
};
