// SPDX-License-Identifier: Apache-2.0
#include "Providers/Schema/CIM_ManagedSystemElement.h"

#include "Framework/Model/CimClassInfo.h"

namespace {

constexpr core::CimElementText kTexts[] = {
    {"", "Any part of a system that is managed, physical or logical."},
    {"OperationalStatus", "The current statuses of the element.",
     "0=Unknown;1=Other;2=OK;3=Degraded;4=Stressed;5=Predictive Failure;6=Error;7=Non-Recoverable "
     "Error;8=Starting;9=Stopping;10=Stopped;11=In Service;12=No Contact;13=Lost "
     "Communication;14=Aborted;15=Dormant;16=Supporting Entity in Error;17=Completed;18=Power "
     "Mode;19=Relocating;..=DMTF Reserved;0x8000..=Vendor Reserved"},
    {"HealthState", "The current health of the element.",
     "0=Unknown;5=OK;10=Degraded/Warning;15=Minor failure;20=Major failure;25=Critical "
     "failure;30=Non-recoverable error;..=DMTF Reserved;32768..65535=Vendor Specific"},
    {"PrimaryStatus", "The status at a glance.",
     "0=Unknown;1=OK;2=Degraded;3=Error;..=DMTF Reserved;0x8000..=Vendor Reserved"},
    {"DetailedStatus", "More of the primary status.",
     "0=Not Available;1=No Additional Information;2=Stressed;3=Predictive Failure;4=Non-Recoverable "
     "Error;5=Supporting Entity in Error;..=DMTF Reserved;0x8000..=Vendor Reserved"},
    {"OperatingStatus", "What the element is doing.",
     "0=Unknown;1=Not "
     "Available;2=Servicing;3=Starting;4=Stopping;5=Stopped;6=Aborted;7=Dormant;8=Completed;9=Migrating;10="
     "Emigrating;11=Immigrating;12=Snapshotting;13=Shutting Down;14=In Test;15=Transitioning;16=In "
     "Service;..=DMTF Reserved;0x8000..=Vendor Reserved"},
    {"CommunicationStatus", "Whether the element can be communicated with.",
     "0=Unknown;1=Not Available;2=Communication OK;3=Lost Communication;4=No Contact;..=DMTF "
     "Reserved;0x8000..=Vendor Reserved"},
};

}  // namespace

constinit const core::CimClassInfo CIM_ManagedSystemElement::classInfo{
    "CIM_ManagedSystemElement",
    &CIM_ManagedElement::classInfo,
    false,
    {},
    &core::makeSample<CIM_ManagedSystemElement>,
    kTexts};

CIM_ManagedSystemElement::CIM_ManagedSystemElement() {
    declareClass(classInfo);
}

CIM_ManagedSystemElement::~CIM_ManagedSystemElement() = default;
