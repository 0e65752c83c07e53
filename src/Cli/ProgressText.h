// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <chrono>
#include <cstdint>
#include <optional>
#include <string>

namespace cli {

/// How far an update is: the second of the three layers of the progress display says it in words.
struct Progress {
    std::string adapter;
    unsigned percent = 0;
    std::uint64_t bytes = 0;               ///< of the whole image; 0 when that is not known
    std::chrono::milliseconds elapsed{0};  ///< since the first progress was seen
    unsigned percentAtStart = 0;           ///< what that first progress was
};

/// Percent a millisecond; nothing while there is too little to tell from.
std::optional<double> speedOf(const Progress& progress);

/// "eth0  [=======>      ]  52 %  128.3 of 246.8 KiB  41.2 KiB/s  0:03 left", made for a line of that width.
std::string barText(const Progress& progress, std::size_t width);

/// The same without a bar, for a log: "eth0: 52 %, 128.3 of 246.8 KiB, 41.2 KiB/s, 0:03 left".
std::string lineText(const Progress& progress);

/// "512 B", "41.2 KiB", "3.0 MiB".
std::string byteText(std::uint64_t bytes);
/// "0:03", "12:40", "1:02:03".
std::string durationText(std::chrono::seconds duration);

}  // namespace cli
