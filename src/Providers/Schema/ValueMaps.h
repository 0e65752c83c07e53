// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>

// Values of the DMTF's value maps that more than one part of the system acts on. They travel as plain
// numbers, so the enumerations convert to them.

/// CIM_ConcreteJob.JobState (DSP1103). Only New, Starting, Running, Completed and Exception are entered here.
enum JobStateVal : std::uint16_t {
    JobStateNew = 2,
    JobStateStarting = 3,
    JobStateRunning = 4,
    JobStateSuspended = 5,
    JobStateShuttingDown = 6,
    JobStateCompleted = 7,  ///< the worker succeeded
    JobStateTerminated = 8,
    JobStateKilled = 9,
    JobStateException = 10,  ///< the worker failed, or could not be started
    JobStateService = 11,
    JobStateQueryPending = 12,
};

/// What the methods of CIM_SoftwareInstallationService return.
struct MethodReturn {
    enum Value : std::uint32_t {
        Completed = 0,
        UnspecifiedError = 2,
        Failed = 4,
        InvalidParameter = 5,
        InUse = 6,
        JobStarted = 4096,
        UnsupportedTargetType = 4097,
        DowngradeNotSupported = 4099,
        InsufficientMemory = 4100,
        NotApplicable = 4106,
        CollectionNotSupported = 4108,
    };
};

/// InstallOptions of the same methods.
struct InstallOption {
    enum Value : std::uint16_t {
        DeferReset = 2,
        ForceInstallation = 3,
        Install = 4,
        Update = 5,
        Repair = 6,
        Reboot = 7,
        Password = 8,
        Uninstall = 9,
        Log = 10,
        SilentMode = 11,
        AdministrativeMode = 12,
        /// The first vendor-specific value: the option value at the same position lists target types.
        TargetTypes = 32768,
    };
    /// What stands between the target types in an option value.
    static constexpr char kTargetTypeSeparator = '+';
};
