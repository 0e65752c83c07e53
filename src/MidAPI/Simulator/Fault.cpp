// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Simulator/Fault.h"

#include <algorithm>
#include <chrono>
#include <csignal>
#include <iterator>
#include <thread>
#include <utility>

namespace ma {
namespace {

void strike(const Fault& fault) {
    switch (fault.action) {
        case Fault::Action::Fail:
            throw OperationFailure(fault.code, fault.text);
        case Fault::Action::Throw:
        case Fault::Action::PowerLoss:
            // Nothing on the way out repairs files, so an exception leaves them as a power cut would.
            throw AdapterError(fault.text);
        case Fault::Action::Kill:
            static_cast<void>(std::raise(SIGKILL));
            break;
        case Fault::Action::Stall:
            std::this_thread::sleep_for(std::chrono::milliseconds(fault.milliseconds));
            break;
    }
}

}  // namespace

FaultList::FaultList(std::vector<Fault> faults) {
    for (Fault& fault : faults)
        add(std::move(fault));
}

void FaultList::add(Fault fault) {
    const utils::Mutex::AutoLocker lock(m_mutex);
    m_entries.push_back(std::make_shared<const Fault>(std::move(fault)));
}

void FaultList::clear() {
    const utils::Mutex::AutoLocker lock(m_mutex);
    m_entries.clear();
}

std::vector<FaultList::Entry> FaultList::armed(Operation operation) {
    const utils::Mutex::AutoLocker lock(m_mutex);
    std::vector<Entry> found;
    std::copy_if(m_entries.begin(), m_entries.end(), std::back_inserter(found),
                 [operation](const Entry& entry) { return entry->at == operation; });
    return found;
}

bool FaultList::take(const Entry& entry) {
    if (!entry->once) return true;
    const utils::Mutex::AutoLocker lock(m_mutex);
    return std::erase(m_entries, entry) != 0;
}

FaultRun::FaultRun(FaultList& list, Operation operation) : m_list(list), m_pending(list.armed(operation)) {}

void FaultRun::reach(unsigned int percent) {
    for (FaultList::Entry& entry : m_pending) {
        if (entry == nullptr || entry->percent > percent) continue;
        // Off the list first: a fault that strikes throws.
        const FaultList::Entry due = std::exchange(entry, nullptr);
        if (m_list.take(due)) strike(*due);
    }
}

}  // namespace ma
