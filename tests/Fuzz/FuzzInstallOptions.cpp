// SPDX-License-Identifier: Apache-2.0
#include <string>

#include "Fuzz/Fuzz.h"
#include "Providers/SoftwareUpdate/ImageVerification.h"
#include "Providers/SoftwareUpdate/MethodResults.h"
#include "Utils/Utils.h"

namespace {

/// The first line has the options, a character each; the others are the values.
struct Input {
    explicit Input(const std::string& text) {
        utils::StringArray lines = utils::split(text, '\n');
        for (const char c : lines.front())
            options.push_back(c == 'T' ? 32768 : static_cast<std::uint16_t>(c - '0'));
        values.assign(lines.begin() + 1, lines.end());
    }

    std::vector<std::uint16_t> options;
    std::vector<std::string> values;
};

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, size_t size) {
    const Input input(std::string(data, data + size));
    try {
        std::size_t types = 0;
        for (const utils::FirmwareType type : getTargetTypes(input.options, input.values)) {
            require(type >= utils::FirmwareType::None && type <= utils::FirmwareType::FCoE);
            ++types;
        }
        require(types <= size + 1);
    } catch (const utils::EInvalidParameter&) {
        // A name that is not known: the one refusal.
    }
    return 0;
}
