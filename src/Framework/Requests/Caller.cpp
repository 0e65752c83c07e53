// SPDX-License-Identifier: Apache-2.0
#include "Framework/Requests/Caller.h"

#include <utility>

namespace core {

namespace {

thread_local const CallerScope* currentScope = nullptr;

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

}  // namespace core
