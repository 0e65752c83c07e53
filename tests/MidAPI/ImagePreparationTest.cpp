// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Image/ImagePreparation.h"

#include <gtest/gtest.h>

#include "MidAPI/Image/OptionRomWriter.h"
#include "MidAPI/ma.h"
#include "Support/SimulatedAdapters.h"
#include "Support/SyslogCapture.h"
#include "Support/TestRoms.h"

namespace {

using utils::FirmwareType;
using enum utils::FirmwareType;
using Rom = std::vector<std::uint8_t>;
using Types = std::vector<FirmwareType>;

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
    const Rom olderAndMore = test::madeRom({{PXE, 0}, {iSCSI, 1}});
    const Rom clp = test::madeRom({{CLP, 1}});
    return {
        {"equal is fit", "eth0", virtio, {}, 0, {PXE, UEFI}, ""},
        {"one of two; type 0 and repeats ignored", "eth0", virtio, {PXE, None, PXE}, 0, {PXE}, ""},
        {"only type 0 stands for all", "eth0", virtio, {None}, 0, {PXE, UEFI}, ""},
        {"ascending, whatever the order", "eth0", virtio, {UEFI, PXE}, 0, {PXE, UEFI}, ""},
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
        {"older with other types", "eth0", olderAndMore, {}, 4, {iSCSI, PXE}, "adapter carries"},
        {"missing type before older", "eth0", older, {iSCSI}, 5, {iSCSI}, "it has IMG_PXE, IMG_UEFI"},
        {"CLP is a type of its own", "eth0", clp, {}, 4, {CLP, PXE}, "IMG_CLP, IMG_PXE"},
        {"and brings its image", "eth0", clp, {CLP}, 4, {CLP, PXE}, ""},
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
