// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareUpdate/Quenx_ConcreteJob.h"

#include <optional>

#include "Framework/Model/CimClassInfo.h"
#include "Framework/Requests/UpdateSink.h"
#include "MidAPI/ma.h"
#include "Providers/ClassObjects.h"
#include "Providers/SoftwareUpdate/ImageVerification.h"
#include "Providers/SoftwareUpdate/JobThread.h"
#include "Utils/Exception.h"
#include "Utils/Os/Linux/linux.h"
#include "Utils/Utils.h"

namespace {

constexpr unsigned int kStartFailed = 4;
constexpr unsigned int kUnsupportedState = 5;
constexpr unsigned int kInvalidStateTransition = 4097;
constexpr std::uint16_t kWholePercent = 100;
constexpr std::uint16_t kOperationalStatusOk = 2;
/// Only reported: nothing removes a job but its client.
constexpr std::uint64_t kFiveMinutes = 300000000;

/// No further change will come.
bool hasEnded(JobStateVal state) {
    return state == JobStateCompleted || state == JobStateException;
}

/// Whether a job gives up its adapter in this state, which a job that is shutting down does before its end;
/// nothing for values that say neither. Nothing enters Terminated or Killed, and they keep the adapter.
std::optional<bool> givesUpTheAdapter(JobStateVal state) {
    switch (state) {
        case JobStateShuttingDown:
        case JobStateCompleted:
        case JobStateException:
            return true;
        case JobStateNew:
        case JobStateStarting:
        case JobStateRunning:
        case JobStateSuspended:
        case JobStateTerminated:
        case JobStateKilled:
        case JobStateService:
        case JobStateQueryPending:
            return false;
    }
    return std::nullopt;
}

}  // namespace

// Built before, and so destroyed after, the agent at file scope: its destruction waits for workers that end
// their jobs.
__attribute__((init_priority(1000))) utils::Atomic<std::string> Quenx_ConcreteJob::m_servicedAdapter;

Quenx_ConcreteJob::Quenx_ConcreteJob(std::string adapterName, int jobId, std::string& uri,
                                     std::vector<std::uint16_t>& installOptions,
                                     std::vector<std::string>& installOptionValues)
    // Braces go from left to right. A refusal does not pay for the properties of a job.
    : Quenx_ConcreteJob{Beginning{}, verifyImage({adapterName, uri, installOptions, installOptionValues}),
                        std::move(adapterName), jobId} {}

Quenx_ConcreteJob::Quenx_ConcreteJob(const Beginning& beginning, VerifiedImage verified,
                                     std::string adapterName, int jobId) try
    : m_adapterName(std::move(adapterName)),
      m_jobId(jobId),
      m_flashImage(std::move(verified.image.bytes)),
      m_flashImageSize(verified.image.size),
      m_imageTypes(std::move(verified.image.types)),
      m_beginning(beginning) {
    // For its worker, and so for a flash: no request may be the one that waits.
    setDestructionWaits();
    verified.claim.passTo(fmt("Quenx:%s", getUniqId().c_str()));
    m_myThread = std::make_unique<JobThread>(this);
    // What verification took. The end of the job sets it again.
    m_elapsedTime = timeSinceStart();
    m_claim = std::move(verified.claim);
} catch (...) {
    verified.claim.releaseIfConfigured();
}

Quenx_ConcreteJob::~Quenx_ConcreteJob() {
    // The worker uses everything else here, so it ends first.
    m_myThread.reset();
}

std::string Quenx_ConcreteJob::getUniqId() const {
    return utils::formatStr("FirmwareUpdate@Job#%d", m_jobId);
}

utils::Time Quenx_ConcreteJob::timeSinceStart() const {
    // Not the difference of two times of day, between which the clock may have been set.
    return utils::Time(os::getMonotonicuSeconds() - m_beginning.monotonic);
}

const std::uint8_t* Quenx_ConcreteJob::getFlashImage() const {
    const utils::Mutex::AutoLocker lock(m_stateMutex);
    return m_flashImage.get();
}

std::uint32_t Quenx_ConcreteJob::getFlashImageSize() const {
    const utils::Mutex::AutoLocker lock(m_stateMutex);
    return m_flashImageSize;
}

JobStateVal Quenx_ConcreteJob::getJobState() const {
    const utils::Mutex::AutoLocker lock(m_stateMutex);
    return m_jobState;
}

void Quenx_ConcreteJob::setLastError(std::uint32_t code, std::string text) {
    const utils::Mutex::AutoLocker lock(m_stateMutex);
    m_lastErrorCode = code;
    m_lastErrorText.swap(text);
    m_isEndServed = false;
}

void Quenx_ConcreteJob::endRecord(bool succeeded) {
    if (!m_record) return;
    std::uint32_t code = 0;
    std::string text;
    {
        const utils::Mutex::AutoLocker lock(m_stateMutex);
        code = m_lastErrorCode;
        text = m_lastErrorText;
    }
    m_record->end(succeeded, code, text);
}

void Quenx_ConcreteJob::setJobState(JobStateVal state) {
    QUENX_DEBUG("%d -> %d", getJobState(), state);
    enterState(state);
    if (hasEnded(state)) {
        m_events.ended();
    } else {
        m_events.changed();
    }
}

