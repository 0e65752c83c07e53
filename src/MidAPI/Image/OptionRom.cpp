// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Image/OptionRom.h"

#include <algorithm>
#include <array>
#include <cinttypes>

#include "MidAPI/Image/RomFormat.h"
#include "Utils/Utils.h"

namespace ma {
namespace {

using Bytes = std::span<const std::uint8_t>;

constexpr std::array<std::string_view, 6> kTypeNames = {"",        "IMG_CLP",  "IMG_iSCSI",
                                                        "IMG_PXE", "IMG_UEFI", "IMG_FCoE"};

/// What is wrong with the image at hand; the offset is from the start of the image.
struct Flaw {
    std::size_t offset;
    std::string what;
};
using MaybeFlaw = std::optional<Flaw>;

std::string describe(std::size_t imageNumber, std::size_t imageOffset, const Flaw& flaw) {
    return utils::formatStr("image %zu at 0x%zx: ", imageNumber + 1, imageOffset) + flaw.what +
           utils::formatStr(" (offset 0x%zx)", imageOffset + flaw.offset);
}

/// An image without the bytes that writing it may change: checksum, revision, last-image bit. They count as
/// 0, since what tells the type must be the same when an image is checked and when it is written.
class LastingBytes {
  public:
    LastingBytes(Bytes image, std::size_t dataStructure) : m_image(image), m_dataStructure(dataStructure) {}

    std::size_t size() const { return m_image.size(); }
    std::uint8_t operator[](std::size_t offset) const { return changes(offset) ? 0 : m_image[offset]; }
    std::size_t number(std::size_t offset) const {
        return static_cast<std::size_t>((*this)[offset] | (*this)[offset + 1] << 8);
    }
    /// Whether these bytes stand at an offset that has room for them.
    bool holds(std::string_view bytes, std::size_t offset) const {
        for (const char byte : bytes)
            if ((*this)[offset++] != static_cast<std::uint8_t>(byte)) return false;
        return true;
    }
    /// The NUL-terminated text at an offset of the image; empty when there is none.
    std::string text(std::size_t offset) const {
        constexpr std::size_t kLongest = 255;
        std::string text;
        if (offset == 0) return text;
        // These texts reach logs and terminals; a file may hold anything.
        for (; offset < size() && (*this)[offset] != 0 && text.size() < kLongest; ++offset) {
            const char character = static_cast<char>(m_image[offset]);
            text += character >= ' ' && character <= '~' ? character : '?';
        }
        return text;
    }

  private:
    bool changes(std::size_t offset) const {
        const std::size_t inData = offset - m_dataStructure;  // a huge number in front of it
        return offset == rom::kHeaderChecksum || inData == rom::kPcirCodeRevision ||
               inData == rom::kPcirCodeRevision + 1 || inData == rom::kPcirIndicator;
    }

