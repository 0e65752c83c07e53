// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <algorithm>
#include <cstdint>
#include <optional>
#include <span>

namespace ma {

/// What a caller of ma::prepareFlashImage() hands over, checked. Free of state.
struct ImageBuffers {
    std::span<const std::uint8_t> file;
    std::span<std::uint8_t> output;  ///< at least as long as the file

    /// Nothing when a buffer is missing or too small. An empty file needs no buffers: it is refused with the
    /// other files that are not images.
    static std::optional<ImageBuffers> of(const std::uint8_t* file, std::uint32_t fileSize,
                                          std::uint8_t* output, const std::uint32_t* imageSize) {
        const bool areMissing = fileSize != 0 && (file == nullptr || output == nullptr);
        if (areMissing || imageSize == nullptr || *imageSize < fileSize) return std::nullopt;
        return ImageBuffers{{file, fileSize}, {output, *imageSize}};
    }

    /// For images that are written as they are: copies the file, and returns the length of the image.
    std::uint32_t copyFile() const {
        std::ranges::copy(file, output.begin());
        return static_cast<std::uint32_t>(file.size());
    }
};

}  // namespace ma
