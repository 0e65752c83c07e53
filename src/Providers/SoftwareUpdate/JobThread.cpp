// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareUpdate/JobThread.h"

#include <algorithm>

#include "MidAPI/ma.h"
#include "Providers/SoftwareUpdate/Quenx_ConcreteJob.h"
#include "Utils/Exception.h"
#include "Utils/Log.h"
#include "Utils/Os/Linux/LinuxOSLocker.h"
#include "Utils/Os/Linux/linux.h"

namespace {

constexpr std::uint32_t kStartPause = 10;       // ms
constexpr std::uint32_t kTerminationPoll = 50;  // ms
constexpr int kDestructionTimeout = 3000;       // ms
constexpr std::uint32_t kTimeoutErrorCode = 4;

/// What is left of the wait for a worker's end. Jobs that go together wait side by side.
int remainingWait(std::uint64_t since) {
    if (since == 0) return kDestructionTimeout;
    const std::uint64_t waited = (os::getMonotonicuSeconds() - since) / 1000;
    if (waited >= kDestructionTimeout) return 0;
    // In whole steps: what ends below zero counts as a failure.
    return kDestructionTimeout - static_cast<int>(waited / kTerminationPoll * kTerminationPoll);
}

}  // namespace

std::atomic<std::int32_t> JobThread::executionCount{0};

JobThread::JobThread(Quenx_ConcreteJob* job) : m_myJob(job) {
    QUENX_DEBUG("Creating JobThread %p", static_cast<const void*>(this));
    QUENX_ASSERT_TEXT(job != nullptr, __FILE__, __LINE__, "__null != myJob");
}

JobThread::~JobThread() {
    QUENX_DEBUG("Destroying JobThread %p", static_cast<const void*>(this));
    if (m_started == true && isInThisProcess()) {
        QUENX_DEBUG("Destroying JobThread %p, waiting for terminate", static_cast<const void*>(this));
        // Not terminate(): no class derived from this one is left that could have its own say.
        JobThread::stopFwUpdateExecution();
        if (waitForEnd(remainingWait(m_myJob->releaseTime()))) {
            QUENX_DEBUG("JobThread %p, terminated", static_cast<const void*>(this));
        } else {
            QUENX_ERROR("JobThread %p, terminating timeout error", static_cast<const void*>(this));
        }
    }
    shutdown();
}

void JobThread::start() {
    // First, so that a thread that the system refuses counts as started, too.
    m_started = true;
    Thread::start();
}

void JobThread::stopFwUpdateExecution() {
    if (m_stopRequested == false) m_stopRequested = true;
}

bool JobThread::terminate(int timeout) {
    stopFwUpdateExecution();
    return waitForEnd(timeout);
}

bool JobThread::waitForEnd(int timeout) const {
    // Polled: the worker may be within the adapter API, which nothing interrupts.
    while (m_executed == false && timeout > 0) {
        msleep(kTerminationPoll);
        timeout -= static_cast<int>(kTerminationPoll);
    }
    return timeout >= 0;
}

void JobThread::execute() {
    QUENX_DEBUG("Thread %p starting", static_cast<const void*>(this));
    // Leaves the processor to the request that started the job, so that its answer is on the way first.
    msleep(kStartPause);
    ++executionCount;
    m_myJob->setJobState(JobStateRunning);
    bool succeeded = false;
    try {
        succeeded = flash();
    } catch (...) {
        // The old text for every exception: docs/compatibility.md.
        QUENX_DEBUG("Access to the KD is disabled at this moment.");
        m_myJob->setLastError(kTimeoutErrorCode, "Timeout Error");
    }
    // First, so that whoever sees the end finds it in the history, too.
    m_myJob->endRecord(succeeded);
    m_myJob->setJobState(succeeded ? JobStateCompleted : JobStateException);
    // From here on an enumeration of the jobs may destroy this object; the destructor waits for this thread.
    m_executed = true;
    QUENX_DEBUG("Thread %p finishing", static_cast<const void*>(this));
}

bool JobThread::flash() {
    // Fails when the process has no locker; one that is busy does not matter.
    const os::OSLocker::AutoOSLocker adapterLock;
    const std::string adapterName = m_myJob->getAdapterName();
    const std::vector<utils::FirmwareType> types = m_myJob->getImageTypes();
    // Before the write: on a device that does lose the image, a cut in between would leave an adapter that
    // boots from what is not there. ma::prepareFlashImage() leaves the types ascending; only a backend that
    // answers a status which is not known may leave them as requested, and the search may then miss.
    if (!std::binary_search(types.begin(), types.end(), utils::FirmwareType::iSCSI))
        resetBootType(adapterName);

    std::uint32_t errorCode = 0;
    std::string errorText;
    QUENX_DEBUG("Writing FLASH Image");
    const bool written = ma::writeFlashImage(adapterName, m_myJob->getFlashImage(),
                                             m_myJob->getFlashImageSize(), errorCode, errorText);
    // Also after a success: the adapter API may have something to say about it.
    m_myJob->setLastError(errorCode, errorText);
    if (!written) return false;

    QUENX_DEBUG("Updating CapabilityWord");
    // The word tells the adapter which of its images to run, so it must not name one that was not written.
    const bool updated = ma::updateCapabilityWord(adapterName, types, errorCode, errorText);
    m_myJob->setLastError(errorCode, errorText);
    return updated;
}

/// Where the adapter has an iSCSI image and the update brings none, every function of the card gets the
/// default boot type. Clients know this reset. The simulator keeps an iSCSI image that is not replaced, so
/// there nothing would require it.
void JobThread::resetBootType(const std::string& adapterName) {
    std::vector<utils::FirmwareVersionInfo> components;
    ma::getAdapterFirmwareVersion(adapterName, components);
    QUENX_DEBUG("MidApi returns %d firmwares", static_cast<int>(components.size()));
    const bool hasIscsi = std::any_of(components.begin(), components.end(), [](const auto& component) {
        return component.type == utils::FirmwareType::iSCSI;
    });
    if (!hasIscsi) return;
    const utils::PCIAddr address = ma::getPCIAddress(adapterName);
    for (const std::string& other : ma::enumerateAdapters()) {
        if (ma::getPCIAddress(other).sameAdapter(address)) ma::setBootType(other, ma::BootType::None);
    }
}
