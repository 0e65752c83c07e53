// SPDX-License-Identifier: Apache-2.0
#include "History/Owner.h"

#include <unistd.h>

#include <cstdlib>
#include <filesystem>
#include <random>

#include "Utils/Utils.h"

namespace history {

namespace {

constexpr const char* kPrefix = "owner-";

std::string systemText(const char* path) {
    const std::string text = os::readSystemText(path).value_or("");
    return text.substr(0, text.find('\n'));
}

/// "3d890cfe-9d5a-4a15-...", where the service manager leaves out the dashes.
std::string asTheKernelWritesIt(std::string id) {
    constexpr std::size_t kDigits = 32;
    if (id.size() != kDigits) return id;
    for (const std::size_t place : {20U, 16U, 12U, 8U})
        id.insert(place, "-");
    return id;
}

/// The number of a process that died may be given again; these names are not.
std::string uniqueName() {
    std::random_device random;
    return kPrefix + std::to_string(::getpid()) + "-" + std::to_string(random());
}

}  // namespace

const std::string& bootId() {
    // Read once: it outlives every process.
    static const std::string kId = [] {
        const std::string id = systemText("/proc/sys/kernel/random/boot_id");
        const char* told = os::getEnvVariable("QUENX_BOOT_ID");
        return id.empty() && told != nullptr ? asTheKernelWritesIt(told) : id;
    }();
    return kId;
}

Owner::Owner(const std::string& folder)
    : m_name(uniqueName()), m_path(folder + "/" + m_name), m_lock(std::make_unique<os::FileLock>(m_path)) {}

Owner::~Owner() {
    // A child that was forked has the lock's file, but is not the one that its name is of.
    if (m_lock->isHeld()) ::unlink(m_path.c_str());
}

void Owner::sweep(const std::string& folder) {
    for (const std::string& name : os::listDirectory(folder)) {
        if (!name.starts_with(kPrefix)) continue;
        const std::string path = folder + "/" + name;
        const os::FileLock lock(path);
        if (lock.isHeld()) ::unlink(path.c_str());
    }
}

bool Owner::isAlive(const std::string& folder, const std::string& name) {
    std::error_code ignored;
    return name.starts_with(kPrefix) && name.find('/') == std::string::npos &&
           std::filesystem::exists(folder + "/" + name, ignored);
}

}  // namespace history
