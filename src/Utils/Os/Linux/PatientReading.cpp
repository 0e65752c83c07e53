// SPDX-License-Identifier: Apache-2.0
#include "Utils/Os/Linux/PatientReading.h"

#include <fcntl.h>
#include <pthread.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <climits>
#include <condition_variable>
#include <cstdio>
#include <filesystem>
#include <mutex>
#include <new>
#include <utility>

#include "Utils/Os/Linux/SignalsBlocked.h"
#include "Utils/Os/Linux/linux.h"

namespace os {

namespace {

using Clock = std::chrono::steady_clock;
using std::chrono::milliseconds;

constexpr std::size_t kStep = std::size_t{64} * 1024;
constexpr std::size_t kSmallStep = 4096;
constexpr milliseconds kFree(1000);  // a step that takes no longer uses up no patience
constexpr milliseconds kLook(100);   // between two looks at a reader that works
constexpr unsigned int kMaxLeftBehind = 64;

/// One file, looked at and perhaps read on a thread of its own.
struct Reading {
    std::string path;
    std::string key;        ///< one for "/a", "//a" and "/./a"
    std::int64_t most = 0;  ///< a larger file is not read
    FileLook found{};
    int error = 0;  ///< errno of what failed
    std::atomic<std::uint64_t> steps = 0;
    bool isDone = false;
    std::atomic<bool> isLeftBehind = false;
    Reading* next = nullptr;  ///< in the list of those under way
};

/// All readings under way. Never destroyed: a thread that was left behind may end after everything else.
struct Readings {
    std::mutex mutex;
    std::condition_variable changed;
    Reading* first = nullptr;
    unsigned int leftBehind = 0;

