// SPDX-License-Identifier: Apache-2.0
#include "Framework/Requests/PolicyDecision.h"

#include <algorithm>

#include "Framework/Model/CimError.h"
#include "Utils/Os/Linux/PolicyFile.h"
#include "Utils/Toml.h"

namespace core {

namespace {

thread_local const CallerScope* currentScope = nullptr;
thread_local bool isDecided = false;

[[noreturn]] void refuse(const std::string& text) {
    throw CimError(CimStatus::AccessDenied, text);
}

/// The snapshot to decide by; null where there is neither a session nor a policy.
std::shared_ptr<const utils::Policy> readPolicy() {
    if (utils::PolicyFile* file = utils::PolicyFile::ofProcess()) {
        try {
            return file->current();
        } catch (const utils::PolicyError& error) {
            refuse(std::string(kBadPolicy) + " until the policy is mended: " + error.what());
        }
    }
    if (utils::PolicyFile::isOnMachine())
        refuse(std::string(kBadPolicy) + " here: there is a policy, " + utils::systemPolicyFile.load() +
               ", and the program that loaded this provider cannot obey it; use quenxctl, quenx-cimd or "
               "libQuenx_Cmpi.so");
    return nullptr;
}

void requireAdministrator(const utils::Policy& policy, const Caller& caller) {
    if (!policy.administrators || caller.isFront) return;
    const std::string where = "\"administrators\" in " + policy.administratorsPlace;
    if (caller.principal.empty()) refuse("a caller without a name may only read: " + where + ", is set");
    if (std::ranges::find(*policy.administrators, caller.principal) == policy.administrators->end())
        refuse("user " + utils::inQuotes(caller.principal) + " may only read: " + where +
               ", has no such name");
}

}  // namespace

CallerScope::CallerScope(Caller caller) : m_caller(std::move(caller)), m_outer(currentScope) {
    currentScope = this;
}

CallerScope::~CallerScope() {
    currentScope = m_outer;
}

const Caller& CallerScope::current() {
    static const Caller nobody;
    return currentScope == nullptr ? nobody : currentScope->m_caller;
}

PolicyDecision::PolicyDecision() : m_isOutermost(!isDecided) {
    if (!m_isOutermost) return;
    m_policy = readPolicy();
    if (m_policy != nullptr) requireAdministrator(*m_policy, CallerScope::current());
    isDecided = true;
}

PolicyDecision::~PolicyDecision() {
    if (m_isOutermost) isDecided = false;
}

}  // namespace core
