// How a job's state becomes the properties that clients read.
#include "Providers/SoftwareUpdate/Quenx_ConcreteJob.h"
#include "Utils/Utils.h"

namespace {

constexpr unsigned short kOperationalStatusOk = 2;
/// Only reported: nothing removes a job but its client.
constexpr unsigned long long kFiveMinutes = 300000000ULL;

}  // namespace

void Quenx_ConcreteJob::refresh() {
    // Asked first: the adapter API may be slow, and nothing slow runs under the property lock.
    const unsigned short percentComplete = getPercentComplete();

    const core::RecursiveLocker properties(getMutex());
    Caption = fmt("Firmware Update Job %d", m_jobId);
    Description = Caption;
    setUnknownProperties();
    OperationalStatus.clear();
    OperationalStatus.push_back(kOperationalStatusOk);
    StartTime = m_startTime;
    JobRunTimes = 1;
    Priority = 0;
    DeleteOnCompletion = false;
    InstanceID = fmt("Quenx:%s", getUniqId().c_str());
    Name = Caption;
    TimeBeforeRemoval = utils::Time(kFiveMinutes);

    // One copy of what the worker writes, so that state, times and error belong together.
    const utils::Mutex::AutoLocker lock(m_stateMutex);
    const bool ended = m_jobState == JobStateCompleted || m_jobState == JobStateException;
    PercentComplete = static_cast<unsigned short>(ended ? 100 : percentComplete);
    ElapsedTime = m_elapsedTime;
    ErrorCode = static_cast<unsigned short>(m_lastErrorCode);  // the upper bits are cut off (intended)
    ErrorDescription = m_lastErrorText;
    JobState = static_cast<unsigned short>(m_jobState);
    TimeOfLastStateChange = m_timeOfLastStateChange;
}

void Quenx_ConcreteJob::setUnknownProperties() {
    for (core::CimProperty* property : std::initializer_list<core::CimProperty*>{
             &ElementName,  &Generation,       &InstallDate,        &StatusDescriptions, &Status,
             &HealthState,  &PrimaryStatus,    &DetailedStatus,     &OperatingStatus,    &CommunicationStatus,
             &JobStatus,    &TimeSubmitted,    &ScheduledStartTime, &RunMonth,           &RunDay,
             &RunDayOfWeek, &RunStartInterval, &LocalOrUtcTime,     &UntilTime,          &Notify,
             &Owner,        &RecoveryAction,   &OtherRecoveryAction}) {
        property->setNull();
    }
}
