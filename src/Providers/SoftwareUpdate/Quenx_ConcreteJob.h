// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <atomic>
#include <cstdint>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "Framework/Model/CimClassInfo.h"
#include "Providers/Schema/CIM_ConcreteJob.h"
#include "Providers/Schema/ValueMaps.h"
#include "Providers/SoftwareUpdate/AdapterClaim.h"
#include "Providers/SoftwareUpdate/JobEvents.h"
#include "Utils/FirmwareTypes.h"
#include "Utils/Os/Linux/Mutex.h"
#include "Utils/Os/Linux/linux.h"
#include "Utils/Time.h"

namespace core {
class UpdateRecord;
}
class JobThread;
struct VerifiedImage;

/// The requested states of jobs; only Start is accepted.
enum RequestedState : std::uint16_t { RequestedStateStart = 2 };

enum ThreadOperationCommand : int {
    ThreadStart = 1,
    ThreadTerminate = 2,  ///< wait for the worker; nothing stops a flash
    ThreadDispose = 3,    ///< destroy the worker if it has finished
};

/// One firmware update of one adapter, from the verified image to its end. Thread-safe.
class Quenx_ConcreteJob : public CIM_ConcreteJob {
  public:
    static constexpr core::CimClassInfo classInfo{"Quenx_ConcreteJob", &CIM_ConcreteJob::classInfo};

    /// The adapter that is being serviced; empty when none is. In the library only AdapterClaim writes
    /// it; tests set it directly.
    static utils::Atomic<std::string> m_servicedAdapter;

    /// Verifies the image and claims the adapter; throws what verifyImage() throws. Creates the worker but
    /// does not start it.
    Quenx_ConcreteJob(std::string adapterName, int jobId, std::string& uri,
                      std::vector<std::uint16_t>& installOptions,
                      std::vector<std::string>& installOptionValues);

    std::string getClassName() const override { return classInfo.name; }
    /// Waits for a worker that has been started, and so for a flash that has begun.
    ~Quenx_ConcreteJob() override;

    /// Sets every property from the current state, or leaves them if they tell the job's end already. Asks
    /// the adapter API for the progress of a running job.
    virtual void refresh();
    /// The one way to the worker; one command at a time per job. The time-out is in milliseconds and matters
    /// to ThreadTerminate only. False when a start failed, a termination timed out, or there was nothing to
    /// do.
    virtual bool threadControl(ThreadOperationCommand command, int timeout);

    using core::CimInstance::releaseTime;

    std::string getUniqId() const;
    std::string getAdapterName() const { return m_adapterName; }
    std::vector<utils::FirmwareType> getImageTypes() const { return m_imageTypes; }
    /// The prepared image; owned by the job and freed when it ends.
    const std::uint8_t* getFlashImage() const;
    std::uint32_t getFlashImageSize() const;
    JobStateVal getJobState() const;

    /// Keeps what the adapter API reported; the code is served cut to 16 bits.
    void setLastError(std::uint32_t code, std::string text);
    /// What the history has of this update; to be set before the worker starts, null for nothing.
    void setRecord(std::shared_ptr<core::UpdateRecord> record) { m_record = std::move(record); }
    /// The flash has ended, and the last error is that of its end.
    void endRecord(bool succeeded);
    /// What is told of it to those who listen.
    JobEvents& events() { return m_events; }
    /// Enters a state, and tells of it. Ending the job frees the image and the adapter claim in the same
    /// step, so that whoever sees the end can start the next update.
    void setJobState(JobStateVal state);
    /// 0 accepted, 4 the worker could not be started, 5 no such request, 4097 the job is not New. The
    /// time-out is accepted and ignored.
    unsigned int requestStateChange(RequestedState state, utils::Time timeout);
    /// 100 for a job that has ended, well or not.
    std::uint16_t getPercentComplete();

    /// The image types that the options ask for. For a type that is not known it gives the serviced adapter
    /// back, whoever claimed it, and throws utils::EInvalidParameter.
    static std::vector<utils::FirmwareType> getTargetTypes(std::vector<std::uint16_t>& installOptions,
                                                           std::vector<std::string>& installOptionValues);
    /// verifyImage() for callers that keep the claim to themselves: the adapter stays claimed until
    /// m_servicedAdapter is emptied.
    /// @param image,imageSize,imageTypes  set on success
    static void checkAndVerifyImage(std::string adapterName, std::string& uri,
                                    std::vector<std::uint16_t>& installOptions,
                                    std::vector<std::string>& installOptionValues,
                                    std::unique_ptr<std::uint8_t[]>& image, std::uint32_t& imageSize,
                                    std::vector<utils::FirmwareType>& imageTypes);

  private:
    /// When the construction began, by the clock and by what the clock's being set does not touch.
    struct Beginning {
        utils::Time time;
        std::uint64_t monotonic = os::getMonotonicuSeconds();
    };
    Quenx_ConcreteJob(const Beginning& beginning, VerifiedImage verified, std::string adapterName, int jobId);

    void enterState(JobStateVal state);
    /// True for the one caller who may start the job.
    bool claimStart();
    utils::Time timeSinceStart() const;

    const std::string m_adapterName;
    const int m_jobId;
    std::unique_ptr<JobThread> m_myThread QUENX_GUARDED_BY(m_jobMutex);
    std::unique_ptr<std::uint8_t[]> m_flashImage QUENX_GUARDED_BY(m_stateMutex);
    std::uint32_t m_flashImageSize QUENX_GUARDED_BY(m_stateMutex) = 0;
    std::vector<utils::FirmwareType> m_imageTypes;  ///< set by the constructor only
    std::shared_ptr<core::UpdateRecord> m_record;   ///< set before the worker starts
    const Beginning m_beginning;
    utils::Time m_elapsedTime QUENX_GUARDED_BY(m_stateMutex);
    JobStateVal m_jobState QUENX_GUARDED_BY(m_stateMutex) = JobStateNew;
    bool m_startClaimed QUENX_GUARDED_BY(m_stateMutex) = false;
    bool m_adapterGivenUp QUENX_GUARDED_BY(m_stateMutex) = false;
    AdapterClaim m_claim QUENX_GUARDED_BY(m_stateMutex){m_servicedAdapter};
    utils::Mutex m_jobMutex;  ///< one thread operation at a time
    utils::Time m_timeOfLastStateChange QUENX_GUARDED_BY(m_stateMutex){0ULL};
    std::uint32_t m_lastErrorCode QUENX_GUARDED_BY(m_stateMutex) = 0;
    std::string m_lastErrorText QUENX_GUARDED_BY(m_stateMutex);
    std::uint32_t m_percentComplete QUENX_GUARDED_BY(m_stateMutex) = 0;
    /// The properties say how the job ended, so a refresh would change nothing. False again with any change.
    std::atomic<bool> m_isEndServed{false};
    mutable utils::Mutex m_stateMutex;  ///< what the worker writes and requests read; held for moments only
    JobEvents m_events{*this};
};
