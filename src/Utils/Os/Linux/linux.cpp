// SPDX-License-Identifier: Apache-2.0
#include "Utils/Os/Linux/linux.h"

#include <dirent.h>
#include <fcntl.h>
#include <limits.h>
#include <pthread.h>
#include <signal.h>
#include <sys/stat.h>
#include <sys/time.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <cerrno>
#include <chrono>
#include <cstdlib>
#include <memory>
#include <string_view>
#include <system_error>

#include "Utils/Exception.h"
#include "Utils/Log.h"
#include "Utils/Os/Linux/PatientReading.h"
#include "Utils/Utils.h"

namespace os {

namespace {

std::atomic<unsigned int> forks{0};
[[maybe_unused]] const int kForkHandler = pthread_atfork(nullptr, nullptr, [] { ++forks; });

struct CloseDirectory {
    void operator()(DIR* directory) const noexcept { closedir(directory); }
};
using Directory = std::unique_ptr<DIR, CloseDirectory>;

/// How far a file has filled a buffer, and the errno value of what stopped it before its end.
struct Filling {
    std::size_t count = 0;
    int error = 0;
};

Filling fill(const Descriptor& file, std::span<std::uint8_t> buffer) noexcept {
    Filling filling;
    while (filling.count < buffer.size()) {
        const ssize_t result =
            read(file.number(), buffer.data() + filling.count, buffer.size() - filling.count);
        if (result < 0 && errno == EINTR) continue;
        if (result < 0) filling.error = errno;
        if (result <= 0) break;
        filling.count += static_cast<std::size_t>(result);
    }
    return filling;
}

[[noreturn]] void failToOpen(const std::string& path) {
    throw utils::Exception(utils::formatStr("Could not open the file %s", path.c_str()));
}

}  // namespace

const char* getEnvVariable(const char* name) noexcept {
    return std::getenv(name);
}

std::uint64_t getuSecondsSinceEpoch() noexcept {
    timeval now{};
    gettimeofday(&now, nullptr);
    return static_cast<std::uint64_t>(now.tv_sec) * 1000000 + static_cast<std::uint64_t>(now.tv_usec);
}

std::uint64_t getMonotonicuSeconds() noexcept {
    const auto now = std::chrono::steady_clock::now().time_since_epoch();
    return static_cast<std::uint64_t>(std::chrono::duration_cast<std::chrono::microseconds>(now).count());
}

unsigned int forkCount() noexcept {
    return forks.load(std::memory_order_relaxed);
}

std::string getHostname() {
    char name[HOST_NAME_MAX + 1] = {};
    if (gethostname(name, sizeof name - 1) != 0 || name[0] == '\0') return "localhost";
    return name;
}

void openStandardDescriptors() noexcept {
    int number = 0;
    while (number >= 0 && number <= STDERR_FILENO)
        number = open("/dev/null", O_RDWR);
    if (number > STDERR_FILENO) close(number);
}

std::int32_t getFileSize(const std::string& path) {
    Patience patience;
    return getFileSize(path, lookAtFile(path, -1, patience).value_or(FileLook()));
}

std::int32_t getFileSize(const std::string& path, const FileLook& look) {
    if (look.kind == FileKind::CannotBeLookedAt)
        throw utils::Exception(utils::formatStr("Could not get info about the file %s", path.c_str()));
    if (look.kind == FileKind::Directory) {
        throw utils::Exception(utils::formatStr("The specyfied URI %s points to a directory", path.c_str()));
    }
    if (look.kind != FileKind::Regular || look.size > INT32_MAX) failToOpen(path);
    const auto size = static_cast<std::int32_t>(look.size);
    QUENX_DEBUG("Output size of file: %d", size);
    return size;
}

std::size_t readFile(const std::string& path, std::span<std::uint8_t> buffer) noexcept {
    struct stat status {};
    if (stat(path.c_str(), &status) != 0 || !S_ISREG(status.st_mode)) return 0;
    const Descriptor file(openForReading(path));
    if (!file.isOpen() || fstat(file.number(), &status) != 0 || !S_ISREG(status.st_mode)) return 0;
    return fill(file, buffer).count;
}

std::optional<std::vector<std::uint8_t>> readWholeFile(const std::string& path, std::size_t most) {
    // The room of each step is cleared first, and most files are a line of /sys: so it begins small.
    std::size_t step = 4096;
    constexpr std::size_t kLargestStep = std::size_t{256} * 1024;
    const Descriptor file(openForReading(path));
    if (!file.isOpen() && errno == ENOENT) return std::nullopt;
    std::vector<std::uint8_t> bytes;
    int error = file.isOpen() ? 0 : errno;
    // Read in steps, not by the size that the system tells: files in /proc have none, and a file may grow.
    for (bool more = true; more && error == 0 && bytes.size() < most;) {
        const std::size_t length = bytes.size();
        bytes.resize(std::min(most, length + step));
        step = std::min(step * 4, kLargestStep);
        const Filling filling = fill(file, std::span(bytes).subspan(length));
        error = filling.error;
        more = length + filling.count == bytes.size();
        bytes.resize(length + filling.count);
    }
    if (error != 0) throw std::system_error(error, std::generic_category(), "cannot read " + path);
    return bytes;
}

bool isSpecialFile(const std::string& path) noexcept {
    struct stat status {};
    return stat(path.c_str(), &status) == 0 && !S_ISREG(status.st_mode) && !S_ISDIR(status.st_mode);
}

std::optional<std::string> readTextFile(const std::string& path) {
    constexpr std::size_t kLargest = std::size_t{1} << 20;
    // A FIFO gives what somebody else writes into it, and a device may never end.
    if (isSpecialFile(path)) throw UnusableFile("is not a regular file");
    const auto bytes = readWholeFile(path, kLargest + 1);
    if (!bytes) return std::nullopt;
    if (bytes->size() > kLargest) throw UnusableFile("is larger than 1 MiB");
    return std::string(bytes->begin(), bytes->end());
}

std::optional<std::string> readSystemText(const std::string& path, std::size_t most) try {
    const auto bytes = readWholeFile(path, most);
    return bytes ? std::optional(std::string(bytes->begin(), bytes->end())) : std::nullopt;
} catch (const std::system_error&) {
    return std::nullopt;
}

void ignoreOtherSignals() noexcept {
    for (const int each : {SIGPIPE, SIGXFSZ, SIGUSR1, SIGUSR2, SIGALRM, SIGVTALRM, SIGPROF, SIGIO, SIGPWR})
        static_cast<void>(signal(each, SIG_IGN));
}

bool isThisADir(const std::string& path) noexcept {
    return Directory(opendir(path.c_str())) != nullptr;
}

utils::StringArray listDirectory(const std::string& path) {
    utils::StringArray names;
    const Directory directory(opendir(path.c_str()));
    if (directory == nullptr) return names;
    while (const dirent* const entry = readdir(directory.get())) {
        const std::string_view name = entry->d_name;
        if (name != "." && name != "..") names.emplace_back(name);
    }
    // The system's order changes with every file that comes or goes.
    std::sort(names.begin(), names.end());
    return names;
}

}  // namespace os
