// SPDX-License-Identifier: Apache-2.0
#include "Utils/Os/Linux/Mutex.h"

namespace utils {

std::atomic<unsigned int> Mutex::lockCounter{0};
std::atomic<unsigned int> Mutex::unlockCounter{0};

Mutex::~Mutex() {
    pthread_mutex_destroy(&m_mutex);
}

// The counters order nothing, and must not make a lock dearer.
void Mutex::Lock() noexcept {
    pthread_mutex_lock(&m_mutex);
    lockCounter.fetch_add(1, std::memory_order_relaxed);
}

void Mutex::Unlock() noexcept {
    pthread_mutex_unlock(&m_mutex);
    unlockCounter.fetch_add(1, std::memory_order_relaxed);
}

}  // namespace utils
