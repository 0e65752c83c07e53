// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Devlink/PldmPackage.h"

#include <algorithm>
#include <array>

#include "MidAPI/Image/Bytes.h"
#include "Utils/Utils.h"

namespace ma::devlink {
namespace {

using Bytes = std::span<const std::uint8_t>;
using Uuid = std::array<std::uint8_t, 16>;

/// The package header identifiers of the format's revisions, the first one's first.
constexpr Uuid kIdentifiers[] = {
    {0xF0, 0x18, 0x87, 0x8C, 0xCB, 0x7D, 0x49, 0x43, 0x98, 0x00, 0xA0, 0x2F, 0x05, 0x9A, 0xCA, 0x02},
    {0x12, 0x44, 0xD2, 0x64, 0x8D, 0x7D, 0x47, 0x18, 0xA0, 0x30, 0xFC, 0x8A, 0x56, 0x58, 0x7D, 0x5A},
    {0x31, 0x19, 0xCE, 0x2F, 0xE8, 0x0A, 0x4A, 0x99, 0xAF, 0x6D, 0x46, 0xF8, 0xB1, 0x21, 0xF6, 0xBF},
    {0x7B, 0x29, 0x1C, 0x99, 0x6D, 0xB6, 0x42, 0x08, 0x80, 0x1B, 0x02, 0x02, 0x6E, 0x46, 0x3C, 0x78},
};
constexpr unsigned kNewestRevision = 3;
constexpr unsigned kDownstreamRevision = 2;  // the first with records of downstream devices
constexpr unsigned kOpaqueRevision = 3;      // the first with opaque data of components

constexpr std::size_t kChecksumLength = 4;
constexpr std::size_t kDateLength = 13;

/// Text types of DSP0267; all others are taken for bytes of ASCII.
enum TextType : std::uint8_t { Utf16 = 3, Utf16LittleEndian = 4, Utf16BigEndian = 5 };

enum Descriptor : std::uint16_t {
    PciVendor = 0x0000,
    PciDevice = 0x0100,
    PciSubsystemVendor = 0x0101,
    PciSubsystemDevice = 0x0102,
};

/// What is wrong with the package at hand.
struct Flaw {
    std::size_t offset;
    std::string what;
};

/// Takes one field behind the other. @throws Flaw where the bytes end before the field does
class Fields {
  public:
    /// @param start  of the bytes, in the file
    Fields(Bytes bytes, std::size_t start, const char* part) : m_bytes(bytes), m_start(start), m_part(part) {}

    Bytes take(std::size_t length) {
        if (length > m_bytes.size() - m_next) fail(utils::formatStr("ends inside %s", m_part));
        const Bytes taken = m_bytes.subspan(m_next, length);
        m_next += length;
        return taken;
    }
    std::uint8_t byte() { return take(1)[0]; }
    std::uint16_t number16() { return readLe16(take(2), 0); }
    std::uint32_t number32() { return readLe32(take(4), 0); }
    /// The next bytes as fields of their own.
    Fields part(std::size_t length, const char* name) {
        const std::size_t start = offset();
        return {take(length), start, name};
    }
    std::size_t offset() const { return m_start + m_next; }
    [[noreturn]] void fail(std::string what) const { throw Flaw{offset(), std::move(what)}; }
    void enter(const char* part) { m_part = part; }

