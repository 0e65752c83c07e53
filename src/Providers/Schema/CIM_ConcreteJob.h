// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Framework/Model/CimProperty.h"
#include "Providers/Schema/CIM_Job.h"
#include "Utils/Export.h"

/// DMTF CIM_ConcreteJob: a job with a state and a key of its own.
class QUENX_EXPORT CIM_ConcreteJob : public CIM_Job {
  public:
    static const core::CimClassInfo classInfo;

    CIM_ConcreteJob();
    ~CIM_ConcreteJob() override;

    core::CimPropertyString InstanceID{"InstanceID", this};
    core::CimPropertyString Name{"Name", this};
    core::CimPropertyUint16 JobState{"JobState", this};
    core::CimPropertyDatetime TimeOfLastStateChange{"TimeOfLastStateChange", this};
    core::CimPropertyDatetime TimeBeforeRemoval{"TimeBeforeRemoval", this};
    core::CimPropertyString JobInParameters{"JobInParameters", this};
    core::CimPropertyString JobOutParameters{"JobOutParameters", this};
    core::CimPropertyString MethodName{"MethodName", this};

    // Repeated from the superclasses: the ones here are served.
    core::CimPropertyString JobStatus{"JobStatus", this};
    core::CimPropertyDatetime TimeSubmitted{"TimeSubmitted", this};
    core::CimPropertyDatetime ScheduledStartTime{"ScheduledStartTime", this};
    core::CimPropertyDatetime StartTime{"StartTime", this};
    core::CimPropertyDatetime ElapsedTime{"ElapsedTime", this};
    core::CimPropertyUint32 JobRunTimes{"JobRunTimes", this};
    core::CimPropertyUint8 RunMonth{"RunMonth", this};
    core::CimPropertySint8 RunDay{"RunDay", this};
    core::CimPropertySint8 RunDayOfWeek{"RunDayOfWeek", this};
    core::CimPropertyDatetime RunStartInterval{"RunStartInterval", this};
    core::CimPropertyUint16 LocalOrUtcTime{"LocalOrUtcTime", this};
    core::CimPropertyDatetime UntilTime{"UntilTime", this};
    core::CimPropertyString Notify{"Notify", this};
    core::CimPropertyString Owner{"Owner", this};
    core::CimPropertyUint32 Priority{"Priority", this};
    core::CimPropertyUint16 PercentComplete{"PercentComplete", this};
    core::CimPropertyBoolean DeleteOnCompletion{"DeleteOnCompletion", this};
    core::CimPropertyUint16 ErrorCode{"ErrorCode", this};
    core::CimPropertyString ErrorDescription{"ErrorDescription", this};
    core::CimPropertyUint16 RecoveryAction{"RecoveryAction", this};
    core::CimPropertyString OtherRecoveryAction{"OtherRecoveryAction", this};
    core::CimPropertyDatetime InstallDate{"InstallDate", this};
    core::CimPropertyUint16_arr OperationalStatus{"OperationalStatus", this};
    core::CimPropertyString_arr StatusDescriptions{"StatusDescriptions", this};
    core::CimPropertyString Status{"Status", this};
    core::CimPropertyUint16 HealthState{"HealthState", this};
    core::CimPropertyUint16 CommunicationStatus{"CommunicationStatus", this};
    core::CimPropertyUint16 DetailedStatus{"DetailedStatus", this};
    core::CimPropertyUint16 OperatingStatus{"OperatingStatus", this};
    core::CimPropertyUint16 PrimaryStatus{"PrimaryStatus", this};
    core::CimPropertyString Caption{"Caption", this};
    core::CimPropertyString Description{"Description", this};
    core::CimPropertyString ElementName{"ElementName", this};
    core::CimPropertyUint64 Generation{"Generation", this};
};
