// SPDX-License-Identifier: Apache-2.0
#include <fcntl.h>
#include <limits.h>
#include <linux/netlink.h>
#include <poll.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/utsname.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <filesystem>
#include <system_error>

#include "MidAPI/Devlink/Machine.h"
#include "Utils/Os/Linux/OwnFiles.h"

namespace ma::devlink {
namespace {

[[noreturn]] void fail(const std::string& what) {
    throw std::system_error(errno, std::generic_category(), what);
}

constexpr const char* kCannotOpen = "cannot open a netlink socket";

void enable(const os::Descriptor& socket, int option) {
    const int on = 1;
    if (::setsockopt(socket.number(), SOL_NETLINK, option, &on, sizeof on) != 0) fail(kCannotOpen);
}

/// Receives what is there. Nothing where there is none after all, or where the sender is not the kernel: any
/// process may send to this socket.
std::optional<std::size_t> receiveNow(int socket, std::span<std::uint8_t> buffer) {
    sockaddr_nl sender{};
    iovec place{buffer.data(), buffer.size()};
    msghdr message{};
    message.msg_name = &sender;
    message.msg_namelen = sizeof sender;
    message.msg_iov = &place;
    message.msg_iovlen = 1;
    const ssize_t length = ::recvmsg(socket, &message, MSG_DONTWAIT);
    if (length < 0 && (errno == EAGAIN || errno == EINTR)) return std::nullopt;
    if ((message.msg_flags & MSG_TRUNC) != 0) errno = EMSGSIZE;
    if (length < 0 || (message.msg_flags & MSG_TRUNC) != 0) fail("cannot receive from the kernel");
    if (sender.nl_pid != 0) return std::nullopt;
    return static_cast<std::size_t>(length);
}

}  // namespace

Machine::~Machine() = default;

std::optional<std::string> LinuxMachine::readFile(const std::string& path) {
    auto text = os::readSystemText(path);
    if (text && text->ends_with('\n')) text->pop_back();
    return text;
}

std::optional<std::string> LinuxMachine::readLink(const std::string& path) {
    std::array<char, PATH_MAX> target{};
    const ssize_t length = ::readlink(path.c_str(), target.data(), target.size());
    if (length < 0) return std::nullopt;
    return std::string(target.data(), static_cast<std::size_t>(length));
}

std::optional<utils::StringArray> LinuxMachine::listFolder(const std::string& path) {
    utils::StringArray names;
    std::error_code error;
    std::filesystem::directory_iterator entry(path, error);
    for (; !error && entry != std::filesystem::directory_iterator(); entry.increment(error))
        names.push_back(entry->path().filename());
    if (error && error.value() != ENOENT && error.value() != ENOTDIR) return std::nullopt;
    std::ranges::sort(names);
    return names;
}

bool LinuxMachine::folderExists(const std::string& path) {
    struct stat status {};
    return ::stat(path.c_str(), &status) == 0 && S_ISDIR(status.st_mode);
}

bool LinuxMachine::folderIsWritable(const std::string& path) {
    return folderExists(path) && ::faccessat(AT_FDCWD, path.c_str(), W_OK | X_OK, AT_EACCESS) == 0;
}

std::string LinuxMachine::kernelRelease() {
    utsname names{};
    return ::uname(&names) == 0 ? names.release : "";
}

os::Descriptor LinuxMachine::openNetlink() {
    // Room for a storm of notifications. The kernel cuts it to what it allows.
    constexpr int kReceiveBuffer = 1 << 20;
    os::Descriptor socket(::socket(AF_NETLINK, SOCK_RAW | SOCK_CLOEXEC, NETLINK_GENERIC));
    if (!socket.isOpen()) fail(kCannotOpen);
    ::setsockopt(socket.number(), SOL_SOCKET, SO_RCVBUF, &kReceiveBuffer, sizeof kReceiveBuffer);
    const sockaddr_nl any{.nl_family = AF_NETLINK, .nl_pad = 0, .nl_pid = 0, .nl_groups = 0};
    if (::bind(socket.number(), reinterpret_cast<const sockaddr*>(&any), sizeof any) != 0) fail(kCannotOpen);
    enable(socket, NETLINK_EXT_ACK);
    enable(socket, NETLINK_CAP_ACK);
    return socket;
}

void LinuxMachine::joinGroup(const os::Descriptor& socket, std::uint32_t group) {
    if (::setsockopt(socket.number(), SOL_NETLINK, NETLINK_ADD_MEMBERSHIP, &group, sizeof group) != 0)
        fail("cannot join the notifications of devlink");
}

void LinuxMachine::send(const os::Descriptor& socket, std::span<const std::uint8_t> message) {
    if (::send(socket.number(), message.data(), message.size(), MSG_NOSIGNAL) < 0)
        fail("cannot send to the kernel");
}

std::optional<std::size_t> LinuxMachine::receive(const os::Descriptor& socket, std::span<std::uint8_t> buffer,
                                                 std::chrono::milliseconds patience) {
    using Clock = std::chrono::steady_clock;
    const auto end = Clock::now() + patience;
    while (true) {
        if (const auto length = receiveNow(socket.number(), buffer)) return length;
        const auto rest = std::chrono::ceil<std::chrono::milliseconds>(end - Clock::now()).count();
        if (rest <= 0) return std::nullopt;
        pollfd waiting{.fd = socket.number(), .events = POLLIN, .revents = 0};
        if (::poll(&waiting, 1, static_cast<int>(rest)) < 0 && errno != EINTR)
            fail("cannot wait for the kernel");
    }
}

void LinuxMachine::makeFolder(const std::string& path) {
    if (::mkdir(path.c_str(), S_IRWXU) != 0 && errno != EEXIST) fail("cannot make the folder " + path);
    os::closeFolderToOthers(path);
}

os::Descriptor LinuxMachine::createFile(const std::string& path) {
    constexpr int kFlags = O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC;
    os::Descriptor file(::open(path.c_str(), kFlags, S_IRUSR | S_IWUSR));
    if (!file.isOpen()) fail("cannot make the file " + path);
    return file;
}

void LinuxMachine::writeFile(const os::Descriptor& file, std::span<const std::uint8_t> bytes) {
    os::writeAll(file.number(), bytes, "cannot write the file");
}

void LinuxMachine::syncFile(const os::Descriptor& file) {
    if (::fsync(file.number()) != 0) fail("cannot bring the file to the medium");
}

void LinuxMachine::syncFolder(const std::string& path) {
    os::syncFolder(path);
}

void LinuxMachine::removeFile(const std::string& path) {
    if (::unlink(path.c_str()) != 0 && errno != ENOENT) fail("cannot remove the file " + path);
}

std::unique_ptr<os::FileLock> LinuxMachine::lock(const std::string& path,
                                                 std::chrono::milliseconds patience) {
    return std::make_unique<os::FileLock>(path, patience);
}

}  // namespace ma::devlink
