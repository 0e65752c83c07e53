#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace ma {

/// The first bytes of a file, `most` of them if it has so many; nothing when there is no such file. Throws
/// FlashError when it cannot be read.
std::optional<std::vector<uint8_t>> readWholeFile(const std::string& path, std::size_t most);

}  // namespace ma
