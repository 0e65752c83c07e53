// SPDX-License-Identifier: Apache-2.0
#include "Framework/Requests/NotedCall.h"

#include <new>

namespace core {

namespace {

thread_local NotedCall* innermost = nullptr;

}  // namespace

NotedCall::NotedCall() : m_outer(innermost) {
    innermost = this;
}

NotedCall::~NotedCall() {
    innermost = m_outer;
}

bool NotedCall::isCollecting() noexcept {
    return innermost != nullptr;
}

void NotedCall::noteReason(ReasonId id) noexcept {
    for (NotedCall* each = innermost; each != nullptr; each = each->m_outer)
        if (each->m_notes.reason == ReasonId::None) each->m_notes.reason = id;
}

void NotedCall::noteImage(const std::string& sha256) noexcept try {
    for (NotedCall* each = innermost; each != nullptr; each = each->m_outer)
        each->m_notes.sha256 = sha256;
} catch (const std::bad_alloc&) {
}

void NotedCall::noteKey(const std::string& key) noexcept try {
    for (NotedCall* each = innermost; each != nullptr; each = each->m_outer)
        each->m_notes.signedBy = key;
} catch (const std::bad_alloc&) {
}

}  // namespace core
