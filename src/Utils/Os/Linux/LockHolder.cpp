// SPDX-License-Identifier: Apache-2.0
#include "Utils/Os/Linux/LockHolder.h"

#include <sys/stat.h>
#include <sys/sysmacros.h>
#include <sys/types.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <csignal>
#include <cstdio>
#include <optional>
#include <sstream>

#include "Utils/Os/Linux/linux.h"
#include "Utils/Utils.h"

namespace os {
namespace {

constexpr std::size_t kLongestName = 15;  // the kernel's own bound

std::string procFile(pid_t process, const std::string& name) {
    return "/proc/" + std::to_string(process) + "/" + name;
}

/// Anybody can give a program any name, and this one goes to logs and terminals.
std::string cleanName(const std::string& text) {
    std::string name;
    for (const char character : text.substr(0, kLongestName))
        if (character > ' ' && character <= '~') name += character;
    return name;
}

std::string programOf(pid_t process) {
    return cleanName(readSystemText(procFile(process, "comm")).value_or(""));
}

struct Life {
    std::string state;  ///< "Z" for one that has ended, and holds nothing more
    std::string start;  ///< in ticks since the machine's start; with the number it tells it from all others
};

/// Empty where it cannot be read.
Life lifeOf(pid_t process) {
    constexpr int kFieldsBetween = 19;
    const std::string text = readSystemText(procFile(process, "stat")).value_or("");
    // The program's name may have brackets and blanks of its own.
    std::istringstream fields(text.substr(std::min(text.size(), text.rfind(')') + 1)));
    Life life;
    fields >> life.state;
    for (int field = 0; field < kFieldsBetween; ++field)
        fields >> life.start;
    return fields ? life : Life();
}

/// "pid:[4026531836]"
std::string ownNamespace() {
    std::array<char, 64> text{};
    const ssize_t length = ::readlink("/proc/self/ns/pid", text.data(), text.size());
    return length <= 0 ? "" : std::string(text.data(), static_cast<std::size_t>(length));
}

struct Note {
    pid_t process = 0;
    std::string start;
    std::string space;
    std::string program;
};

/// Nothing for a file that an older version or somebody else has written to.
std::optional<Note> readNote(int file) {
    std::array<char, 128> text{};
    const ssize_t length = ::pread(file, text.data(), text.size(), 0);
    if (length <= 0 || text[static_cast<std::size_t>(length) - 1] != '\n') return std::nullopt;
    std::istringstream fields(std::string(text.data(), static_cast<std::size_t>(length)));
    Note note;
    if (!(fields >> note.process >> note.start >> note.space) || note.process <= 0) return std::nullopt;
    fields >> note.program;
    note.program = cleanName(note.program);
    return note;
}

std::string describe(pid_t process, const std::string& program) {
    return "process " + std::to_string(process) + (program.empty() ? "" : " (" + program + ")");
}

/// Whether the process is still there that had this number when it took the lock.
bool isThere(pid_t process, const std::string& start) {
    const Life now = lifeOf(process);
    // A hardened service sees no other processes in /proc, and signal 0 says only that there is one.
    if (now.start.empty()) return ::kill(process, 0) == 0 || errno == EPERM;
    return now.state != "Z" && (start.empty() || start == now.start);
}

/// Who took the lock, in the kernel's list; 0 where that has nobody: one whose process is in another pid
/// namespace is left out, and a hardened service does not see the list at all.
pid_t listedHolder(int file) {
    struct stat status {};
    if (::fstat(file, &status) != 0) return 0;
    // Some file systems have a device number of their own in the list: the inode then has to do.
    pid_t sameInode = 0;
    std::istringstream locks(readSystemText("/proc/locks").value_or(""));
    for (std::string line; std::getline(locks, line);) {
        int process = 0;
        unsigned int major = 0;
        unsigned int minor = 0;
        unsigned long long inode = 0;
        if (std::sscanf(line.c_str(), "%*d: FLOCK %*s %*s %d %x:%x:%llu", &process, &major, &minor, &inode) !=
                4 ||
            inode != status.st_ino)
            continue;
        if (makedev(major, minor) == status.st_dev) return process;
        sameInode = process;
    }
    return sameInode;
}

}  // namespace

std::string describeThisProcess() {
    return describe(::getpid(), programOf(::getpid()));
}

std::string lockNote() {
    const std::string start = lifeOf(::getpid()).start;
    const std::string space = ownNamespace();
    const std::string number = std::to_string(::getpid());
    if (start.empty() || space.empty()) return number + "\n";
    return number + " " + start + " " + space + " " + programOf(::getpid()) + "\n";
}

std::string describeLockHolder(int file) {
    const std::optional<Note> note = readNote(file);
    if (const pid_t listed = listedHolder(file); listed > 0) {
        // A note of another process was left by one that was killed, or by somebody who takes no such lock.
        const Note known = note && note->process == listed && note->space == ownNamespace() ? *note : Note();
        const std::string program = known.program.empty() ? programOf(listed) : known.program;
        if (isThere(listed, known.start)) return describe(listed, program);
        // The lock belongs to the open file, which a child inherits.
        return "a child that " + describe(listed, known.program) + " left behind";
    }
    const std::string space = ownNamespace();
    if (!note || space.empty()) return "another process";
    if (note->space != space) return describe(note->process, note->program) + " in another container";
    if (isThere(note->process, note->start)) return describe(note->process, note->program);
    return "another process";
}

}  // namespace os
