#include "MidAPI/Image/OptionRomWriter.h"

#include <algorithm>
#include <string_view>

#include "MidAPI/Image/ByteView.h"
#include "MidAPI/Image/RomChecksum.h"

namespace ma {
namespace {

// Where a made image has its parts.
constexpr std::size_t MADE_DATA_STRUCTURE = rom::HEADER_LENGTH;
constexpr std::size_t MADE_PNP = 0x40;
constexpr std::size_t MADE_MANUFACTURER = 0x60;
constexpr std::size_t MADE_PRODUCT = 0x70;
constexpr std::size_t MADE_CODE = 0x100;
constexpr std::size_t MADE_DEVICE_LIST = 0x110;
constexpr std::size_t MOST_DEVICE_IDS = 64;
constexpr uint8_t FAR_RETURN = 0xCB;
constexpr uint16_t EFI_BOOT_SERVICE_DRIVER = 11;
constexpr uint16_t EFI_MACHINE_X86_64 = 0x8664;

void mendChecksum(std::span<uint8_t> image, uint8_t wrongBy) {
    image[rom::HEADER_CHECKSUM] = static_cast<uint8_t>(image[rom::HEADER_CHECKSUM] - wrongBy);
}

/// Writes a byte of an image; the sum of a code type 0 image stays what it was.
void patch(std::span<uint8_t> image, bool hasChecksum, std::size_t offset, uint8_t value) {
    const auto change = static_cast<uint8_t>(value - image[offset]);
    image[offset] = value;
    if (hasChecksum) mendChecksum(image, change);
}

void setLastBit(std::span<uint8_t> image, bool last) {
    const std::size_t data = readLe16(image, rom::HEADER_DATA_STRUCTURE);
    const uint8_t old = image[data + rom::PCIR_INDICATOR];
    const auto wanted = static_cast<uint8_t>(last ? old | rom::LAST_IMAGE : old & ~rom::LAST_IMAGE);
    patch(image, image[data + rom::PCIR_CODE_TYPE] == rom::CODE_PC_AT, data + rom::PCIR_INDICATOR, wanted);
}

void putText(std::span<uint8_t> image, std::size_t offset, std::string_view text) {
    std::copy(text.begin(), text.end(), image.begin() + static_cast<std::ptrdiff_t>(offset));
}

std::string_view productName(utils::FirmwareType type) {
    if (type == utils::FirmwareType::iSCSI) return "Simulated iSCSI boot";
    if (type == utils::FirmwareType::FCoE) return "Simulated FCoE boot";
    return "Simulated PXE boot";
}

void putDataStructure(std::span<uint8_t> image, const NewRomImage& wanted, bool efi) {
    const std::span<uint8_t> data = image.subspan(MADE_DATA_STRUCTURE);
    putText(data, 0, "PCIR");
    writeLe16(data, rom::PCIR_VENDOR, wanted.vendorId);
    writeLe16(data, rom::PCIR_DEVICE, wanted.deviceId);
    writeLe16(data, rom::PCIR_LENGTH, rom::PCIR_LENGTH_REVISION_3);
    data[rom::PCIR_REVISION] = 3;
    writeLe16(data, rom::PCIR_CLASS, static_cast<uint16_t>(wanted.classCode & 0xFFFF));
    data[rom::PCIR_CLASS + 2] = static_cast<uint8_t>(wanted.classCode >> 16 & 0xFF);
    writeLe16(data, rom::PCIR_IMAGE_UNITS, static_cast<uint16_t>(image.size() / rom::UNIT));
    writeLe16(data, rom::PCIR_CODE_REVISION, wanted.codeRevision);
    data[rom::PCIR_CODE_TYPE] = efi ? rom::CODE_EFI : rom::CODE_PC_AT;
    data[rom::PCIR_INDICATOR] = rom::LAST_IMAGE;
    if (!efi && (wanted.clp || wanted.type == utils::FirmwareType::CLP))
        writeLe16(data, rom::PCIR_CLP, MADE_CODE);
    if (wanted.furtherDeviceIds.empty()) return;
    writeLe16(data, rom::PCIR_DEVICE_LIST, MADE_DEVICE_LIST - MADE_DATA_STRUCTURE);
    const std::size_t count = std::min(wanted.furtherDeviceIds.size(), MOST_DEVICE_IDS);
    for (std::size_t index = 0; index < count; ++index)
        writeLe16(image, MADE_DEVICE_LIST + 2 * index, wanted.furtherDeviceIds[index]);
}

void putEfiHeader(std::span<uint8_t> image) {
    writeLe16(image, rom::HEADER_RUNTIME_UNITS, static_cast<uint16_t>(image.size() / rom::UNIT));
    writeLe32(image, rom::HEADER_EFI_SIGNATURE, rom::EFI_SIGNATURE);
    writeLe16(image, rom::HEADER_EFI_SUBSYSTEM, EFI_BOOT_SERVICE_DRIVER);
    writeLe16(image, rom::HEADER_EFI_MACHINE, EFI_MACHINE_X86_64);
    writeLe16(image, rom::HEADER_EFI_IMAGE, MADE_CODE);
}

void putPcAtHeader(std::span<uint8_t> image, utils::FirmwareType type) {
    image[rom::HEADER_RUNTIME_UNITS] =
        static_cast<uint8_t>(std::min<std::size_t>(image.size() / rom::UNIT, 0xFF));
    image[rom::HEADER_ENTRY] = FAR_RETURN;
    writeLe16(image, rom::HEADER_PNP, MADE_PNP);
    const std::span<uint8_t> pnp = image.subspan(MADE_PNP, rom::PNP_LENGTH);
    putText(pnp, 0, "$PnP");
    writeLe16(pnp, rom::PNP_MANUFACTURER, MADE_MANUFACTURER);
    writeLe16(pnp, rom::PNP_PRODUCT, MADE_PRODUCT);
    putText(image, MADE_MANUFACTURER, "Simulator");
    putText(image, MADE_PRODUCT, productName(type));
}

}  // namespace

std::size_t composeOptionRom(std::span<const std::span<const uint8_t>> images, std::span<uint8_t> output) {
    std::size_t length = 0;
    for (std::size_t index = 0; index < images.size(); ++index) {
        const std::span<const uint8_t> source = images[index];
        if (!fitsIn(length, source.size(), output.size())) break;
        const std::span<uint8_t> target = output.subspan(length, source.size());
        std::copy(source.begin(), source.end(), target.begin());
        setLastBit(target, index + 1 == images.size());
        length += source.size();
    }
    return length;
}

std::vector<uint8_t> mergeOptionRoms(std::span<const uint8_t> base, std::span<const uint8_t> update) {
    const RomFile incoming = parseOptionRom(update);
    std::vector<std::span<const uint8_t>> images;
    std::vector<bool> taken(incoming.images.size());
    const auto take = [&](utils::FirmwareType type) {
        bool found = false;
        for (std::size_t index = 0; index < incoming.images.size(); ++index) {
            if (incoming.images[index].type != type) continue;
            found = true;
            if (!taken[index]) images.push_back(imageBytes(update, incoming.images[index]));
            taken[index] = true;
        }
        return found;
    };
    if (!base.empty())
        for (const RomImage& image : parseOptionRom(base).images)
            if (!take(image.type)) images.push_back(imageBytes(base, image));
    for (const RomImage& image : incoming.images)
        take(image.type);

    std::size_t length = 0;
    for (const std::span<const uint8_t>& image : images)
        length += image.size();
    std::vector<uint8_t> merged(length);
    composeOptionRom(images, merged);
    return merged;
}

void setCodeRevision(std::span<uint8_t> file, const RomImage& image, uint16_t revision) {
    if (!fitsIn(image.offset, image.length, file.size())) return;
    const std::span<uint8_t> bytes = file.subspan(image.offset, image.length);
    const std::size_t field = image.dataStructure + rom::PCIR_CODE_REVISION;
    const bool hasChecksum = image.codeType == rom::CODE_PC_AT;
    patch(bytes, hasChecksum, field, static_cast<uint8_t>(revision & 0xFF));
    patch(bytes, hasChecksum, field + 1, static_cast<uint8_t>(revision >> 8));
}

std::vector<uint8_t> makeRomImage(const NewRomImage& wanted) {
    const std::size_t units = std::clamp<std::size_t>((wanted.length + rom::UNIT - 1) / rom::UNIT, 1, 0xFFFF);
    std::vector<uint8_t> image(units * rom::UNIT);
    const bool efi = wanted.type == utils::FirmwareType::UEFI;
    writeLe16(image, 0, rom::SIGNATURE);
    writeLe16(image, rom::HEADER_DATA_STRUCTURE, MADE_DATA_STRUCTURE);
    image[MADE_CODE] = FAR_RETURN;
    putDataStructure(image, wanted, efi);
    if (efi)
        putEfiHeader(image);
    else
        putPcAtHeader(image, wanted.type);
    if (!efi) mendChecksum(image, sumOfImage(image));
    return image;
}

}  // namespace ma
