// SPDX-License-Identifier: Apache-2.0
#include "Framework/Events/EventSink.h"

#include <atomic>
#include <utility>

#include "Framework/Events/EventTable.h"
#include "Framework/Requests/CimOperations.h"
#include "Utils/Os/Linux/SMASHv2Config.h"

namespace core {

namespace {

std::atomic<EventSink*> installedSink{nullptr};

}  // namespace

InstanceSnapshot snapshotOf(CimInstance& instance) {
    const std::string namespaceName = utils::SMASHv2Config::getInstance()->getNamespace();
    return std::make_shared<const InstanceValue>(readInstance(instance, namespaceName));
}

EventSink::~EventSink() = default;

EventSink* EventSink::wanting(std::string_view className) noexcept {
    EventSink* const sink = installedSink.load(std::memory_order_acquire);
    return sink != nullptr && EventTable::theOne().isWanted(className) ? sink : nullptr;
}

InstalledEventSink::InstalledEventSink(std::shared_ptr<EventSink> sink) : m_sink(std::move(sink)) {
    installedSink.store(m_sink.get(), std::memory_order_release);
}

InstalledEventSink::~InstalledEventSink() {
    installedSink.store(nullptr, std::memory_order_release);
}

}  // namespace core
