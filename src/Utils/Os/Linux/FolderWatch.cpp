// SPDX-License-Identifier: Apache-2.0
#include "Utils/Os/Linux/FolderWatch.h"

#include <linux/magic.h>
#include <poll.h>
#include <sys/inotify.h>
#include <sys/stat.h>
#include <sys/vfs.h>

#include <algorithm>
#include <array>
#include <cerrno>

namespace os {

namespace {

constexpr std::uint32_t kEvents = IN_CREATE | IN_DELETE | IN_MOVED_FROM | IN_MOVED_TO | IN_MODIFY |
                                  IN_CLOSE_WRITE | IN_ATTRIB | IN_DELETE_SELF | IN_MOVE_SELF | IN_ONLYDIR;

/// Whether only this machine writes to the file system, so that its kernel knows of every change.
bool isLocal(const std::string& path) noexcept {
    constexpr std::array<std::uint32_t, 6> kLocal = {EXT4_SUPER_MAGIC, XFS_SUPER_MAGIC, BTRFS_SUPER_MAGIC,
                                                     F2FS_SUPER_MAGIC, TMPFS_MAGIC,     RAMFS_MAGIC};
    struct statfs status {};
    return ::statfs(path.c_str(), &status) == 0 &&
           std::ranges::find(kLocal, static_cast<std::uint32_t>(status.f_type)) != kLocal.end();
}

std::int64_t nanoseconds(const timespec& time) noexcept {
    return static_cast<std::int64_t>(time.tv_sec) * 1'000'000'000 + time.tv_nsec;
}

}  // namespace

FileState stateOf(const std::string& path) noexcept {
    struct stat status {};
    FileState state;
    if (::lstat(path.c_str(), &status) != 0) return state;
    state.isElsewhere = S_ISLNK(status.st_mode) || (S_ISREG(status.st_mode) && status.st_nlink > 1);
    if (S_ISLNK(status.st_mode) && ::stat(path.c_str(), &status) != 0) return state;
    state.isOther = !S_ISREG(status.st_mode);
    state.device = status.st_dev;
    state.inode = status.st_ino;
    state.size = status.st_size;
    state.modified = nanoseconds(status.st_mtim);
    state.changed = nanoseconds(status.st_ctim);
    return state;
}

bool FolderWatch::isSame(const Folders& folders) const noexcept {
    return std::ranges::equal(folders, m_folders, [](const Folder& left, const Folder& right) {
        return left.path == right.path && left.state.device == right.state.device &&
               left.state.inode == right.state.inode;
    });
}

bool FolderWatch::begin(const Folders& folders) noexcept {
    m_queue.emplace(::inotify_init1(IN_NONBLOCK | IN_CLOEXEC));
    m_forks = forkCount();
    if (!m_queue->isOpen()) return false;
    return std::ranges::all_of(folders, [this](const Folder& folder) {
        if (::inotify_add_watch(m_queue->number(), folder.path.c_str(), kEvents) >= 0)
            return isLocal(folder.path);
        // That one comes shows in its state.
        return errno == ENOENT;
    });
}

void FolderWatch::watch(const utils::StringArray& folders) {
    Folders now;
    for (const std::string& path : folders)
        now.push_back({path, stateOf(path)});
    const bool isKnown = m_isComplete && m_forks == forkCount() && isSame(now);
    // Unread events are those of before. In a child of the process they are the parent's, too.
    std::array<char, 4096> events{};
    while (isKnown && ::read(m_queue->number(), events.data(), events.size()) > 0) {
    }
    if (!isKnown) m_isComplete = begin(now);
    m_folders = std::move(now);
}

bool FolderWatch::sees(const FileState& file) const noexcept {
    // One of another device is mounted there, and has another folder, too.
    return m_isComplete && !file.isElsewhere && std::ranges::any_of(m_folders, [&](const Folder& folder) {
               return folder.state.device == file.device;
           });
}

bool FolderWatch::isQuiet(const utils::StringArray& folders) const noexcept {
    if (!m_isComplete || m_forks != forkCount()) return false;
    pollfd queue{m_queue->number(), POLLIN, 0};
    if (::poll(&queue, 1, 0) != 0) return false;
    // A folder's own state tells that it was exchanged, as by a mount or a link in its path.
    return std::ranges::equal(folders, m_folders, [](const std::string& path, const Folder& folder) {
        return path == folder.path && stateOf(path) == folder.state;
    });
}

}  // namespace os
