// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Image/OptionRom.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <functional>
#include <numeric>

#include "MidAPI/Image/OptionRomWriter.h"
#include "MidAPI/Image/RomFormat.h"
#include "Support/TestRoms.h"

namespace {

using utils::FirmwareType;
using enum utils::FirmwareType;
using Rom = std::vector<std::uint8_t>;

void mend(Rom& image) {
    const auto sum = static_cast<std::uint8_t>(std::accumulate(image.begin(), image.end(), 0U));
    image[ma::rom::kHeaderChecksum] = static_cast<std::uint8_t>(image[ma::rom::kHeaderChecksum] - sum);
}

TEST(OptionRomTest, TellsTypesByCodeProductAndClpEntry) {
    EXPECT_EQ("IMG_CLP 7, IMG_PXE 7", test::describeRom(test::madeRom({{CLP, 7}})));
    EXPECT_EQ("IMG_iSCSI 2, IMG_UEFI 3, IMG_FCoE 1",
              test::describeRom(test::madeRom({{FCoE, 1}, {iSCSI, 2}, {UEFI, 3}})));
    EXPECT_EQ("", ma::firmwareTypeName(static_cast<FirmwareType>(-1)));
    EXPECT_EQ(FirmwareType::FCoE, ma::firmwareTypeFromName("IMG_FCoE"));
    EXPECT_FALSE(ma::firmwareTypeFromName(""));
}

TEST(OptionRomTest, FindsTheProductNameInAChainOfHeaders) {
    Rom rom = test::madeRom({{PXE, 1}});
    constexpr std::size_t kFirst = 0x40;
    constexpr std::size_t kSecond = 0x180;
    std::copy_n(rom.begin() + kFirst, ma::rom::kPnpLength, rom.begin() + kSecond);
    const std::string_view product = "Boot by ISCSI";
    std::copy(product.begin(), product.end(), rom.begin() + 0x1C0);
    ma::writeLe16(rom, kSecond + ma::rom::kPnpProduct, 0x1C0);
    ma::writeLe16(rom, kFirst + ma::rom::kPnpNext, kSecond);
    mend(rom);
    EXPECT_EQ("IMG_iSCSI 1", test::describeRom(rom));

    ma::writeLe16(rom, kSecond + ma::rom::kPnpProduct, 0);
    ma::writeLe16(rom, kSecond + ma::rom::kPnpNext, kFirst);  // a ring
    mend(rom);
    EXPECT_EQ("IMG_PXE 1", test::describeRom(rom));
}

TEST(OptionRomTest, NamesWhatIsBroken) {
    struct Broken {
        const char* error;  // a part of the text
        std::function<void(Rom&)> damage;
    };
    constexpr std::size_t PCIR = 0x1C;
    static const auto notLast = [](Rom& rom) {
        rom[PCIR + 0x15] = 0;
        mend(rom);
    };
    const std::vector<Broken> table = {
        {"the file is empty", [](Rom& rom) { rom.clear(); }},
        {"ends inside the image header", [](Rom& rom) { rom.resize(0x1B); }},
        {"signature 55 AA", [](Rom& rom) { rom[0] = 0x56; }},
        {"lies outside the image", [](Rom& rom) { ma::writeLe16(rom, 0x18, 0xFFF0); }},
        {"lies outside the image", [](Rom& rom) { rom.resize(0x30); }},
        {"\"PCIR\"", [](Rom& rom) { rom[PCIR] = 'X'; }},
        {"image length is 0", [](Rom& rom) { ma::writeLe16(rom, PCIR + 0x10, 0); }},
        {"cut short", [](Rom& rom) { rom.resize(1023); }},
        {"length of the PCI data structure", [](Rom& rom) { ma::writeLe16(rom, PCIR + 0x0A, 0xFFFF); }},
        {"no end", [](Rom& rom) { ma::writeLe16(rom, PCIR + 0x08, 0x8000); }},
        {"list of device ids lies inside", [](Rom& rom) { ma::writeLe16(rom, PCIR + 0x08, 27); }},
        {"no end",
         [](Rom& rom) {
             ma::writeLe16(rom, PCIR + 0x08, 0x300);
             std::fill(rom.begin() + 0x300, rom.end(), std::uint8_t{0xFF});
         }},
        {"checksum is wrong", [](Rom& rom) { ++rom[0x300]; }},
        {"EFI signature", [](Rom& rom) { rom[PCIR + 0x14] = 3; }},
        {"before the image that has the last-image bit", notLast},
        {"image 2 at 0x400: the signature 55 AA is missing (offset 0x400)",
         [](Rom& rom) {
             notLast(rom);
             rom.resize(2048);
         }},
    };
    for (const Broken& broken : table) {
        Rom rom = test::madeRom({{PXE, 1}});
        broken.damage(rom);
        const ma::RomFile parsed = ma::parseOptionRom(rom);
        ASSERT_TRUE(parsed.error) << broken.error;
        EXPECT_NE(std::string::npos, parsed.error->find(broken.error)) << *parsed.error;
    }
}

}  // namespace
