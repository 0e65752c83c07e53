// SPDX-License-Identifier: Apache-2.0
#include "Host/Daemon/RunningJobs.h"

#include "Providers/Schema/ValueMaps.h"

namespace host {

namespace {

template <class T>
T valueOf(const core::InstanceValue& instance, std::string_view name) {
    const core::PropertyValue* property = instance.find(name);
    const core::CimScalar* scalar = property == nullptr ? nullptr : property->value.scalar();
    const T* value = scalar == nullptr ? nullptr : std::get_if<T>(scalar);
    return value == nullptr ? T() : *value;
}

}  // namespace

std::vector<RunningJob> runningJobs(core::CimOperations& operations) {
    std::vector<RunningJob> running;
    try {
        for (const core::InstanceValue& job : operations.enumerateInstances("CIM_ConcreteJob")) {
            const auto state = valueOf<std::uint64_t>(job, "JobState");
            if (state != JobStateStarting && state != JobStateRunning) continue;
            running.push_back(
                {valueOf<std::string>(job, "InstanceID"), valueOf<std::uint64_t>(job, "PercentComplete")});
        }
    } catch (const core::CimError&) {
        // Nobody serves jobs.
    }
    return running;
}

std::string describe(const std::vector<RunningJob>& jobs) {
    std::string text;
    for (const RunningJob& job : jobs) {
        if (!text.empty()) text += ", ";
        text += job.id + " at " + std::to_string(job.percent) + " %";
    }
    return text;
}

}  // namespace host
