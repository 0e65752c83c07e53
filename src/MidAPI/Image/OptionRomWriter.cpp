// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Image/OptionRom.h"

#include <algorithm>
#include <string_view>

#include "MidAPI/Image/RomFormat.h"

namespace ma {
namespace {

// Where a made image has its parts.
constexpr std::size_t kMadeDataStructure = rom::kHeaderLength;
constexpr std::size_t kMadePnp = 0x40;
constexpr std::size_t kMadeManufacturer = 0x60;
constexpr std::size_t kMadeProduct = 0x70;
constexpr std::size_t kMadeCode = 0x100;
constexpr std::size_t kMadeDeviceList = 0x110;
constexpr std::size_t kMaxDeviceIds = 64;
constexpr std::uint8_t kFarReturn = 0xCB;
constexpr std::uint16_t kEfiBootServiceDriver = 11;
constexpr std::uint16_t kEfiMachineX8664 = 0x8664;

void fixChecksum(std::span<std::uint8_t> image, std::uint8_t wrongBy) {
    image[rom::kHeaderChecksum] = static_cast<std::uint8_t>(image[rom::kHeaderChecksum] - wrongBy);
}

/// Writes a byte of an image; the sum of a code type 0 image stays what it was, also when it was wrong: a
/// change of ours must not hide damage.
void patch(std::span<std::uint8_t> image, bool hasChecksum, std::size_t offset, std::uint8_t value) {
    const auto change = static_cast<std::uint8_t>(value - image[offset]);
    image[offset] = value;
    if (hasChecksum) fixChecksum(image, change);
}

void setLastBit(std::span<std::uint8_t> image, bool last) {
    const std::size_t data = readLe16(image, rom::kHeaderDataStructure);
    const std::uint8_t old = image[data + rom::kPcirIndicator];
    const auto wanted = static_cast<std::uint8_t>(last ? old | rom::kLastImage : old & ~rom::kLastImage);
    patch(image, image[data + rom::kPcirCodeType] == rom::CodeType::PcAt, data + rom::kPcirIndicator, wanted);
}

void putText(std::span<std::uint8_t> image, std::size_t offset, std::string_view text) {
    std::copy(text.begin(), text.end(), image.begin() + static_cast<std::ptrdiff_t>(offset));
}

/// Names by which typeOfProduct() finds the type again.
std::string_view productName(utils::FirmwareType type) {
    if (type == utils::FirmwareType::iSCSI) return "Simulated iSCSI boot";
    if (type == utils::FirmwareType::FCoE) return "Simulated FCoE boot";
    return "Simulated PXE boot";
}

void putDataStructure(std::span<std::uint8_t> image, const NewRomImage& wanted, bool efi) {
    const std::span<std::uint8_t> data = image.subspan(kMadeDataStructure);
    putText(data, 0, "PCIR");
    writeLe16(data, rom::kPcirVendor, wanted.vendorId);
    writeLe16(data, rom::kPcirDevice, wanted.deviceId);
    writeLe16(data, rom::kPcirLength, rom::kPcirLengthRevision3);
    data[rom::kPcirRevision] = 3;
    writeLe16(data, rom::kPcirClass, static_cast<std::uint16_t>(wanted.classCode & 0xFFFF));
    data[rom::kPcirClass + 2] = static_cast<std::uint8_t>(wanted.classCode >> 16 & 0xFF);
    writeLe16(data, rom::kPcirImageUnits, static_cast<std::uint16_t>(image.size() / rom::kBlockSize));
    writeLe16(data, rom::kPcirCodeRevision, wanted.codeRevision);
    data[rom::kPcirCodeType] = efi ? rom::CodeType::Efi : rom::CodeType::PcAt;
    data[rom::kPcirIndicator] = rom::kLastImage;
    if (!efi && (wanted.clp || wanted.type == utils::FirmwareType::CLP))
        writeLe16(data, rom::kPcirClp, kMadeCode);
    if (wanted.furtherDeviceIds.empty()) return;
    writeLe16(data, rom::kPcirDeviceList, kMadeDeviceList - kMadeDataStructure);
    const std::size_t count = std::min(wanted.furtherDeviceIds.size(), kMaxDeviceIds);
    for (std::size_t index = 0; index < count; ++index)
        writeLe16(image, kMadeDeviceList + 2 * index, wanted.furtherDeviceIds[index]);
}

/// An EFI image keeps its signature where a PC-AT image keeps code and checksum.
void putEfiHeader(std::span<std::uint8_t> image) {
    writeLe16(image, rom::kHeaderRuntimeUnits, static_cast<std::uint16_t>(image.size() / rom::kBlockSize));
    writeLe32(image, rom::kHeaderEfiSignature, rom::kEfiSignature);
    writeLe16(image, rom::kHeaderEfiSubsystem, kEfiBootServiceDriver);
    writeLe16(image, rom::kHeaderEfiMachine, kEfiMachineX8664);
    writeLe16(image, rom::kHeaderEfiImage, kMadeCode);
}

void putPcAtHeader(std::span<std::uint8_t> image, utils::FirmwareType type) {
    image[rom::kHeaderRuntimeUnits] =
        static_cast<std::uint8_t>(std::min<std::size_t>(image.size() / rom::kBlockSize, 0xFF));
    image[rom::kHeaderEntry] = kFarReturn;
    writeLe16(image, rom::kHeaderPnp, kMadePnp);
    const std::span<std::uint8_t> pnp = image.subspan(kMadePnp, rom::kPnpLength);
    putText(pnp, 0, "$PnP");
    writeLe16(pnp, rom::kPnpManufacturer, kMadeManufacturer);
    writeLe16(pnp, rom::kPnpProduct, kMadeProduct);
    putText(image, kMadeManufacturer, "Simulator");
    putText(image, kMadeProduct, productName(type));
}

}  // namespace

std::size_t composeOptionRom(std::span<const std::span<const std::uint8_t>> images,
                             std::span<std::uint8_t> output) {
    std::size_t length = 0;
    for (std::size_t index = 0; index < images.size(); ++index) {
        const std::span<const std::uint8_t> source = images[index];
        // Cut short rather than written beyond the buffer; a caller that kept to the contract never gets
        // here.
        if (!fitsIn(length, source.size(), output.size())) break;
        const std::span<std::uint8_t> target = output.subspan(length, source.size());
        std::copy(source.begin(), source.end(), target.begin());
        setLastBit(target, index + 1 == images.size());
        length += source.size();
    }
    return length;
}

std::vector<std::uint8_t> mergeOptionRoms(std::span<const std::uint8_t> base,
                                          std::span<const std::uint8_t> update) {
    const RomFile incoming = parseOptionRom(update);
    // A new image takes the place of the first old one of its type: a BIOS tries images in their order, and
    // an update must not change what a machine boots first.
    std::vector<std::span<const std::uint8_t>> images;
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
    for (const std::span<const std::uint8_t>& image : images)
        length += image.size();
    std::vector<std::uint8_t> merged(length);
    composeOptionRom(images, merged);
    return merged;
}

void setCodeRevision(std::span<std::uint8_t> file, const RomImage& image, std::uint16_t revision) {
    if (!fitsIn(image.offset, image.length, file.size())) return;
    const std::span<std::uint8_t> bytes = file.subspan(image.offset, image.length);
    // Byte by byte: the field may straddle an odd place, and each byte changes the sum by itself.
    const std::size_t field = image.dataStructure + rom::kPcirCodeRevision;
    const bool hasChecksum = image.codeType == rom::CodeType::PcAt;
    patch(bytes, hasChecksum, field, static_cast<std::uint8_t>(revision & 0xFF));
    patch(bytes, hasChecksum, field + 1, static_cast<std::uint8_t>(revision >> 8));
}

std::vector<std::uint8_t> makeRomImage(const NewRomImage& wanted) {
    const std::size_t units =
        std::clamp<std::size_t>((wanted.length + rom::kBlockSize - 1) / rom::kBlockSize, 1, 0xFFFF);
    std::vector<std::uint8_t> image(units * rom::kBlockSize);
    const bool efi = wanted.type == utils::FirmwareType::UEFI;
    writeLe16(image, 0, rom::kSignature);
    writeLe16(image, rom::kHeaderDataStructure, kMadeDataStructure);
    // A machine that boots from this image calls its code, and gets control back at once.
    image[kMadeCode] = kFarReturn;
    putDataStructure(image, wanted, efi);
    if (efi)
        putEfiHeader(image);
    else
        putPcAtHeader(image, wanted.type);
    if (!efi) fixChecksum(image, rom::sumOfImage(image));
    return image;
}

}  // namespace ma
