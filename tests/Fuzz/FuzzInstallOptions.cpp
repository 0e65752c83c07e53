// SPDX-License-Identifier: Apache-2.0
#include "Fuzz/Fuzz.h"
#include "Providers/SoftwareUpdate/ImageVerification.h"
#include "Providers/SoftwareUpdate/MethodResults.h"
#include "Utils/Utils.h"

/// The first line has the options, a character each; the others are the values.
void fuzz(const std::string& bytes) {
    utils::StringArray values = utils::split(bytes, '\n');
    std::vector<std::uint16_t> options;
    for (const char c : values.front())
        options.push_back(c == 'T' ? 32768 : static_cast<std::uint16_t>(c - '0'));
    values.erase(values.begin());
    try {
        const std::vector<utils::FirmwareType> types = getTargetTypes(options, values);
        for (const utils::FirmwareType type : types)
            require(type >= utils::FirmwareType::None && type <= utils::FirmwareType::FCoE);
        require(types.size() <= bytes.size() + 1);
    } catch (const utils::EInvalidParameter&) {
        // A name that is not known: the one refusal.
    }
}
