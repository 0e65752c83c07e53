// SPDX-License-Identifier: Apache-2.0
#include "Utils/Os/Linux/PolicyFile.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <filesystem>
#include <system_error>

#include "Utils/Log.h"
#include "Utils/Os/Linux/OwnFiles.h"
#include "Utils/Os/Linux/linux.h"

namespace utils {

std::atomic<const char*> systemPolicyFile{"/etc/quenx/policy.toml"};

namespace {

constexpr std::size_t kLargest = std::size_t{1} << 20;

std::atomic<PolicyFile*> newest{nullptr};

[[noreturn]] void refuse(const std::string& path, const std::string& what) {
    throw PolicyError(path + ": " + what);
}

[[noreturn]] void refuseReading(const std::string& path, int error) {
    refuse(path, "cannot be read: " + std::generic_category().message(error) +
                     "; let the user of this program read it, or remove it");
}

void requireOwn(const std::string& path, const os::Descriptor& opened, const std::string& subject,
                const std::string& name) {
    const std::string problem = os::whoElseMayChange(opened, name);
    if (!problem.empty()) refuse(path, subject + " " + problem);
}

std::string textOf(const std::string& path, const os::Descriptor& file) {
    std::string text = os::readUpTo(file, kLargest + 1);
    // Who writes into the file in place, and not beside it, would allow everything until he is done.
    if (text.empty()) refuse(path, "it is empty; write the policy there, or remove it");
    if (text.size() > kLargest) refuse(path, "it is larger than 1 MiB; put only the keys of a policy there");
    return text;
}

/// Nothing when there is no such file. The folder is opened first and the file in it, so that what was looked
/// at is what is read.
std::optional<std::string> readSafely(const std::string& path) try {
    struct stat status {};
    // Before anything is opened: where no descriptor is free, a file that is not there could not be opened,
    // either.
    if (::lstat(path.c_str(), &status) != 0 && errno == ENOENT) return std::nullopt;
    const std::filesystem::path whole = std::filesystem::absolute(path);
    const std::string place = whole.parent_path().string();
    const os::Descriptor folder(::open(place.c_str(), O_PATH | O_DIRECTORY | O_CLOEXEC));
    if (!folder.isOpen()) refuseReading(path, errno);
    constexpr int kFlags = O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY | O_CLOEXEC;
    const os::Descriptor file(::openat(folder.number(), whole.filename().c_str(), kFlags));
    if (!file.isOpen() && errno == ELOOP)
        refuse(path, "it is a symbolic link, which others may turn; put the file itself there");
    if (!file.isOpen()) refuseReading(path, errno);
    if (::fstat(file.number(), &status) != 0) refuseReading(path, errno);
    if (!S_ISREG(status.st_mode)) refuse(path, "it is not a regular file; put a file there, or nothing");
    requireOwn(path, folder, "its folder", place);
    requireOwn(path, file, "it", path);
    return textOf(path, file);
} catch (const std::system_error& error) {
    refuseReading(path, error.code().value());
}

}  // namespace

PolicyFile::PolicyFile(const std::string& path)
    : m_path(path.empty() ? systemPolicyFile.load() : path), m_isNamed(!path.empty()), m_outer(newest) {
    newest = this;
}

PolicyFile::~PolicyFile() {
    newest = m_outer;
}

std::shared_ptr<const Policy> PolicyFile::current() try {
    // Nobody waits here for the disk while another reads: each obeys what he has read himself.
    std::optional<std::string> text = readSafely(m_path);
    if (!text && m_isNamed) refuse(m_path, "there is no such file; write it, or name another one");
    const Mutex::AutoLocker lock(m_mutex);
    if (m_policy == nullptr || text != m_text) {
        m_policy = std::make_shared<const Policy>(text ? parsePolicy(*text, m_path) : Policy());
        m_text = std::move(text);
    }
    m_problem.clear();
    return m_policy;
} catch (const PolicyError& error) {
    const Mutex::AutoLocker lock(m_mutex);
    if (m_problem != error.what()) {
        m_problem = error.what();
        QUENX_ERROR_TEXT("The policy cannot be obeyed, and nothing is installed or deleted: " + m_problem);
    }
    throw;
}

std::string PolicyFile::problem() try {
    current();
    return "";
} catch (const PolicyError& error) {
    return error.what();
}

PolicyFile* PolicyFile::ofProcess() noexcept {
    return newest;
}

bool PolicyFile::isOnMachine() noexcept {
    struct stat status {};
    return ::lstat(systemPolicyFile.load(), &status) == 0 || errno != ENOENT;
}

}  // namespace utils
