// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareUpdate/UpdateReport.h"

#include <new>
#include <string_view>

#include "Framework/Requests/PolicyDecision.h"
#include "Providers/Schema/ValueMaps.h"
#include "Providers/SoftwareUpdate/Quenx_ConcreteJob.h"
#include "Utils/Log.h"
#include "Utils/Os/Linux/linux.h"

namespace {

/// The call that this thread carries out; null without a sink.
thread_local UpdateReport* current = nullptr;

/// For what nobody on the way has given words.
std::string_view textOf(core::ReasonId id) {
    const core::Reason* reason = core::findReason(id);
    if (reason == nullptr) return "The system log of that time may have the reason";
    std::string_view text = reason->text;
    text.remove_suffix(1);  // others put it into sentences of their own
    return text;
}

core::UpdateSink* wantedSink() {
    const bool isOff = core::PolicyDecision::policy().history == utils::HistoryRule::Off;
    return isOff ? nullptr : core::UpdateSink::installed();
}

/// What a policy does that requires a history.
void refuseWithout(const std::string& problem) {
    const std::string text = "The policy requires a history of updates, and none can be written: " + problem;
    QUENX_ERROR_TEXT(text);
    UpdateReport::noteReason(core::ReasonId::HistoryRequired, text);
}

}  // namespace

std::string withoutNames(std::string_view text) {
    if (!text.starts_with("SMASHv2:")) return std::string(text);
    text.remove_prefix(text.find(':') + 1);
    const std::string_view name = text.substr(0, text.find(':'));
    if (name.size() < text.size() && name.starts_with('E') && name.find(' ') == std::string_view::npos)
        text.remove_prefix(name.size() + 1);
    return std::string(text);
}

UpdateReport::UpdateReport() : m_sink(wantedSink()) {
    if (m_sink == nullptr) return;
    m_attempt.caller = core::CallerScope::current();
    m_attempt.mostRecords = core::PolicyDecision::policy().historyRecords;
    m_attempt.keepFolder = core::PolicyDecision::policy().keepImages;
    m_attempt.time = os::getuSecondsSinceEpoch();
    m_attempt.monotonic = os::getMonotonicuSeconds();
    current = this;
}

UpdateReport::~UpdateReport() {
    if (m_sink != nullptr) current = nullptr;
}

void UpdateReport::answered(unsigned int returnValue) noexcept {
    if (m_sink == nullptr || returnValue == MethodReturn::JobStarted) return;
    noteReason(textOf(m_noted.notes().reason));
    tell(returnValue);
}

void UpdateReport::failed(const char* error) noexcept {
    if (m_sink == nullptr) return;
    noteReason(error);
    tell(0);
}

void UpdateReport::tell(unsigned int returnValue) noexcept {
    // What has begun has a record of its own, which says that it came to nothing.
    if (!m_hasBegun) m_sink->refused(m_attempt, returnValue, m_noted.notes().reason, m_reason);
}

void UpdateReport::noteOrder(const UpdateOrder& order, const core::CimPath& target) noexcept try {
    if (current == nullptr) return;
    core::UpdateAttempt& attempt = current->m_attempt;
    attempt.adapter = order.adapterName;
    attempt.uri = order.uri;
    attempt.options = order.options;
    attempt.values = order.values;
    attempt.target = target.toString();
} catch (const std::bad_alloc&) {
}

void UpdateReport::noteReason(std::string_view text) noexcept try {
    if (current != nullptr && current->m_reason.empty()) current->m_reason = withoutNames(text);
} catch (const std::bad_alloc&) {
}

void UpdateReport::noteKey(const std::string& key) noexcept try {
    if (current != nullptr) current->m_attempt.signedBy = key;
    core::NotedCall::noteKey(key);
} catch (const std::bad_alloc&) {
}

UpdateReport::Examination::Examination(std::span<const std::uint8_t> file) {
    core::UpdateSink* const sink = core::UpdateSink::installed();
    if (sink != nullptr && core::NotedCall::isCollecting()) m_facts = sink->examine(file);
}

UpdateReport::Examination::~Examination() {
    if (!m_facts.valid()) return;
    try {
        core::ImageFacts facts = m_facts.get();
        core::NotedCall::noteImage(facts.sha256);
        if (current != nullptr) current->m_attempt.image = std::move(facts);
    } catch (...) {
        // Without memory the image stays without a sum.
    }
}

bool UpdateReport::begin(Quenx_ConcreteJob& job) {
    const bool mustBeKept = core::PolicyDecision::policy().history == utils::HistoryRule::Required;
    if (current == nullptr) return !mustBeKept;
    core::UpdateAttempt& attempt = current->m_attempt;
    attempt.types = job.getImageTypes();
    attempt.job = "Quenx:" + job.getUniqId();
    attempt.mustBeKept = mustBeKept;
    std::shared_ptr<core::UpdateRecord> record = current->m_sink->begin(attempt);
    if (record == nullptr && mustBeKept) {
        refuseWithout("its record was not written in time");
        return false;
    }
    current->m_hasBegun = true;
    job.setRecord(std::move(record));
    return true;
}

bool UpdateReport::mayBegin() {
    if (core::PolicyDecision::policy().history != utils::HistoryRule::Required) return true;
    core::UpdateSink* const sink = core::UpdateSink::installed();
    const std::string problem = sink == nullptr ? "this program keeps none" : sink->problem();
    if (!problem.empty()) refuseWithout(problem);
    return problem.empty();
}
