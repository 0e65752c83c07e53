// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareUpdate/JobEvents.h"

#include <new>

#include "Framework/Requests/CimOperations.h"
#include "Providers/SoftwareUpdate/Quenx_ConcreteJob.h"
#include "Utils/Log.h"
#include "Utils/Os/Linux/linux.h"

namespace {

/// Times and texts change with these, or matter to nobody until they do.
bool isSameToListeners(const core::InstanceValue& before, const core::InstanceValue& after) {
    return before.number("JobState") == after.number("JobState") &&
           before.number("PercentComplete") == after.number("PercentComplete");
}

}  // namespace

JobEvents::JobEvents(Quenx_ConcreteJob& job) : EventSource(Quenx_ConcreteJob::classInfo.name), m_job(job) {}

JobEvents::~JobEvents() {
    leave();
}

core::EventSink* JobEvents::sink() const noexcept {
    return core::EventSink::wanting(className());
}

core::InstanceSnapshot JobEvents::snapshot() const noexcept try {
    m_job.refresh();
    return core::snapshotOf(m_job);
} catch (...) {
    QUENX_ERROR("A job could not be shown to those who listen; they learn of it with its next change");
    return nullptr;
}

void JobEvents::created() noexcept {
    try {
        join();
    } catch (const std::bad_alloc&) {
        // Its states are told all the same, its progress only with them.
    }
    const utils::Mutex::AutoLocker lock(m_mutex);
    m_stage = Stage::Told;
    core::EventSink* const listening = sink();
    if (listening == nullptr) return;
    m_told = snapshot();
    if (m_told != nullptr) listening->take({nullptr, m_told, os::getuSecondsSinceEpoch()});
}

void JobEvents::beginTelling() noexcept {
    const utils::Mutex::AutoLocker lock(m_mutex);
    m_told = snapshot();
}

void JobEvents::changed() noexcept {
    const utils::Mutex::AutoLocker lock(m_mutex);
    if (m_stage != Stage::Told) return;
    core::EventSink* const listening = sink();
    if (listening == nullptr) return;
    core::InstanceSnapshot now = snapshot();
    if (now == nullptr) return;
    const core::InstanceSnapshot before = m_told == nullptr ? now : m_told;
    m_told = std::move(now);
    if (!isSameToListeners(*before, *m_told)) listening->take({before, m_told, os::getuSecondsSinceEpoch()});
}

void JobEvents::ended() noexcept {
    changed();
    leave();
    const utils::Mutex::AutoLocker lock(m_mutex);
    m_told = nullptr;  // an ended job may stay for months
}

JobEvents::Deletion::Deletion(JobEvents& events) noexcept QUENX_NO_THREAD_SAFETY_ANALYSIS : m_events(events) {
    // Held to the end of the deletion: what follows it would be an event of a job that is not there.
    m_events.m_mutex.Lock();
    if (m_events.m_stage == Stage::Told && m_events.sink() != nullptr) m_last = m_events.snapshot();
}

JobEvents::Deletion::~Deletion() QUENX_NO_THREAD_SAFETY_ANALYSIS {
    core::EventSink* const listening = m_last == nullptr ? nullptr : m_events.sink();
    if (listening != nullptr) listening->take({m_last, nullptr, os::getuSecondsSinceEpoch()});
    m_events.m_stage = Stage::Deleted;
    m_events.m_mutex.Unlock();
    m_events.leave();
}
