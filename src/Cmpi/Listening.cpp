// SPDX-License-Identifier: Apache-2.0
#include "Cmpi/Listening.h"

#include <dlfcn.h>

#include <algorithm>
#include <new>
#include <utility>

#include "Cmpi/Deliverer.h"
#include "Cmpi/Front.h"
#include "Framework/Model/CimError.h"
#include "Framework/Model/CimType.h"
#include "Utils/Os/Linux/SMASHv2Config.h"

namespace cmpi {

namespace {

/// How long the object manager may take to come back from an indication when all shall end.
constexpr std::chrono::milliseconds kPatience{2'000};

/// All that is served: which classes tell of themselves is the providers' affair.
constexpr const char* kEverything = "CIM_ManagedElement";

}  // namespace

Listening& Listening::theOne() {
    alignas(Listening) static unsigned char place[sizeof(Listening)];
    static Listening* const listening = new (place) Listening;
    return *listening;
}

std::shared_ptr<core::EventSink> Listening::sink() {
    const std::lock_guard lock(m_mutex);
    m_queue = std::make_shared<EventQueue>();
    return m_queue;
}

bool Listening::isBusy() {
    const std::lock_guard lock(m_mutex);
    return m_interest || (m_queue != nullptr && m_queue->isAtWork());
}

std::vector<Listening::ActiveFilters>::iterator Listening::find(const FilterPlace& place) {
    return std::ranges::find_if(m_filters, [&](const ActiveFilters& each) {
        return core::sameName(each.place.nameSpace, place.nameSpace) &&
               core::sameName(each.place.className, place.className);
    });
}

void Listening::activate(const Context* context, const FilterPlace& filter) {
    const std::lock_guard lock(m_mutex);
    auto found = find(filter);
    if (found == m_filters.end()) found = m_filters.insert(found, {filter});
    ++found->count;
    try {
        update(context);
    } catch (...) {
        if (--found->count == 0) m_filters.erase(found);
        throw;
    }
}

void Listening::enable(const Context* context) {
    const std::lock_guard lock(m_mutex);
    ++m_enabled;
    try {
        update(context);
    } catch (...) {
        --m_enabled;
        throw;
    }
}

void Listening::deactivate(const FilterPlace& filter, bool isLast) {
    const std::lock_guard lock(m_mutex);
    const auto found = find(filter);
    if (found == m_filters.end()) return;
    if (--found->count == 0 || isLast) m_filters.erase(found);
    update(nullptr);
}

void Listening::disable() {
    const std::lock_guard lock(m_mutex);
    m_enabled = std::max(m_enabled - 1, 0);
    update(nullptr);
}

void Listening::update(const Context* context) {
    if (m_enabled == 0 || m_filters.empty()) {
        stop();
        return;
    }
    auto namespaces = std::make_shared<std::vector<std::string>>();
    for (const ActiveFilters& each : m_filters) {
        const auto isSame = [&](const std::string& other) {
            return core::sameName(other, each.place.nameSpace);
        };
        if (std::ranges::none_of(*namespaces, isSame)) namespaces->push_back(each.place.nameSpace);
    }
    if (!m_interest) {
        startThread(context);
        m_interest.emplace(kEverything);
    }
    m_queue->listenIn(std::move(namespaces));
}

void Listening::stop() noexcept {
    if (m_queue != nullptr) m_queue->listenIn(nullptr);
    m_interest.reset();
}

void Listening::startThread(const Context* context) {
    if (m_isOver) {
        throw core::CimError(core::CimStatus::Failed,
                             "indications have ended with this process. Restart the object manager.");
    }
    if (m_deliverer != nullptr) return;
    auto deliverer = std::make_unique<Deliverer>(
        Front::theOne().broker(), context, utils::SMASHv2Config::getInstance()->getNamespace(), m_queue);
    deliverer->start();
    m_deliverer = std::move(deliverer);
}

void Listening::endThread() noexcept {
    m_filters = std::vector<ActiveFilters>();
    m_enabled = 0;
    stop();
    if (m_deliverer == nullptr) return;
    m_queue->close();
    if (m_deliverer->ends(kPatience)) {
        m_deliverer.reset();
        m_queue->open();
        return;
    }
    m_isOver = true;
    static_cast<void>(m_deliverer.release());  // its thread uses it, and this library
    openThisLibrary(RTLD_NODELETE);
}

void Listening::end() noexcept {
    const std::lock_guard lock(m_mutex);
    endThread();
}

void Listening::endWithSession(bool isLast) noexcept {
    const std::lock_guard lock(m_mutex);
    endThread();
    m_queue.reset();
    m_isOver = m_isOver || isLast;
}

}  // namespace cmpi