    static Readings& all() {
        static Readings& readings = *new Readings;
        return readings;
    }
    const Reading* find(const std::string& key) const {
        const Reading* each = first;
        while (each != nullptr && each->key != key)
            each = each->next;
        return each;
    }
    void add(Reading& reading) { reading.next = std::exchange(first, &reading); }
    void remove(const Reading& reading) {
        Reading** link = &first;
        while (*link != &reading)
            link = &(*link)->next;
        *link = reading.next;
    }
};

/// The path without empty and "." parts. Those with ".." stay: what they lead to depends on links.
std::string keyOf(const std::string& path) {
    std::string key = path.starts_with('/') ? "" : ".";
    for (const auto& part : std::filesystem::path(path)) {
        if (!part.empty() && part != "." && part != "/") key += '/' + part.string();
    }
    return key;
}

void reached(Reading& reading) {
    ++reading.steps;
    if (const auto test = beforeFileAccess.load()) test(reading.path);
}

FileKind kindOf(const struct stat& status) {
    if (S_ISDIR(status.st_mode)) return FileKind::Directory;
    return S_ISREG(status.st_mode) ? FileKind::Regular : FileKind::CannotBeOpened;
}

/// As many bytes as the file had when it was opened, even if it grows.
void readFrom(int file, Reading& reading) {
    FileLook& found = reading.found;
    const auto size = static_cast<std::size_t>(found.size);
    found.bytes.reset(new (std::nothrow) std::uint8_t[size]);
    found.isWithoutMemory = found.bytes == nullptr;
    std::size_t step = kStep;
    // A slow medium would give the rest of a file that nobody waits for any more.
    while (!found.isWithoutMemory && found.count < size && !reading.isLeftBehind) {
        const auto begun = Clock::now();
        reached(reading);
        const ssize_t got = ::read(file, found.bytes.get() + found.count, std::min(step, size - found.count));
        if (got < 0 && errno == EINTR) continue;
        if (got <= 0) return;
        found.count += static_cast<std::size_t>(got);
        if (step == kSmallStep || Clock::now() - begun <= kFree) continue;
        // Slow, or silent for a while? Small steps tell, as long as the system does not read ahead.
        step = kSmallStep;
        ::posix_fadvise(file, 0, 0, POSIX_FADV_RANDOM);
    }
}

/// Of the file that is open: what its path leads to can be another one by now.
std::string realPathOf(int file) noexcept try {
    // Nothing whose templates other libraries have too: the loader would take theirs, and never unmap them.
    std::array<char, 32> link{};
    std::snprintf(link.data(), link.size(), "/proc/self/fd/%d", file);
    std::array<char, PATH_MAX> path{};
    const ssize_t length = ::readlink(link.data(), path.data(), path.size());
    return length < 0 ? std::string() : std::string(path.data(), static_cast<std::size_t>(length));
} catch (const std::bad_alloc&) {
    return {};
}

void carryOut(Reading& reading) {
    struct stat status {};
    // A path with a NUL in it names nothing, and must not open what its head names.
    if (reading.path.find('\0') != std::string::npos) return;
    reached(reading);
    // Told before the opening: to open a device can rewind a tape or reset a modem.
    if (::stat(reading.path.c_str(), &status) != 0) {
        reading.error = errno;
        return;
    }
    if (kindOf(status) == FileKind::CannotBeOpened) return;
    reached(reading);
    const Descriptor file(openForReading(reading.path));
    if (!file.isOpen()) reading.error = errno;
    // A process without standard input gets number 0 here, and counts as one that cannot open files.
    if (file.number() <= 0) return;
    const bool isKnown = ::fstat(file.number(), &status) == 0;
    FileLook& found = reading.found;
    found.kind = isKnown ? kindOf(status) : FileKind::CannotBeLookedAt;
    if (found.kind != FileKind::Regular) return;
    found.size = status.st_size;
    found.realPath = realPathOf(file.number());
    if (found.size <= reading.most) readFrom(file.number(), reading);
}

void* readerThread(void* argument) {
    auto* reading = static_cast<Reading*>(argument);
    carryOut(*reading);
    Readings& readings = Readings::all();
    const std::lock_guard lock(readings.mutex);
    reading->isDone = true;
    readings.changed.notify_all();
    if (!reading->isLeftBehind) return nullptr;
    readings.remove(*reading);
    --readings.leftBehind;
    delete reading;
    return nullptr;
}

/// Waits until `isEnough` says so, or for too long; false then. A silence ends whenever `steps` moves.
template <typename Condition, typename Steps>
bool waitFor(std::unique_lock<std::mutex>& lock, Patience& patience, Condition isEnough, Steps steps) {
    auto since = Clock::now();
    std::uint64_t seen = steps();
    for (;;) {
        const bool isDone = isEnough();
        const std::uint64_t moved = steps();
        const auto now = Clock::now();
        const auto silence = std::chrono::duration_cast<milliseconds>(now - since);
        if (isDone || moved != seen) {
            if (silence > kFree) patience.left -= silence;
            seen = moved;
            since = now;
        }
        if (isDone) return true;
        const milliseconds left = std::max(patience.left, kFree);
        if (silence >= std::min(patience.silence, left)) {
            patience.isUsedUp = silence < patience.silence;
            return false;
        }
        Readings::all().changed.wait_until(lock, now + kLook);
    }
}

/// False when the reading was given up, which then belongs to its thread.
bool carryOutPatiently(std::unique_ptr<Reading>& reading, Patience& patience) {
    Readings& readings = Readings::all();
    std::unique_lock lock(readings.mutex);
    // One reader a file: whatever asks for a file that hangs must not leave ever more of them behind.
    const auto other = [&] { return readings.find(reading->key); };
    const bool isFree = waitFor(
        lock, patience, [&] { return other() == nullptr || other()->isLeftBehind; },
        [&] { return other() == nullptr ? 0 : other()->steps.load(); });
    if (readings.leftBehind >= kMaxLeftBehind) patience.hungFiles = readings.leftBehind;
    if (!isFree || other() != nullptr || patience.hungFiles != 0) return false;
    pthread_t thread{};
    if (const utils::SignalsBlocked blocked;
        ::pthread_create(&thread, nullptr, &readerThread, reading.get()) != 0) {
        // A process that gets no threads can still update its adapters.
        lock.unlock();
        carryOut(*reading);
        return true;
    }
    readings.add(*reading);
    const bool isDone = waitFor(
        lock, patience, [&] { return reading->isDone; }, [&] { return reading->steps.load(); });
    if (isDone) {
        readings.remove(*reading);
        readings.changed.notify_all();
        lock.unlock();
        ::pthread_join(thread, nullptr);
        return true;
    }
    reading.release()->isLeftBehind = true;
    ++readings.leftBehind;
    ::pthread_detach(thread);
    return false;
}

}  // namespace

std::atomic<void (*)(const std::string& path)> beforeFileAccess = nullptr;

int openForReading(const std::string& path) noexcept {
    constexpr int kFlags = O_RDONLY | O_CLOEXEC | O_NOCTTY;
    // A FIFO may take the file's place after any look at it.
    const int file = ::open(path.c_str(), kFlags | O_NONBLOCK);
    if (file >= 0 || errno != EWOULDBLOCK) return file;
    // A lease: the kernel takes it back while this waits. Some devices are busy for ever.
    struct stat status {};
    return ::stat(path.c_str(), &status) == 0 && S_ISREG(status.st_mode) ? ::open(path.c_str(), kFlags) : -1;
}

std::optional<FileLook> lookAtFile(const std::string& path, std::int64_t most, Patience& patience) {
    auto reading = std::make_unique<Reading>();
    reading->path = path;
    reading->key = keyOf(path);
    reading->most = most;
    if (!carryOutPatiently(reading, patience)) return std::nullopt;
    // As if it had been opened here: who logs the failure may ask for it.
    if (reading->error != 0) errno = reading->error;
    return std::move(reading->found);
}

}  // namespace os