void Quenx_ConcreteJob::enterState(JobStateVal state) {
    // Declared before the lock and so freed after it: an image has megabytes.
    std::unique_ptr<std::uint8_t[]> released;
    const utils::Mutex::AutoLocker lock(m_stateMutex);
    m_jobState = state;
    m_startClaimed = false;
    m_isEndServed = false;
    m_timeOfLastStateChange.resetTimer();
    m_adapterGivenUp = givesUpTheAdapter(state).value_or(m_adapterGivenUp);
    if (state == JobStateCompleted) m_elapsedTime = timeSinceStart();
    if (!m_adapterGivenUp) return;
    released.swap(m_flashImage);
    m_flashImageSize = 0;
    m_claim.release();
}

bool Quenx_ConcreteJob::claimStart() {
    const utils::Mutex::AutoLocker lock(m_stateMutex);
    // The state changes a moment later, so a flag of its own keeps two requests from starting two workers.
    if (m_jobState != JobStateNew) return false;
    return !std::exchange(m_startClaimed, true);
}

unsigned int Quenx_ConcreteJob::requestStateChange(RequestedState state, utils::Time) {
    QUENX_DEBUG("New request %d", state);
    if (state != RequestedStateStart) {
        QUENX_ERROR("Not supported new state %d", state);
        return kUnsupportedState;
    }
    if (!claimStart()) {
        QUENX_ERROR("Cannot start job that is not in 'NEW' state");
        return kInvalidStateTransition;
    }
    QUENX_DEBUG("starting job");
    setJobState(JobStateStarting);
    if (threadControl(ThreadStart, 0)) return 0;
    setJobState(JobStateException);
    return kStartFailed;
}

std::uint16_t Quenx_ConcreteJob::getPercentComplete() {
    const JobStateVal state = getJobState();
    std::optional<std::uint16_t> percent;
    if (state == JobStateRunning) {
        try {
            percent = ma::getFlashImageUpdateProgress(m_adapterName);
        } catch (...) {
            // The last known progress is a better answer than none for all jobs.
        }
    }
    const utils::Mutex::AutoLocker lock(m_stateMutex);
    // The worker may have ended the job while the progress was asked for.
    if (hasEnded(m_jobState)) percent = kWholePercent;
    if (percent) m_percentComplete = *percent;
    return static_cast<std::uint16_t>(m_percentComplete);
}

bool Quenx_ConcreteJob::threadControl(ThreadOperationCommand command, int timeout) {
    const utils::Mutex::AutoLocker lock(m_jobMutex);
    QUENX_DEBUG("New threadControl %d", command);
    if (command == ThreadStart) {
        QUENX_ASSERT_TEXT(m_myThread != nullptr, __FILE__, __LINE__, "m_myThread != __null");
        try {
            m_myThread->start();
        } catch (...) {
            // The exception has logged its reason.
            QUENX_ERROR("Thread start error");
            return false;
        }
        return true;
    }
    if (command == ThreadTerminate) {
        QUENX_ASSERT_TEXT(m_myThread != nullptr, __FILE__, __LINE__, "m_myThread != __null");
        return m_myThread->terminate(timeout);
    }
    const bool disposing = command == ThreadDispose && m_myThread != nullptr && m_myThread->isExecuted();
    if (disposing) {
        QUENX_DEBUG("Deleting JobThread %p for %s", static_cast<const void*>(m_myThread.get()),
                    m_adapterName.c_str());
        m_myThread.reset();
    }
    QUENX_DEBUG("threadControl %d - DONE", command);
    return disposing;
}

void Quenx_ConcreteJob::refresh() {
    if (m_isEndServed) return;
    // Asked first: the adapter API may be slow, and nothing slow runs under the property lock.
    const std::uint16_t percentComplete = getPercentComplete();

    const core::RecursiveLocker properties(getMutex());
    Caption = fmt("Firmware Update Job %d", m_jobId);
    Description = Caption;
    setNull(ElementName, Generation, InstallDate, StatusDescriptions, Status, HealthState, PrimaryStatus,
            DetailedStatus, OperatingStatus, CommunicationStatus, JobStatus, TimeSubmitted,
            ScheduledStartTime, RunMonth, RunDay, RunDayOfWeek, RunStartInterval, LocalOrUtcTime, UntilTime,
            Notify, Owner, RecoveryAction, OtherRecoveryAction);
    OperationalStatus = {kOperationalStatusOk};
    StartTime = m_beginning.time;
    JobRunTimes = 1;
    Priority = 0;
    DeleteOnCompletion = false;
    InstanceID = fmt("Quenx:%s", getUniqId().c_str());
    Name = Caption;
    TimeBeforeRemoval = utils::Time(kFiveMinutes);

    // One copy of what the worker writes, so that state, times and error belong together.
    const utils::Mutex::AutoLocker lock(m_stateMutex);
    PercentComplete = hasEnded(m_jobState) ? kWholePercent : percentComplete;
    ElapsedTime = m_elapsedTime;
    ErrorCode = static_cast<std::uint16_t>(m_lastErrorCode);  // as wide as the property
    ErrorDescription = m_lastErrorText;
    JobState = static_cast<std::uint16_t>(m_jobState);
    TimeOfLastStateChange = m_timeOfLastStateChange;
    m_isEndServed = hasEnded(m_jobState);
}
