#include "MidAPI/AdapterError.h"
#include "MidAPI/Image/OptionRom.h"
#include "MidAPI/Image/OptionRomWriter.h"
#include "MidAPI/Simulator/AdapterDescription.h"
#include "MidAPI/Simulator/FlashFiles.h"
#include "MidAPI/Simulator/WholeFile.h"

namespace ma {
namespace {

constexpr std::size_t MOST_FLASH = std::size_t{64} * 1024 * 1024;

[[noreturn]] void refuseFlashFile(const AdapterDescription& adapter, const std::string& why) {
    throw AdapterError("adapter " + adapter.name + ": its flash_file " + adapter.flashFile + " " + why);
}

std::vector<uint8_t> readFlashFile(const AdapterDescription& adapter) try {
    if (adapter.flashFile.empty()) return {};
    std::optional<std::vector<uint8_t>> bytes = readWholeFile(adapter.flashFile, MOST_FLASH + 1);
    if (!bytes) refuseFlashFile(adapter, "is not there; name an expansion ROM file");
    if (bytes->size() > MOST_FLASH) refuseFlashFile(adapter, "is longer than 64 MiB");
    if (const RomFile rom = parseOptionRom(*bytes); rom.error)
        refuseFlashFile(adapter, "is no intact ROM image: " + *rom.error);
    return *bytes;
} catch (const FlashError& error) {
    refuseFlashFile(adapter, std::string("cannot be used: ") + error.what());
}

/// Gives every image of a type this code revision; false when there is none.
bool setRevisions(std::vector<uint8_t>& flash, const utils::FirmwareVersionInfo& component) {
    bool found = false;
    for (const RomImage& image : parseOptionRom(flash).images) {
        if (!image.carries(component.type)) continue;
        setCodeRevision(flash, image, static_cast<uint16_t>(component.version));
        found = true;
    }
    return found;
}

}  // namespace

std::vector<uint8_t> makeFactoryFlash(const AdapterDescription& adapter) {
    std::vector<uint8_t> flash = readFlashFile(adapter);
    for (const utils::FirmwareVersionInfo& component : adapter.components) {
        if (!flash.empty() && setRevisions(flash, component)) continue;
        NewRomImage wanted;
        wanted.type = component.type;
        wanted.vendorId = adapter.ids.vendor;
        wanted.deviceId = adapter.ids.device;
        wanted.codeRevision = static_cast<uint16_t>(component.version);
        flash = mergeOptionRoms(flash, makeRomImage(wanted));
    }
    return flash;
}

}  // namespace ma
