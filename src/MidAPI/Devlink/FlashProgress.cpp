// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Devlink/FlashProgress.h"

#include <algorithm>

namespace ma::devlink {
namespace {

constexpr std::uint64_t kMaxBeforeEnd = 99;  // a driver may yet fail after its last byte

}  // namespace

void FlashProgress::report(const FlashStatus& status) {
    std::uint64_t total = status.total;
    std::uint64_t done = std::min(status.done, total);
    if (total > UINT64_MAX / kMaxBeforeEnd) {
        constexpr std::uint64_t kScale = 128;  // what is left fits into 64 bits when multiplied
        total /= kScale;
        done /= kScale;
    }
    if (total > 0) advance(kMaxBeforeEnd * done / total);
}

void FlashProgress::partDone() {
    ++m_done;
    advance(0);
}

void FlashProgress::advance(std::uint64_t percentOfPart) {
    constexpr std::uint64_t kWhole = 100;
    m_progress.advance(static_cast<std::uint16_t>((kWhole * m_done + percentOfPart) / m_parts));
}

}  // namespace ma::devlink