    Bytes m_image;
    std::size_t m_dataStructure;
};

bool contains(std::string_view text, std::string_view word) {
    const auto sameLetter = [](char a, char b) { return utils::lowerCase(a) == utils::lowerCase(b); };
    return std::search(text.begin(), text.end(), word.begin(), word.end(), sameLetter) != text.end();
}

/// PXE, iSCSI and FCoE share one code type; makers tell them apart in the product name alone.
utils::FirmwareType typeOfProduct(std::string_view product) {
    if (contains(product, "iSCSI")) return utils::FirmwareType::iSCSI;
    if (contains(product, "FCoE")) return utils::FirmwareType::FCoE;
    return utils::FirmwareType::PXE;
}

/// Follows the chain of Plug and Play headers to the first product name that tells a boot protocol; without
/// one the first header's texts stay. An image without such a header is in order: older ones have none.
void readPnp(const LastingBytes& image, RomImage& out) {
    out.type = utils::FirmwareType::PXE;
    std::size_t offset = image.number(rom::kHeaderPnp);
    // Each header points to the next one: a chain may be a ring.
    for (int header = 0; header < rom::kMaxPnpHeaders && offset != 0; ++header) {
        if (!fitsIn(offset, rom::kPnpLength, image.size()) || !image.holds("$PnP", offset)) return;
        std::string product = image.text(image.number(offset + rom::kPnpProduct));
        const utils::FirmwareType type = typeOfProduct(product);
        if (header == 0 || type != utils::FirmwareType::PXE) {
            out.manufacturer = image.text(image.number(offset + rom::kPnpManufacturer));
            out.product = std::move(product);
            out.type = type;
        }
        if (type != utils::FirmwareType::PXE) return;
        offset = image.number(offset + rom::kPnpNext);
    }
}

/// The list of further device ids; `data` is the image from the start of its PCI data structure on.
MaybeFlaw readDeviceList(Bytes data, RomImage& out) {
    std::size_t offset = readLe16(data, rom::kPcirDeviceList);
    if (offset == 0) return std::nullopt;
    // Else a change of the last-image bit or the revision would change the list.
    if (offset < readLe16(data, rom::kPcirLength))
        return Flaw{out.dataStructure + rom::kPcirDeviceList,
                    "the list of device ids lies inside the PCI data structure"};
    for (; fitsIn(offset, 2, data.size()); offset += 2) {
        const std::uint16_t id = readLe16(data, offset);
        if (id == 0) return std::nullopt;
        out.furtherDeviceIds.push_back(id);
    }
    return Flaw{out.dataStructure + rom::kPcirDeviceList, "the list of device ids has no end"};
}

/// Finds the PCI data structure and the length of the image that starts `rest`.
MaybeFlaw locate(Bytes rest, RomImage& out) {
    if (rest.size() < rom::kHeaderLength) return Flaw{0, "the file ends inside the image header"};
    if (readLe16(rest, 0) != rom::kSignature) return Flaw{0, "the signature 55 AA is missing"};
    const std::size_t offset = readLe16(rest, rom::kHeaderDataStructure);
    if (offset < rom::kHeaderLength || !fitsIn(offset, rom::kPcirLengthRevision0, rest.size()))
        return Flaw{rom::kHeaderDataStructure, "the PCI data structure lies outside the image"};
    const Bytes data = rest.subspan(offset);
    if (!std::equal(data.begin(), data.begin() + 4, "PCIR"))
        return Flaw{offset, "the PCI data structure does not begin with \"PCIR\""};
    // The length is that of the data structure, not the run-time length in the header, which a BIOS may
    // change.
    const std::size_t length = readLe16(data, rom::kPcirImageUnits) * rom::kBlockSize;
    if (length == 0) return Flaw{offset + rom::kPcirImageUnits, "the image length is 0"};
    if (length > rest.size()) {
        return Flaw{offset + rom::kPcirImageUnits,
                    "the image is " + std::to_string(length) + " bytes long, but the file has only " +
                        std::to_string(rest.size()) + " left: it is cut short"};
    }
    const std::size_t structureLength = readLe16(data, rom::kPcirLength);
    if (structureLength < rom::kPcirLengthRevision0 || !fitsIn(offset, structureLength, length))
        return Flaw{offset + rom::kPcirLength, "the length of the PCI data structure is wrong"};
    out.dataStructure = static_cast<std::uint32_t>(offset);
    out.length = static_cast<std::uint32_t>(length);
    return std::nullopt;
}

/// The fields of the PCI data structure; `data` as for readDeviceList().
MaybeFlaw readDataStructure(Bytes data, RomImage& out) {
    out.vendorId = readLe16(data, rom::kPcirVendor);
    out.deviceId = readLe16(data, rom::kPcirDevice);
    out.classCode = readLe16(data, rom::kPcirClass) | std::uint32_t{data[rom::kPcirClass + 2]} << 16;
    out.codeRevision = readLe16(data, rom::kPcirCodeRevision);
    out.codeType = data[rom::kPcirCodeType];
    out.last = (data[rom::kPcirIndicator] & rom::kLastImage) != 0;
    // Older structures end before the pointers to the device list and the CLP entry point.
    if (data[rom::kPcirRevision] < 3 || readLe16(data, rom::kPcirLength) < rom::kPcirLengthRevision3)
        return std::nullopt;
    out.clpEntry = readLe16(data, rom::kPcirClp);
    return readDeviceList(data, out);
}

MaybeFlaw readCode(Bytes image, RomImage& out) {
    if (out.codeType == rom::CodeType::PcAt) {
        // Only images for a BIOS have a checksum (PCI Firmware Specification 3.x); UEFI verifies its own way.
        const std::uint8_t sum = rom::sumOfImage(image);
        if (sum != 0)
            return Flaw{0, "the checksum is wrong: the bytes sum to " + std::to_string(sum) + ", not 0"};
        readPnp({image, out.dataStructure}, out);
    } else if (out.codeType == rom::CodeType::Efi) {
        if (readLe32(image, rom::kHeaderEfiSignature) != rom::kEfiSignature)
            return Flaw{rom::kHeaderEfiSignature, "an EFI image without the EFI signature"};
        out.type = utils::FirmwareType::UEFI;
    }
    return std::nullopt;
}

MaybeFlaw readImage(Bytes rest, RomImage& out) {
    if (MaybeFlaw flaw = locate(rest, out)) return flaw;
    const Bytes image = rest.first(out.length);
    if (MaybeFlaw flaw = readDataStructure(image.subspan(out.dataStructure), out)) return flaw;
    return readCode(image, out);
}

}  // namespace

bool RomImage::fits(std::uint16_t vendor, std::uint16_t device) const {
    return vendorId == vendor &&
           (deviceId == device ||
            std::find(furtherDeviceIds.begin(), furtherDeviceIds.end(), device) != furtherDeviceIds.end());
}

bool RomImage::carries(utils::FirmwareType wanted) const {
    return wanted != utils::FirmwareType{} &&
           (type == wanted || (wanted == utils::FirmwareType::CLP && isClp()));
}

std::vector<utils::FirmwareVersionInfo> RomFile::components() const {
    std::vector<utils::FirmwareVersionInfo> found;
    // By type, not by image, so that the list is ascending: callers look types up by a binary search.
    for (std::size_t index = 1; index < kTypeNames.size(); ++index) {
        const auto type = static_cast<utils::FirmwareType>(index);
        std::optional<std::uint16_t> highest;
        for (const RomImage& image : images)
            if (image.carries(type)) highest = std::max(highest.value_or(0), image.codeRevision);
        if (highest) found.push_back({type, *highest});
    }
    return found;
}

RomFile parseOptionRom(std::span<const std::uint8_t> file) {
    RomFile result;
    std::size_t offset = 0;
    for (bool last = false; !last;) {
        const std::size_t number = result.images.size();
        RomImage image;
        image.offset = static_cast<std::uint32_t>(offset);
        MaybeFlaw flaw;
        if (file.empty())
            flaw = Flaw{0, "the file is empty"};
        else if (number == rom::kMaxImages)
            flaw = Flaw{0, "more than " + std::to_string(rom::kMaxImages) + " images"};
        else if (offset == file.size())
            flaw = Flaw{0, "the file ends before the image that has the last-image bit: it is cut short"};
        else
            flaw = readImage(file.subspan(offset), image);
        if (flaw) {
            result.error = describe(number, offset, *flaw);
            return result;
        }
        offset += image.length;
        last = image.last;
        result.images.push_back(std::move(image));
    }
    return result;
}

std::span<const std::uint8_t> imageBytes(std::span<const std::uint8_t> file, const RomImage& image) {
    return fitsIn(image.offset, image.length, file.size()) ? file.subspan(image.offset, image.length)
                                                           : std::span<const std::uint8_t>{};
}

std::string formatIds(std::uint16_t vendor, std::uint16_t device) {
    return utils::formatStr("%04" PRIx16 ":%04" PRIx16, vendor, device);
}

std::string_view firmwareTypeName(utils::FirmwareType type) {
    const auto index = static_cast<std::size_t>(type);  // a negative value becomes a large one
    return index < kTypeNames.size() ? kTypeNames[index] : std::string_view{};
}

std::optional<utils::FirmwareType> firmwareTypeFromName(std::string_view name) {
    const auto found = std::find(kTypeNames.begin() + 1, kTypeNames.end(), name);
    if (found == kTypeNames.end()) return std::nullopt;
    return static_cast<utils::FirmwareType>(found - kTypeNames.begin());
}

}  // namespace ma
