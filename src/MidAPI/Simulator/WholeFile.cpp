#include "MidAPI/Simulator/WholeFile.h"

#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <system_error>

#include "MidAPI/Simulator/FlashFiles.h"
#include "Utils/Os/Linux/Descriptor.h"

namespace ma {
namespace {

/// Returns 0, or the errno value of what went wrong.
int readUpTo(int descriptor, std::size_t most, std::vector<uint8_t>& bytes) {
    constexpr std::size_t STEP = std::size_t{256} * 1024;
    std::size_t length = 0;
    while (length < most) {
        bytes.resize(std::min(most, length + STEP));
        const ssize_t count = ::read(descriptor, bytes.data() + length, bytes.size() - length);
        if (count < 0 && errno == EINTR) continue;
        if (count < 0) return errno;
        if (count == 0) break;
        length += static_cast<std::size_t>(count);
    }
    bytes.resize(length);
    return 0;
}

}  // namespace

std::optional<std::vector<uint8_t>> readWholeFile(const std::string& path, std::size_t most) {
    const os::Descriptor file(
        ::open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK));  // a FIFO must not hang
    if (file.number() < 0 && errno == ENOENT) return std::nullopt;
    std::vector<uint8_t> bytes;
    const int reason = file.number() < 0 ? errno : readUpTo(file.number(), most, bytes);
    if (reason != 0) throw FlashError("cannot read " + path + ": " + std::generic_category().message(reason));
    return bytes;
}

}  // namespace ma
