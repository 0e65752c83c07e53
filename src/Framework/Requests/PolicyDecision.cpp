// SPDX-License-Identifier: Apache-2.0
#include "Framework/Requests/PolicyDecision.h"

#include <algorithm>
#include <string>

#include "Framework/Model/CimError.h"
#include "Framework/Requests/NotedCall.h"
#include "Utils/Os/Linux/PolicyFile.h"
#include "Utils/Toml.h"

namespace core {

namespace {

thread_local const PolicyDecision* outermost = nullptr;

[[noreturn]] void refuse(ReasonId id, const std::string& text) {
    NotedCall::noteReason(id);
    throw CimError(CimStatus::AccessDenied, text);
}

/// The snapshot to decide by; null where there is neither a session nor a policy.
std::shared_ptr<const utils::Policy> readPolicy() {
    if (utils::PolicyFile* file = utils::PolicyFile::ofProcess()) {
        try {
            return file->current();
        } catch (const utils::PolicyError& error) {
            refuse(ReasonId::PolicyUnreadable,
                   std::string(kBadPolicy) + " until the policy is mended: " + error.what());
        }
    }
    if (utils::PolicyFile::isOnMachine())
        refuse(ReasonId::PolicyUnreadable,
               std::string(kBadPolicy) + " here: there is a policy, " + utils::systemPolicyFile.load() +
                   ", and the program that loaded this provider cannot obey it; use quenxctl, quenx-cimd or "
                   "libQuenx_Cmpi.so");
    return nullptr;
}

void requireAdministrator(const utils::Policy& policy, const Caller& caller) {
    if (!policy.administrators || caller.isFront) return;
    const std::string where = "\"administrators\" in " + policy.administratorsPlace;
    if (caller.principal.empty())
        refuse(ReasonId::NotAdministrator, "a caller without a name may only read: " + where + ", is set");
    if (std::ranges::find(*policy.administrators, caller.principal) == policy.administrators->end())
        refuse(ReasonId::NotAdministrator, "user " + utils::inQuotes(caller.principal) +
                                               " may only read: " + where + ", has no such name");
}

}  // namespace

PolicyDecision::PolicyDecision(Aim aim) : m_isOutermost(outermost == nullptr), m_aim(aim) {
    if (m_isOutermost) m_policy = readPolicy();
    // A change inside a look was not asked for yet.
    const bool isNew = m_isOutermost || outermost->m_aim == Aim::Look;
    const utils::Policy* const judged = m_isOutermost ? m_policy.get() : outermost->m_policy.get();
    if (isNew && aim == Aim::Change && judged != nullptr)
        requireAdministrator(*judged, CallerScope::current());
    if (m_isOutermost) outermost = this;
}

PolicyDecision::~PolicyDecision() {
    if (m_isOutermost) outermost = nullptr;
}

const utils::Policy& PolicyDecision::policy() {
    static const utils::Policy unrestricted;
    const bool isRead = outermost != nullptr && outermost->m_policy != nullptr;
    return isRead ? *outermost->m_policy : unrestricted;
}

}  // namespace core
