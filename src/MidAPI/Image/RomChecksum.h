#pragma once

#include <cstdint>
#include <span>

#include "MidAPI/Image/RomLayout.h"

namespace ma {

/// Sum of all bytes modulo 256. `image` is a multiple of rom::UNIT long.
inline uint8_t sumOfImage(std::span<const uint8_t> image) {
    uint8_t sum = 0;
    // A fixed inner count: the compiler makes vector code of it.
    for (std::size_t block = 0; block < image.size(); block += rom::UNIT) {
        const uint8_t* bytes = image.data() + block;
        for (std::size_t index = 0; index < rom::UNIT; ++index)
            sum = static_cast<uint8_t>(sum + bytes[index]);
    }
    return sum;
}

}  // namespace ma
