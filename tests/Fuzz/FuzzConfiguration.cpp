// SPDX-License-Identifier: Apache-2.0
#include <sys/mman.h>
#include <unistd.h>

#include "Fuzz/Fuzz.h"
#include "Utils/Os/Linux/SMASHv2Config.h"
#include "Utils/Os/Linux/linux.h"

void fuzz(const std::string& bytes) {
    // A file without a disk behind it.
    const int file = memfd_create("fuzz.conf", 0);
    require(write(file, bytes.data(), bytes.size()) == static_cast<ssize_t>(bytes.size()));
    utils::SMASHv2Config config("/proc/self/fd/" + std::to_string(file));
    const std::string name = config.getNamespace();
    require(name.starts_with("root") && name.find_first_of(" \t\n=") == std::string::npos);
    const auto directories = config.getFirmwareFilesPaths();
    for (const std::string& directory : directories)
        require(os::isThisADir(directory));
    const bool downgrades = config.isDowngradeEnabled();
    const bool releases = config.getReleaseClaimAfterCheck();
    const std::uint32_t timeout = config.getLockerTimeout();
    // The same file read again says the same, but for a downgrade that stays forbidden.
    require(config.getNamespace() == name && config.getFirmwareFilesPaths() == directories);
    require(config.getLockerTimeout() == timeout && config.getReleaseClaimAfterCheck() == releases);
    require(downgrades || !config.isDowngradeEnabled());
    close(file);
}
