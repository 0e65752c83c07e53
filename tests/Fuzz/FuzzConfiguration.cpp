// SPDX-License-Identifier: Apache-2.0
#include <sys/mman.h>
#include <unistd.h>

#include <string>

#include "Fuzz/Fuzz.h"
#include "Utils/Os/Linux/SMASHv2Config.h"
#include "Utils/Os/Linux/linux.h"

namespace {

/// A file without a disk behind it.
class MemoryFile {
  public:
    MemoryFile(const uint8_t* data, size_t size) : m_descriptor(memfd_create("fuzz.conf", 0)) {
        require(write(m_descriptor, data, size) == static_cast<ssize_t>(size));
    }
    ~MemoryFile() { close(m_descriptor); }
    MemoryFile(const MemoryFile&) = delete;
    MemoryFile& operator=(const MemoryFile&) = delete;
    std::string path() const { return "/proc/self/fd/" + std::to_string(m_descriptor); }

  private:
    const int m_descriptor;
};

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const MemoryFile file(data, size);
    utils::SMASHv2Config config(file.path());
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
    return 0;
}
