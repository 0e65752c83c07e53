// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <chrono>
#include <stdexcept>

#include "Cmpi/TestBroker.h"

namespace test {

void Deliveries::add(Delivered each) {
    const std::lock_guard lock(mutex);
    delivered.push_back(std::move(each));
    changed.notify_all();
}

std::vector<Delivered> Deliveries::waitFor(std::size_t count) {
    std::unique_lock lock(mutex);
    if (!changed.wait_for(lock, std::chrono::minutes(1), [&] { return delivered.size() >= count; }))
        throw std::runtime_error("in a minute only " + std::to_string(delivered.size()) + " indications");
    return delivered;
}

int Deliveries::contexts() {
    const std::lock_guard lock(mutex);
    return static_cast<int>(std::ranges::count_if(prepared, [](const auto& node) { return node->isAlive; }));
}

std::size_t Deliveries::attempts() {
    const std::lock_guard lock(mutex);
    return prepared.size();
}

}  // namespace test
