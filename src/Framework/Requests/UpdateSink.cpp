// SPDX-License-Identifier: Apache-2.0
#include "Framework/Requests/UpdateSink.h"

#include <atomic>
#include <utility>

namespace core {

namespace {

std::atomic<UpdateSink*> installedSink{nullptr};

}  // namespace

UpdateRecord::~UpdateRecord() = default;

UpdateSink::~UpdateSink() = default;

UpdateSink* UpdateSink::installed() noexcept {
    return installedSink.load(std::memory_order_acquire);
}

InstalledSink::InstalledSink(std::shared_ptr<UpdateSink> sink) : m_sink(std::move(sink)) {
    installedSink.store(m_sink.get(), std::memory_order_release);
}

InstalledSink::~InstalledSink() {
    installedSink.store(nullptr, std::memory_order_release);
}

}  // namespace core
