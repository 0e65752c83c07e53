// SPDX-License-Identifier: Apache-2.0
#include <algorithm>

#include "Fuzz/Fuzz.h"
#include "MidAPI/Image/ImagePreparation.h"
#include "MidAPI/Image/OptionRom.h"

namespace {

using Bytes = std::vector<uint8_t>;

/// The first bytes of an input choose the requested types and what the adapter is and carries; the rest is
/// the file.
struct Input {
    explicit Input(std::string_view data) {
        const auto next = [&data] {
            if (data.empty()) return uint8_t{0};
            const char byte = data.front();
            data.remove_prefix(1);
            return static_cast<uint8_t>(byte);
        };
        for (int count = next() % 4; count > 0; --count)
            requested.push_back(static_cast<utils::FirmwareType>(next() % 8 - 1));
        target.vendorId = 0x1af4;
        target.deviceId = 0x1041;
        for (int count = next() % 4; count > 0; --count)
            target.components.push_back({static_cast<utils::FirmwareType>(next() % 6), next()});
        file.assign(data.begin(), data.end());
    }

    std::vector<utils::FirmwareType> requested;
    ma::PreparationTarget target;
    Bytes file;  // a block of its own: reading past its end is seen
};

/// Whatever can be read can be changed and merged, and is then still in order.
void checkWriters(const Bytes& file, const ma::RomFile& rom) {
    Bytes changed = file;
    for (const ma::RomImage& image : rom.images)
        ma::setCodeRevision(changed, image, 0x1234);
    const ma::RomFile again = ma::parseOptionRom(changed);
    require(!again.error && again.images.size() == rom.images.size());
    const Bytes merged = ma::mergeOptionRoms(changed, file);
    require(!ma::parseOptionRom(merged).error);
}

}  // namespace

void fuzz(const std::string& bytes) {
    Input input(bytes);
    const ma::RomFile rom = ma::parseOptionRom(input.file);
    require(rom.error || !rom.images.empty());
    if (!rom.error) checkWriters(input.file, rom);

    for (const bool adopt : {false, true}) {
        // Few inputs name the right card: make the adapter the card of the first image.
        if (adopt && !rom.images.empty()) {
            input.target.vendorId = rom.images[0].vendorId;
            input.target.deviceId = rom.images[0].deviceId;
        }
        const ma::Preparation prepared = ma::assessImage(input.target, input.file, input.requested);
        require(prepared.reason.empty() == (prepared.status == ma::PrepareStatus::Prepared));
        require(ma::hasOutput(prepared.status) == !prepared.chosen.empty());
        if (!ma::hasOutput(prepared.status)) continue;
        require(std::is_sorted(prepared.types.begin(), prepared.types.end()) && !prepared.types.empty());
        Bytes output(input.file.size());
        output.resize(ma::composeChosen(prepared, input.file, output));
        const ma::RomFile made = ma::parseOptionRom(output);
        require(!made.error && std::ranges::equal(made.images, prepared.chosen, {}, &ma::RomImage::type,
                                                  &ma::RomImage::type));
    }
}
