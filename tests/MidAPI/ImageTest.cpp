// SPDX-License-Identifier: Apache-2.0
#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <numeric>

#include "MidAPI/Image/ImagePreparation.h"
#include "MidAPI/Image/OptionRom.h"
#include "MidAPI/Image/RomFormat.h"
#include "MidAPI/ma.h"
#include "Support/SimulatedAdapters.h"
#include "Support/SyslogCapture.h"
#include "Support/TestRoms.h"

namespace {

using utils::FirmwareType;
using enum utils::FirmwareType;
using Rom = std::vector<std::uint8_t>;
using Types = std::vector<FirmwareType>;

void mend(Rom& image) {
    const auto sum = static_cast<std::uint8_t>(std::accumulate(image.begin(), image.end(), 0U));
    image[ma::rom::kHeaderChecksum] = static_cast<std::uint8_t>(image[ma::rom::kHeaderChecksum] - sum);
}

TEST(OptionRomTest, TellsTypesByCodeProductAndClpEntry) {
    EXPECT_EQ("IMG_CLP 777, IMG_PXE 777",
              test::describeRom(test::withRevision(test::madeRom({{CLP, 7}}), 777)));
    EXPECT_EQ(ma::makeRomImage({.type = PXE, .furtherDeviceIds = {}, .length = 1}).size(), 512U);
    EXPECT_EQ("IMG_iSCSI 2, IMG_UEFI 3, IMG_FCoE 1",
              test::describeRom(test::madeRom({{FCoE, 1}, {iSCSI, 2}, {UEFI, 3}})));
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

// Else an image could be checked as one type and written as another.
TEST(OptionRomTest, TellsNoTypeByBytesThatWritingChanges) {
    constexpr std::size_t kIndicator = 0x1C + ma::rom::kPcirIndicator;
    for (const auto& [place, word] : {std::pair(3U, "iSCSI"), {kIndicator, "FCoE"}}) {
        Rom rom = test::madeRom({{PXE, 1}});
        ma::writeLe16(rom, 0x40 + ma::rom::kPnpProduct, static_cast<std::uint16_t>(place));
        std::copy_n(word, std::strlen(word), &rom.at(place));
        rom.back() = static_cast<std::uint8_t>(rom.back() - std::accumulate(rom.begin(), rom.end(), 0U));
        const Rom next = test::madeRom({{UEFI, 2}});
        // The first place leaves the image the last one, the second does not.
        rom.insert(rom.end(), next.begin(), next.end());
        const std::string found = test::describeRom(rom);
        EXPECT_TRUE(found.starts_with("IMG_PXE 1")) << found;
    }
}

TEST(OptionRomTest, NamesWhatIsBroken) {
    constexpr std::size_t PCIR = 0x1C;
    static const auto notLast = [](Rom& rom) {
        rom[PCIR + 0x15] = 0;
        mend(rom);
    };
    const std::pair<const char*, void (*)(Rom&)> table[] = {
        {"image 1 at 0x0: the file is empty (offset 0x0)", [](Rom& rom) { rom.clear(); }},
        {"ends inside the image header (offset 0x0)", [](Rom& rom) { rom.resize(0x1B); }},
        {"signature 55 AA is missing (offset 0x0)", [](Rom& rom) { rom[0] = 0x56; }},
        {"lies outside the image (offset 0x18)", [](Rom& rom) { ma::writeLe16(rom, 0x18, 0xFFF0); }},
        {"lies outside the image (offset 0x18)", [](Rom& rom) { rom.resize(0x30); }},
        {"\"PCIR\" (offset 0x1c)", [](Rom& rom) { rom[PCIR] = 'X'; }},
        {"image length is 0 (offset 0x2c)", [](Rom& rom) { ma::writeLe16(rom, PCIR + 0x10, 0); }},
        {" 1024 bytes long, but the file has only 1023 left: it is cut short (offset 0x2c)",
         [](Rom& rom) { rom.resize(1023); }},
        {"length of the PCI data structure is wrong (offset 0x26)",
         [](Rom& rom) { ma::writeLe16(rom, PCIR + 0x0A, 0xFFFF); }},
        {"no end (offset 0x24)", [](Rom& rom) { ma::writeLe16(rom, PCIR + 0x08, 0x8000); }},
        {"lies inside the PCI data structure (offset 0x24)",
         [](Rom& rom) { ma::writeLe16(rom, PCIR + 0x08, 27); }},
        {"no end (offset 0x24)",
         [](Rom& rom) {
             ma::writeLe16(rom, PCIR + 0x08, 0x300);
             std::fill(rom.begin() + 0x300, rom.end(), std::uint8_t{0xFF});
         }},
        {"checksum is wrong: the bytes sum to 1, not 0 (offset 0x0)", [](Rom& rom) { ++rom[0x300]; }},
        {"EFI signature (offset 0x4)", [](Rom& rom) { rom[PCIR + 0x14] = 3; }},
        {"image that has the last-image bit: it is cut short (offset 0x400)", notLast},
        {"image 2 at 0x400: the signature 55 AA is missing (offset 0x400)",
         [](Rom& rom) {
             notLast(rom);
             rom.resize(2048);
         }},
    };
    for (const auto& [part, damage] : table) {
        Rom rom = test::madeRom({{PXE, 1}});
        damage(rom);
        const std::string error = ma::parseOptionRom(rom).error.value_or("none");
        EXPECT_TRUE(error.ends_with(part)) << error << "\nwanted: " << part;
    }
}

constexpr auto kNoSuch = static_cast<FirmwareType>(77);

Rom pxeFor(std::uint16_t device, std::vector<std::uint16_t> others,
           std::uint32_t classCode = ma::rom::kEthernetClass) {
    return ma::makeRomImage({.type = PXE,
                             .vendorId = 0x1af4,
                             .deviceId = device,
                             .furtherDeviceIds = std::move(others),
                             .codeRevision = 1,
                             .classCode = classCode});
}

Rom cutShort(Rom rom, std::size_t length) {
    rom.resize(length);
    return rom;
}

struct Case {
    const char* what;
    const char* adapter;
    Rom file;
    Types requested;
    int status;
    Types written;       // what is left in the type list
    const char* reason;  // a part of the logged line
};

std::vector<Case> allCases() {
    const Rom virtio = test::realRom("efi-virtio");
    const Rom pxeOnly = test::realRom("pxe-virtio");
    const Rom vmxnet = test::realRom("efi-vmxnet3");
    const Rom older = test::madeRom({{PXE, 0}, {UEFI, 0}});
    const Rom newAtZero = test::madeRom({{PXE, 1}, {iSCSI, 0}});
    const Rom olderAndMore = test::madeRom({{PXE, 0}, {iSCSI, 1}});
    const Rom clp = test::madeRom({{CLP, 1}});
    Rom openFirmware = clp;
    openFirmware[0x1C + ma::rom::kPcirCodeType] = ma::rom::CodeType::OpenFirmware;
    return {
        {"equal is fit", "eth0", virtio, {}, 0, {PXE, UEFI}, ""},
        {"one of two; type 0 and repeats ignored", "eth0", virtio, {PXE, None, PXE}, 0, {PXE}, ""},
        {"only type 0 stands for all", "eth0", virtio, {None}, 0, {PXE, UEFI}, ""},
        {"a file with less than the adapter", "eth0", pxeOnly, {}, 0, {PXE}, ""},
        {"other card", "eth2", virtio, {}, 2, {}, "is for PCI device 1af4:1041, the adapter is 10ec:8139"},
        {"other card, cut short", "eth2", cutShort(virtio, 100'000), {}, 2, {}, "1af4:1041"},
        {"images that disagree", "eth0", test::realRom("efi-ne2k_pci"), {}, 2, {}, "0000:0000"},
        {"cannot be updated", "eth3", test::realRom("pxe-pcnet"), {}, 2, {}, "cannot be updated"},
        {"other types", "eth4", vmxnet, {}, 4, {PXE, UEFI}, "carries IMG_iSCSI, IMG_UEFI"},
        {"the types it has", "eth4", vmxnet, {UEFI}, 0, {UEFI}, ""},
        {"cut at an image's end", "eth0", cutShort(virtio, 75'776), {PXE}, 1, {PXE}, "cut short"},
        {"empty", "eth0", {}, {}, 1, {}, "the file is empty"},
        {"no such adapter", "eth9", virtio, {}, 1, {}, "no such adapter"},
        {"a type it lacks", "eth0", virtio, {iSCSI, PXE}, 5, {iSCSI, PXE}, "no image of type IMG_iSCSI"},
        {"a number that is no type", "eth0", virtio, {kNoSuch}, 5, {kNoSuch}, "no image of type 77"},
        {"older", "eth0", older, {}, 3, {PXE, UEFI}, "IMG_PXE would go back from version 1 (installed) to 0"},
        {"the part that is not older", "eth0", older, {UEFI}, 0, {UEFI}, ""},
        {"a new type at version 0", "eth0", newAtZero, {}, 4, {iSCSI, PXE}, "carries IMG_PXE, IMG_UEFI"},
        {"older with other types", "eth0", olderAndMore, {}, 4, {iSCSI, PXE}, "adapter carries"},
        {"missing type before older", "eth0", older, {iSCSI}, 5, {iSCSI}, "it has IMG_PXE, IMG_UEFI"},
        {"CLP brings its image's type", "eth0", clp, {CLP}, 4, {CLP, PXE}, "IMG_CLP, IMG_PXE"},
        {"no code that runs here", "eth0", openFirmware, {CLP}, 5, {CLP}, "no image of type IMG_CLP"},
        {"VGA", "eth0", pxeFor(0x1041, {}, 0x030000), {}, 2, {}, "not for a network adapter"},
        {"listed device", "eth0", pxeFor(0x1000, {0x1041}), {}, 0, {PXE}, ""},
        {"not listed", "eth0", pxeFor(0x1000, {0x1042, 0x1043}), {}, 2, {}, "1af4:1000"},
    };
}

TEST(ImagePreparationTest, AnswersByTheTable) {
    const test::SimulatedAdapters adapters;
    for (const Case& one : allCases()) {
        SCOPED_TRACE(one.what);
        test::SyslogCapture::clear();
        const test::PreparedImage prepared = test::prepareImage(one.adapter, one.file, one.requested);
        EXPECT_EQ(one.status, prepared.status);
        EXPECT_EQ(one.written, prepared.types);
        EXPECT_EQ(one.status != 0, test::SyslogCapture::contains("status " + std::to_string(one.status)));
        EXPECT_TRUE(one.status == 0 || test::SyslogCapture::contains(one.reason)) << one.reason;
        if (one.status != 0 && one.status != 3 && one.status != 4) {
            EXPECT_EQ(one.file.size(), prepared.image.size()) << "the size was changed";
            continue;
        }
        // Also when the caller must insist, the output is an image that can be written.
        const ma::RomFile rom = ma::parseOptionRom(prepared.image);
        ASSERT_FALSE(rom.error) << *rom.error;
        Types found;
        for (const utils::FirmwareVersionInfo& component : rom.components())
            found.push_back(component.type);
        EXPECT_EQ(one.written, found);
    }
}

TEST(ImagePreparationTest, TakesTheLossOfTheClpEntryForAnotherType) {
    const ma::PreparationTarget target{0x1af4, 0x1041, true, {{CLP, 1}, {PXE, 1}}};
    EXPECT_EQ(ma::PrepareStatus::ImageTypesDiffer,
              ma::assessImage(target, test::madeRom({{PXE, 1}}), {}).status);
    EXPECT_EQ(ma::PrepareStatus::Prepared, ma::assessImage(target, test::madeRom({{CLP, 1}}), {PXE}).status);
}

TEST(ImagePreparationTest, RefusesABufferThatIsTooSmall) {
    const test::SimulatedAdapters adapters;
    const Rom rom = test::madeRom({{PXE, 1}});
    Rom output(rom.size() - 1);
    auto imageSize = static_cast<std::uint32_t>(output.size());
    Types types;
    EXPECT_EQ(1, ma::prepareFlashImage("eth0", rom.data(), imageSize + 1, output.data(), &imageSize, types));
}

}  // namespace
