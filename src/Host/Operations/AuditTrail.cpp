// SPDX-License-Identifier: Apache-2.0
#include "Host/Operations/AuditTrail.h"

#include <new>
#include <system_error>

#include "Host/Repetition.h"

namespace host {

namespace {

constexpr unsigned int kListed = 20;
constexpr std::size_t kLongestName = 65;  // of an operation: one more than a line shows

}  // namespace

AuditTrail::~AuditTrail() {
    try {
        writeNumbers(Clock::time_point::max());
    } catch (const std::bad_alloc&) {
        // As in the rest of the log: a line that cannot be built is dropped.
    }
}

void AuditTrail::refused(const core::AuditEvent& event, const std::vector<core::Argument>& arguments,
                         Clock::time_point now) {
    writeNumbers(now);
    {
        const utils::Mutex::AutoLocker lock(m_mutex);
        Minute& minute = m_minutes[event.caller.principal];
        if (minute.refusals == 0) minute.end = now + m_minute;
        if (++minute.refusals > kListed) {
            minute.last = {event.caller, event.operation.substr(0, kLongestName), "", ""};
            startWriter();
            return;
        }
    }
    core::audit(event, arguments);
}

void AuditTrail::startWriter() {
    if (m_writer.joinable()) return;
    try {
        m_writer = std::jthread(
            [this](const std::stop_token& stop) { repeat(stop, m_minute, [this] { writeNumbers(); }); });
    } catch (const std::system_error&) {
        // The next call writes the number, or starts the thread.
    }
}

void AuditTrail::writeNumbers(Clock::time_point now) {
    std::vector<core::AuditEvent> events;
    {
        const utils::Mutex::AutoLocker lock(m_mutex);
        for (auto each = m_minutes.begin(); each != m_minutes.end();) {
            Minute& minute = each->second;
            if (minute.end > now) {
                ++each;
                continue;
            }
            if (minute.refusals > kListed) {
                minute.last.outcome =
                    "denied: " + std::to_string(minute.refusals - kListed) + " more within a minute";
                events.push_back(std::move(minute.last));
            }
            each = m_minutes.erase(each);
        }
    }
    for (const core::AuditEvent& event : events)
        core::audit(event);
}

}  // namespace host
