// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Simulator/Fault.h"

#include <algorithm>
#include <chrono>
#include <csignal>
#include <thread>

namespace ma {
namespace {

void strike(const Fault& fault) {
    switch (fault.action) {
        case Fault::Action::Fail:
            throw OperationFailure(fault.code, fault.text);
        case Fault::Action::Throw:
            throw AdapterError(fault.text);
        case Fault::Action::PowerLoss:
            throw PowerLoss(fault.text);
        case Fault::Action::Kill:
            std::raise(SIGKILL);
            break;
        case Fault::Action::Stall:
            std::this_thread::sleep_for(std::chrono::milliseconds(fault.milliseconds));
            break;
    }
}

}  // namespace

PowerLoss::PowerLoss(const std::string& text) : AdapterError(text) {}
PowerLoss::~PowerLoss() = default;

FaultList::FaultList(std::vector<Fault> faults) {
    for (Fault& fault : faults)
        add(std::move(fault));
}

void FaultList::add(Fault fault) {
    const utils::Mutex::AutoLocker lock(m_mutex);
    // Faults may be equal; the number tells which one was used up.
    m_entries.push_back({m_nextId++, std::move(fault)});
}

void FaultList::clear() {
    const utils::Mutex::AutoLocker lock(m_mutex);
    m_entries.clear();
}

std::vector<FaultList::Entry> FaultList::armed(Operation operation) {
    const utils::Mutex::AutoLocker lock(m_mutex);
    std::vector<Entry> found;
    for (const Entry& entry : m_entries)
        if (entry.fault.at == operation) found.push_back(entry);
    return found;
}

bool FaultList::take(const Entry& entry) {
    if (!entry.fault.once) return true;
    const utils::Mutex::AutoLocker lock(m_mutex);
    return std::erase_if(m_entries, [&entry](const Entry& other) { return other.id == entry.id; }) != 0;
}

FaultRun::FaultRun(FaultList& list, Operation operation) : m_list(list), m_pending(list.armed(operation)) {}

void FaultRun::reach(unsigned int percent) {
    for (std::size_t index = 0; index < m_pending.size();) {
        if (m_pending[index].fault.percent > percent) {
            ++index;
            continue;
        }
        // Off the list first: a fault that strikes throws.
        const FaultList::Entry entry = std::move(m_pending[index]);
        m_pending.erase(m_pending.begin() + static_cast<std::ptrdiff_t>(index));
        if (m_list.take(entry)) strike(entry.fault);
    }
}

}  // namespace ma