  private:
    Bytes m_bytes;
    std::size_t m_start;
    std::size_t m_next = 0;
    const char* m_part;
};

/// These texts reach logs and terminals; a file may hold anything.
std::string printableText(Bytes bytes, std::uint8_t type) {
    const bool isWide = type >= Utf16 && type <= Utf16BigEndian;
    const std::size_t step = isWide ? 2 : 1;
    const std::size_t low = type == Utf16BigEndian ? 1 : 0;
    std::string text;
    for (std::size_t at = 0; at + step <= bytes.size(); at += step) {
        const std::uint8_t byte = bytes[at + low];
        const bool isAscii = byte >= ' ' && byte <= '~' && (!isWide || bytes[at + 1 - low] == 0);
        text += isAscii ? static_cast<char>(byte) : '?';
    }
    return text;
}

/// A descriptor of the record; 0 stands for any, and all but PCI's ids are left to the driver.
void readDescriptor(Fields& record, PldmDevice& device) {
    const std::uint16_t type = record.number16();
    Fields data = record.part(record.number16(), "a device descriptor");
    const auto set = [&data](std::optional<std::uint16_t>& id) {
        if (const std::uint16_t value = data.number16(); value != 0) id = value;
    };
    switch (type) {
        case PciVendor:
            return set(device.vendor);
        case PciDevice:
            return set(device.device);
        case PciSubsystemVendor:
            return set(device.subsystemVendor);
        case PciSubsystemDevice:
            return set(device.subsystemDevice);
        default:
            return;
    }
}

std::vector<std::size_t> bitsOf(Bytes bitmap) {
    std::vector<std::size_t> bits;
    for (std::size_t bit = 0; bit < bitmap.size() * 8; ++bit)
        if ((bitmap[bit / 8] >> bit % 8 & 1) != 0) bits.push_back(bit);
    return bits;
}

/// The next record; its length counts the field that has it.
Fields nextRecord(Fields& header, const char* name) {
    const std::uint16_t length = header.number16();
    if (length < 2) header.fail("has a record of " + std::to_string(length) + " bytes");
    return header.part(length - std::size_t{2}, name);
}

PldmDevice readDevice(Fields& header, std::size_t bitmapLength) {
    Fields record = nextRecord(header, "a device record");
    PldmDevice device;
    const unsigned descriptors = record.byte();
    record.take(4);  // what the device is to do with the components
    const std::uint8_t textType = record.byte();
    const std::uint8_t textLength = record.byte();
    record.take(2);  // length of the data for the device, which come last
    device.components = bitsOf(record.take(bitmapLength));
    device.version = printableText(record.take(textLength), textType);
    for (unsigned number = 0; number < descriptors; ++number)
        readDescriptor(record, device);
    return device;
}

PldmComponent readComponent(Fields& header, unsigned revision) {
    PldmComponent component;
    header.take(2);  // its classification
    component.identifier = header.number16();
    header.take(4 + 2 + 2);  // a number to compare by, options, how it is activated
    component.offset = header.number32();
    component.size = header.number32();
    const std::uint8_t textType = header.byte();
    const std::uint8_t textLength = header.byte();
    component.version = printableText(header.take(textLength), textType);
    if (revision >= kOpaqueRevision) header.take(header.number32());
    return component;
}

unsigned revisionOf(Bytes file) {
    const auto starts = [file](const Uuid& identifier) {
        return file.size() >= identifier.size() &&
               std::ranges::equal(file.first(identifier.size()), identifier);
    };
    const auto* found = std::ranges::find_if(kIdentifiers, starts);
    return found == std::end(kIdentifiers) ? 0 : static_cast<unsigned>(found - kIdentifiers) + 1;
}

/// The fields up to the checksum, once that is found to be right.
Fields checkedHeader(Bytes file, unsigned revision) {
    Fields start(file, 0, "the package header");
    start.take(sizeof(Uuid));
    if (const unsigned told = start.byte(); told != revision)
        start.fail("has format revision " + std::to_string(told) + " where its identifier is that of " +
                   std::to_string(revision));
    const std::uint16_t size = start.number16();
    if (size < start.offset() + kChecksumLength || size > file.size())
        start.fail("has a header of " + std::to_string(size) + " bytes in a file of " +
                   std::to_string(file.size()));
    const std::size_t checked = size - kChecksumLength;
    if (readLe32(file, checked) != crc32(file.first(checked)))
        throw Flaw{checked, "has a wrong checksum of the header"};
    Fields header(file.first(checked), 0, "the package header");
    header.take(start.offset());
    return header;
}

/// Images that a record names must be there, and all of them must lie behind the header and its checksum.
void checkImages(const PldmPackage& package, const Fields& header, std::size_t fileSize) {
    for (const PldmDevice& device : package.devices) {
        if (!device.components.empty() && device.components.back() >= package.components.size())
            header.fail("names image " + std::to_string(device.components.back() + 1) + " of " +
                        std::to_string(package.components.size()));
    }
    const std::size_t end = header.offset() + kChecksumLength;
    for (const PldmComponent& component : package.components) {
        if (component.offset < end)
            throw Flaw{component.offset, "has an image that begins inside the header"};
        if (fitsIn(component.offset, component.size, fileSize)) continue;
        throw Flaw{component.offset, "has an image of " + std::to_string(component.size) +
                                         " bytes that lies outside the file: it may be cut short"};
    }
}

void readPackage(Bytes file, PldmPackage& package) {
    const unsigned revision = revisionOf(file);
    Fields header = checkedHeader(file, revision);
    header.take(kDateLength);
    const std::uint16_t bitmapBits = header.number16();
    if (bitmapBits % 8 != 0) header.fail("has a component bitmap of " + std::to_string(bitmapBits) + " bits");
    header.byte();               // the type of the package's own version
    header.take(header.byte());  // that version
    header.enter("the device records");
    for (unsigned count = header.byte(); count > 0; --count)
        package.devices.push_back(readDevice(header, bitmapBits / 8U));
    if (revision >= kDownstreamRevision)
        for (unsigned count = header.byte(); count > 0; --count)
            nextRecord(header, "a record of a downstream device");
    header.enter("the list of images");
    for (unsigned count = header.number16(); count > 0; --count)
        package.components.push_back(readComponent(header, revision));
    checkImages(package, header, file.size());
}

/// An id that is left open fits every card.
bool fitsId(const std::optional<std::uint16_t>& named, std::uint16_t id) {
    return named.value_or(id) == id;
}

}  // namespace

bool PldmDevice::fits(const PciIds& ids) const {
    return fitsId(vendor, ids.vendor) && fitsId(device, ids.device) &&
           fitsId(subsystemVendor, ids.subsystemVendor) && fitsId(subsystemDevice, ids.subsystemDevice);
}

PackageFormat packageFormat(Bytes file) {
    const unsigned revision = revisionOf(file);
    if (revision == 0) return PackageFormat::Unknown;
    return revision > kNewestRevision ? PackageFormat::Newer : PackageFormat::Known;
}

PldmPackage readPldmPackage(Bytes file) {
    PldmPackage package;
    try {
        readPackage(file, package);
    } catch (const Flaw& flaw) {
        package = {};
        package.error = flaw.what + utils::formatStr(" (offset 0x%zx)", flaw.offset);
    }
    return package;
}

}  // namespace ma::devlink
