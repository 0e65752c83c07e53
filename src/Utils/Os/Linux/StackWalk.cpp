// SPDX-License-Identifier: Apache-2.0
#include "Utils/Os/Linux/StackWalk.h"

#include <unwind.h>

#include <algorithm>
#include <array>
#include <cstdint>
#include <mutex>
#include <utility>

namespace os {

namespace {

using Word = std::uintptr_t;

constexpr std::size_t kMost = 40;

/// What a place on the stack held.
struct Held {
    const Word* place;
    Word word;
};

/// A walk, and what it found where. The unwinder follows tables at each frame, but all it takes from the
/// stack are the return addresses and, of functions that have one, the frame pointer of the caller. While
/// each of these is where it was, every frame is the one that it was.
struct Walk {
    const void* start;  ///< the frame of walkStack(); null for none
    std::size_t wanted;
    std::size_t count;
    std::size_t heldCount;
    std::array<void*, kMost> addresses;
    std::array<Held, 2 * kMost> held;

    // Not checked by AddressSanitizer: beyond a frame of another size than before, a place may be anything.
    [[gnu::no_sanitize_address]] bool isStill(const void* newStart, std::size_t newWanted) const noexcept {
        if (start != newStart || wanted != newWanted) return false;
        for (std::size_t i = 0; i < heldCount; ++i)
            if (*held[i].place != held[i].word) return false;
        return true;
    }
};

/// Of all threads, since no two have a frame at one place. Not thread-local: a thread that uses such a
/// variable for the first time while the library is closed would wait for the one that waits for it.
struct {
    std::mutex mutex;
    std::array<Walk, 31> walks;  // a prime number: stacks are powers of two apart
} memory;

struct Walker {
    std::span<void*> addresses;
    Walk* walk;  ///< to be remembered; null for one that cannot be
    std::size_t count = 0;
    Word canonicalFrame = 0;
    bool isInside = true;  ///< still in walkStack()
};

/// Where the ABI has the words: the return address right below the canonical frame address of the function
/// that was called, and below that, as a rule, the caller's frame pointer.
void remember(Walker& walker, _Unwind_Context* context) noexcept {
#ifdef __x86_64__
    constexpr int kFramePointer = 6;  // by its DWARF number
    if (walker.walk == nullptr) return;
    const auto* const end = reinterpret_cast<const Word*>(walker.canonicalFrame);
    Walk& walk = *walker.walk;
    if (end[-1] != _Unwind_GetIP(context)) {
        walker.walk = nullptr;  // a signal's frame
        return;
    }
    walk.held[walk.heldCount++] = {end - 1, end[-1]};
    if (end[-2] == _Unwind_GetGR(context, kFramePointer)) walk.held[walk.heldCount++] = {end - 2, end[-2]};
#else
    static_cast<void>(context);
    walker.walk = nullptr;
#endif
}

_Unwind_Reason_Code takeFrame(_Unwind_Context* context, void* argument) {
    auto& walker = *static_cast<Walker*>(argument);
    if (std::exchange(walker.isInside, false)) return _URC_NO_REASON;
    auto* const address = reinterpret_cast<void*>(_Unwind_GetIP(context));
    const Word frame = _Unwind_GetCFA(context);
    // A stack whose end has no mark repeats its last frame for ever.
    if (walker.count > 0 && walker.addresses[walker.count - 1] == address && walker.canonicalFrame == frame)
        return _URC_END_OF_STACK;
    walker.canonicalFrame = frame;
    walker.addresses[walker.count++] = address;
    // Above the first function of a thread there may be a null, which is nowhere on the stack.
    if (address != nullptr) remember(walker, context);
    return walker.count == walker.addresses.size() ? _URC_END_OF_STACK : _URC_NO_REASON;
}

}  // namespace

__attribute__((noinline)) std::size_t walkStack(std::span<void*> addresses) noexcept {
    constexpr std::size_t kAlignment = 16;
    if (addresses.empty()) return 0;
    const void* const start = __builtin_frame_address(0);
    // In a child of the process it may be held for ever.
    const std::unique_lock lock(memory.mutex, std::try_to_lock);
    Walk& known = memory.walks[reinterpret_cast<Word>(start) / kAlignment % memory.walks.size()];
    if (lock && known.isStill(start, addresses.size())) {
        std::copy_n(known.addresses.begin(), known.count, addresses.begin());
        return known.count;
    }
    const bool isRemembered = lock && addresses.size() <= kMost;
    if (isRemembered) known.start = nullptr;
    if (isRemembered) known.heldCount = 0;
    Walker walker{addresses, isRemembered ? &known : nullptr};
    _Unwind_Backtrace(&takeFrame, &walker);
    if (walker.count > 1 && walker.addresses[walker.count - 1] == nullptr) --walker.count;
    if (walker.walk == nullptr) return walker.count;
    known.start = start;
    known.wanted = addresses.size();
    known.count = walker.count;
    std::copy_n(addresses.begin(), known.count, known.addresses.begin());
    return walker.count;
}

}  // namespace os
