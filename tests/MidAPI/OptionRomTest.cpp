#include "MidAPI/OptionRom.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <functional>
#include <numeric>

#include "MidAPI/ByteView.h"
#include "MidAPI/OptionRomWriter.h"
#include "Support/TestRoms.h"

namespace {

using utils::FirmwareType;
using Rom = std::vector<uint8_t>;

uint8_t sumOf(std::span<const uint8_t> bytes) {
    return std::accumulate(bytes.begin(), bytes.end(), uint8_t{0},
                           [](uint8_t sum, uint8_t byte) { return static_cast<uint8_t>(sum + byte); });
}

void mend(Rom& rom, std::size_t length = 0) {
    const auto image = std::span<uint8_t>(rom).first(length == 0 ? rom.size() : length);
    image[ma::rom::HEADER_CHECKSUM] = static_cast<uint8_t>(image[ma::rom::HEADER_CHECKSUM] - sumOf(image));
}

TEST(OptionRom, readsRealImages) {
    struct Expected {
        const char* file;
        const char* ids;
        std::vector<uint32_t> lengths;
        const char* components;
    };
    const Expected table[] = {
        {"efi-virtio", "1af4:1041", {75'776, 173'568}, "IMG_PXE 1, IMG_UEFI 0"},
        {"efi-rtl8139", "10ec:8139", {75'776, 174'080}, "IMG_PXE 1, IMG_UEFI 0"},
        {"efi-pcnet", "1022:2000", {74'752, 171'520}, "IMG_PXE 1, IMG_UEFI 0"},
        {"efi-vmxnet3", "15ad:07b0", {74'240, 169'472}, "IMG_PXE 1, IMG_UEFI 0"},
        {"pxe-virtio", "1af4:1041", {75'776}, "IMG_PXE 1"},
    };
    for (const Expected& expected : table) {
        const Rom file = test::realRom(expected.file);
        const ma::RomFile rom = ma::parseOptionRom(file);
        ASSERT_FALSE(rom.error) << expected.file << ": " << *rom.error;
        ASSERT_EQ(expected.lengths.size(), rom.images.size()) << expected.file;
        for (std::size_t index = 0; index < rom.images.size(); ++index) {
            const ma::RomImage& image = rom.images[index];
            EXPECT_EQ(expected.lengths[index], image.length);
            EXPECT_EQ(expected.ids, ma::formatIds(image.vendorId, image.deviceId));
            EXPECT_TRUE(image.isNetwork());
            EXPECT_EQ(index + 1 == rom.images.size(), image.last);
        }
        EXPECT_EQ("iPXE", rom.images[0].product);
        EXPECT_EQ("http://ipxe.org", rom.images[0].manufacturer);
        EXPECT_EQ(1U, rom.images[0].furtherDeviceIds.size());
        EXPECT_EQ(expected.components, test::describeComponents(rom.components()));
    }
}

TEST(OptionRom, tellsTypesByCodeProductAndClpEntry) {
    const std::pair<FirmwareType, const char*> table[] = {{FirmwareType::PXE, "IMG_PXE 7"},
                                                          {FirmwareType::iSCSI, "IMG_iSCSI 7"},
                                                          {FirmwareType::FCoE, "IMG_FCoE 7"},
                                                          {FirmwareType::UEFI, "IMG_UEFI 7"},
                                                          {FirmwareType::CLP, "IMG_CLP 7, IMG_PXE 7"}};
    for (const auto& [type, expected] : table)
        EXPECT_EQ(expected, test::describeRom(test::madeRom({{type, 7}})));
    EXPECT_EQ("IMG_CLP", ma::firmwareTypeName(FirmwareType::CLP));
    EXPECT_EQ("", ma::firmwareTypeName(static_cast<FirmwareType>(-1)));
    EXPECT_EQ(FirmwareType::FCoE, ma::firmwareTypeFromName("IMG_FCoE"));
    EXPECT_FALSE(ma::firmwareTypeFromName("img_pxe"));
    EXPECT_FALSE(ma::firmwareTypeFromName(""));
}

TEST(OptionRom, findsTheProductNameInAChainOfHeaders) {
    Rom rom = test::madeRom({{FirmwareType::PXE, 1}});
    constexpr std::size_t FIRST = 0x40;
    constexpr std::size_t SECOND = 0x180;
    std::copy_n(rom.begin() + FIRST, ma::rom::PNP_LENGTH, rom.begin() + SECOND);
    const std::string_view product = "Boot by ISCSI";
    std::copy(product.begin(), product.end(), rom.begin() + 0x1C0);
    ma::writeLe16(rom, SECOND + ma::rom::PNP_PRODUCT, 0x1C0);
    ma::writeLe16(rom, FIRST + ma::rom::PNP_NEXT, SECOND);
    mend(rom);
    EXPECT_EQ("IMG_iSCSI 1", test::describeRom(rom));

    ma::writeLe16(rom, SECOND + ma::rom::PNP_PRODUCT, 0);
    ma::writeLe16(rom, SECOND + ma::rom::PNP_NEXT, FIRST);  // a ring
    mend(rom);
    EXPECT_EQ("IMG_PXE 1", test::describeRom(rom));
}

TEST(OptionRom, namesWhatIsBroken) {
    struct Broken {
        const char* error;  // a part of the text
        std::function<void(Rom&)> damage;
    };
    constexpr std::size_t PCIR = 0x1C;
    const std::vector<Broken> table = {
        {"the file is empty", [](Rom& rom) { rom.clear(); }},
        {"ends inside the image header", [](Rom& rom) { rom.resize(0x1B); }},
        {"signature 55 AA", [](Rom& rom) { rom[0] = 0x56; }},
        {"lies outside the image", [](Rom& rom) { ma::writeLe16(rom, 0x18, 0xFFF0); }},
        {"lies outside the image", [](Rom& rom) { ma::writeLe16(rom, 0x18, 4); }},
        {"lies outside the image", [](Rom& rom) { rom.resize(0x30); }},
        {"\"PCIR\"", [](Rom& rom) { rom[PCIR] = 'X'; }},
        {"image length is 0", [](Rom& rom) { ma::writeLe16(rom, PCIR + 0x10, 0); }},
        {"cut short", [](Rom& rom) { ma::writeLe16(rom, PCIR + 0x10, 3); }},
        {"cut short", [](Rom& rom) { rom.resize(1023); }},
        {"length of the PCI data structure", [](Rom& rom) { ma::writeLe16(rom, PCIR + 0x0A, 23); }},
        {"length of the PCI data structure", [](Rom& rom) { ma::writeLe16(rom, PCIR + 0x0A, 0xFFFF); }},
        {"no end", [](Rom& rom) { ma::writeLe16(rom, PCIR + 0x08, 0x8000); }},
        {"list of device ids lies inside", [](Rom& rom) { ma::writeLe16(rom, PCIR + 0x08, 27); }},
        {"no end",
         [](Rom& rom) {
             ma::writeLe16(rom, PCIR + 0x08, 0x300);
             std::fill(rom.begin() + 0x300, rom.end(), uint8_t{0xFF});
         }},
        {"checksum is wrong", [](Rom& rom) { ++rom[0x300]; }},
        {"EFI signature", [](Rom& rom) { rom[PCIR + 0x14] = 3; }},
        {"before the image that has the last-image bit",
         [](Rom& rom) {
             rom[PCIR + 0x15] = 0;
             mend(rom);
         }},
        {"image 2 at 0x400: the signature 55 AA is missing (offset 0x400)",
         [](Rom& rom) {
             rom[PCIR + 0x15] = 0;
             mend(rom);
             rom.resize(2048);
         }},
        {"more than 64 images",
         [](Rom& rom) {
             rom[PCIR + 0x15] = 0;
             mend(rom);
             const Rom one = rom;
             for (int copy = 0; copy < 65; ++copy)
                 rom.insert(rom.end(), one.begin(), one.end());
         }},
    };
    for (const Broken& broken : table) {
        Rom rom = test::madeRom({{FirmwareType::PXE, 1}});
        broken.damage(rom);
        const ma::RomFile parsed = ma::parseOptionRom(rom);
        ASSERT_TRUE(parsed.error) << broken.error;
        EXPECT_NE(std::string::npos, parsed.error->find(broken.error)) << *parsed.error;
    }
}

TEST(OptionRom, everyTruncationOfARealImageIsAnError) {
    const Rom whole = test::realRom("pxe-virtio");
    for (std::size_t length = 0; length < whole.size(); length = length < 600 ? length + 1 : length + 4093) {
        const Rom cut(whole.begin(),
                      whole.begin() + static_cast<std::ptrdiff_t>(length));  // its own block: ASan sees
        EXPECT_TRUE(ma::parseOptionRom(cut).error) << length;
    }
}

TEST(OptionRomWriter, composesAValidChainOfAnyChoice) {
    const Rom file = test::realRom("efi-virtio");
    const ma::RomFile rom = ma::parseOptionRom(file);
    const std::vector<std::vector<std::size_t>> choices = {{0}, {1}, {0, 1}, {1, 0}};
    for (const std::vector<std::size_t>& choice : choices) {
        std::vector<std::span<const uint8_t>> parts;
        for (const std::size_t index : choice)
            parts.push_back(ma::imageBytes(file, rom.images[index]));
        Rom output(file.size());
        output.resize(ma::composeOptionRom(parts, output));
        const ma::RomFile made = ma::parseOptionRom(output);
        ASSERT_FALSE(made.error) << *made.error;
        ASSERT_EQ(choice.size(), made.images.size());
        for (std::size_t place = 0; place < choice.size(); ++place)
            EXPECT_EQ(rom.images[choice[place]].type, made.images[place].type);
    }
    Rom same(file.size());
    const std::span<const uint8_t> parts[] = {ma::imageBytes(file, rom.images[0]),
                                              ma::imageBytes(file, rom.images[1])};
    EXPECT_EQ(file.size(), ma::composeOptionRom(parts, same));
    EXPECT_EQ(file, same);
}

TEST(OptionRomWriter, revisionsAreChangedWithTheSumMended) {
    const Rom changed = test::withRevision(test::realRom("efi-virtio"), 0x1234);
    EXPECT_EQ("IMG_PXE 4660, IMG_UEFI 4660", test::describeRom(changed));
    EXPECT_FALSE(ma::parseOptionRom(changed).error);
}

TEST(OptionRomWriter, mergingReplacesByTypeAndKeepsTheRest) {
    const Rom base = test::madeRom({{FirmwareType::PXE, 1}, {FirmwareType::UEFI, 2}});
    EXPECT_EQ("IMG_PXE 5, IMG_UEFI 2",
              test::describeRom(ma::mergeOptionRoms(base, test::madeRom({{FirmwareType::PXE, 5}}))));
    EXPECT_EQ("IMG_iSCSI 3, IMG_PXE 1, IMG_UEFI 2",
              test::describeRom(ma::mergeOptionRoms(base, test::madeRom({{FirmwareType::iSCSI, 3}}))));
    EXPECT_EQ(base, ma::mergeOptionRoms({}, base));
    EXPECT_EQ(base, ma::mergeOptionRoms(base, base));
}

}  // namespace
