// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Simulator/Simulator.h"

#include <gtest/gtest.h>
#include <unistd.h>

#include <algorithm>
#include <set>
#include <thread>

#include "MidAPI/AdapterTypes.h"
#include "MidAPI/Simulator/FlashStore.h"
#include "MidAPI/ma.h"
#include "Support/SimulatedAdapters.h"
#include "Support/SyslogCapture.h"
#include "Support/TestRoms.h"
#include "Utils/Os/Linux/linux.h"

namespace {

using utils::FirmwareType;
using enum utils::FirmwareType;
using Rom = std::vector<std::uint8_t>;

/// Prepares and writes; the prepare must allow it, if need be by force.
test::WriteResult install(const std::string& adapter, const Rom& file, std::vector<FirmwareType> types = {}) {
    const test::PreparedImage prepared = test::prepareImage(adapter, file, std::move(types));
    EXPECT_TRUE(prepared.status == 0 || prepared.status == 3 || prepared.status == 4) << prepared.status;
    return test::writeImage(adapter, prepared.image);
}

TEST(SimulatorTest, KeepsCapabilityWordAndBootType) {
    test::SimulatedAdapters adapters;
    std::uint32_t code = 9;
    std::string text = "old";
    EXPECT_EQ(0b11000U, adapters->flashState("eth0").capabilityWord);
    EXPECT_EQ(0U, adapters->flashState("eth0").bootType);
    EXPECT_EQ(static_cast<std::uint32_t>(ma::BootType::iSCSI), adapters->flashState("eth4").bootType);
    EXPECT_TRUE(install("eth0", test::madeRom({{CLP, 2}})).done);
    EXPECT_TRUE(ma::updateCapabilityWord("eth0", {CLP, PXE, iSCSI}, code, text));
    EXPECT_TRUE(code == 0 && text.empty());
    EXPECT_TRUE(ma::setBootType("eth4", ma::BootType::None));
    adapters.restart();
    EXPECT_EQ(0b11010U, adapters->flashState("eth0").capabilityWord) << "nothing that is not there";
    EXPECT_EQ(0U, adapters->flashState("eth4").bootType);
}

TEST(SimulatorTest, WritesOnlyImagesForTheCard) {
    const test::SimulatedAdapters adapters;
    Rom broken = test::madeRom({{PXE, 9}});
    broken.back() ^= 1;
    const std::pair<Rom, std::string> table[] = {
        {broken,
         "the image is not intact: image 1 at 0x0: the checksum is wrong: the bytes sum to 1, not 0 "
         "(offset 0x0)"},
        {Rom(), "the image is not intact: image 1 at 0x0: the file is empty (offset 0x0)"},
        {test::madeRom({{PXE, 9}}, 0x10ec, 0x8139),
         "the image is for PCI device 10ec:8139, not for 1af4:1041"}};
    for (const auto& [bad, text] : table) {
        const test::WriteResult result = test::writeImage("eth0", bad);
        EXPECT_EQ(ma::WriteError::BadImage, result.code);
        EXPECT_EQ(text, result.text);
    }
    const test::WriteResult refused = test::writeImage("eth3", test::madeRom({{PXE, 9}}, 0x1022, 0x2000));
    EXPECT_EQ(refused.code, ma::WriteError::NotUpdatable);
    EXPECT_EQ(refused.text, "this adapter cannot be updated");
    EXPECT_EQ("IMG_PXE 1, IMG_UEFI 0", test::componentsOf("eth0"));

    // Nor is what makes the flash's chain longer than a chain may be.
    const auto images = [](FirmwareType type) {
        const Rom one = test::madeRom({{type, 9}});
        Rom many(40 * one.size());
        ma::composeOptionRom(std::vector<std::span<const std::uint8_t>>(40, one), many);
        return many;
    };
    EXPECT_TRUE(test::writeImage("eth0", images(PXE)).done);
    const test::WriteResult result = test::writeImage("eth0", images(UEFI));
    EXPECT_EQ(ma::WriteError::BadImage, result.code);
    EXPECT_EQ(
        "with what the adapter keeps it would not be a ROM: image 65 at 0x10000: more than 64 images "
        "(offset 0x10000)",
        result.text);
    EXPECT_EQ("IMG_PXE 9, IMG_UEFI 0", test::componentsOf("eth0"));

    adapters.folder().write("state/eth1", "a file where the folder should be");
    const test::WriteResult failed = test::writeImage("eth1", test::madeRom({{PXE, 9}}));
    EXPECT_EQ(ma::WriteError::DeviceFailed, failed.code);
    EXPECT_NE(std::string::npos, failed.text.find("Not a directory")) << failed.text;
}

TEST(SimulatorTest, NamesAnAdapterThatIsNotThere) {
    const test::SimulatedAdapters adapters;
    const test::SyslogCapture log;
    const auto expectRefused = [](bool isDone, std::uint32_t code, const std::string& text) {
        EXPECT_FALSE(isDone);
        EXPECT_EQ(ma::WriteError::UnknownAdapter, code);
        EXPECT_EQ("there is no adapter eth9", text);
    };
    const test::WriteResult written = test::writeImage("eth9", test::madeRom({{PXE, 9}}));
    expectRefused(written.done, written.code, written.text);
    std::uint32_t code = 0;
    std::string text;
    const bool isDone = ma::updateCapabilityWord("eth9", {PXE}, code, text);
    expectRefused(isDone, code, text);
    EXPECT_EQ(utils::StringArray(2, text), test::SyslogCapture::messages("error"));
    std::vector<utils::FirmwareVersionInfo> components;
    EXPECT_FALSE(ma::getAdapterFirmwareVersion("eth9", components));
    EXPECT_FALSE(ma::getCanBeUpdated("eth9") || ma::setBootType("eth9", ma::BootType::None));
    EXPECT_EQ(0, ma::getFlashImageUpdateProgress("eth9"));
    EXPECT_THROW(ma::getAdapterInfo("eth9"), ma::AdapterError);
}

TEST(SimulatorTest, TellsWhichAdapterFails) {
    const test::SimulatedAdapters adapters;
    const test::SyslogCapture log;
    const auto fail = [&](ma::Operation at) {
        adapters->injectFault("eth0", {.at = at, .code = 7, .text = "worn out", .once = true});
    };
    fail(ma::Operation::PciAddress);
    EXPECT_EQ("adapter eth0: worn out", test::adapterErrorOf([] { ma::getPCIAddress("eth0"); }));
    fail(ma::Operation::Info);
    EXPECT_EQ("adapter eth0: worn out", test::adapterErrorOf([] { ma::getAdapterInfo("eth0"); }));
    test::SyslogCapture::clear();

    for (const ma::Operation at : {ma::Operation::FirmwareVersion, ma::Operation::Prepare,
                                   ma::Operation::CapabilityWord, ma::Operation::BootType})
        fail(at);
    std::vector<utils::FirmwareVersionInfo> components;
    EXPECT_FALSE(ma::getAdapterFirmwareVersion("eth0", components));
    EXPECT_EQ(7, test::prepareImage("eth0", test::madeRom({{PXE, 9}})).status);
    std::uint32_t code = 0;
    std::string text;
    EXPECT_FALSE(ma::updateCapabilityWord("eth0", {PXE}, code, text));
    EXPECT_EQ(7U, code);
    EXPECT_FALSE(ma::setBootType("eth0", ma::BootType::None));
    EXPECT_EQ(utils::StringArray(4, "simulated adapter eth0: worn out"),
              test::SyslogCapture::messages("error"));
    fail(ma::Operation::Enumerate);
    EXPECT_TRUE(ma::enumerateAdapters().empty()) << "all or none";
    EXPECT_EQ("worn out", test::SyslogCapture::messages("error").back());
    EXPECT_EQ(5U, ma::enumerateAdapters().size());
}

TEST(SimulatorTest, SurvivesDamageWhereABankIsLeftAndNamesItWhereNot) {
    test::SimulatedAdapters adapters;
    EXPECT_TRUE(install("eth0", test::madeRom({{PXE, 2}})).done);
    EXPECT_TRUE(install("eth0", test::madeRom({{PXE, 3}})).done);
    const std::uint8_t active = adapters->flashState("eth0").activeBank;
    adapters.folder().write("state/eth0/bank-" + std::to_string(active) + ".rom", "worn out");
    adapters.restart();
    EXPECT_EQ("IMG_PXE 2, IMG_UEFI 0", test::componentsOf("eth0"));
    EXPECT_TRUE(install("eth0", test::madeRom({{PXE, 4}})).done) << "into the damaged bank";
    EXPECT_EQ("IMG_PXE 4, IMG_UEFI 0", test::componentsOf("eth0"));

    for (const char* file : {"state", "state.copy", "bank-0.rom", "bank-1.rom"})
        adapters.folder().write(std::string("state/eth0/") + file, "no record");
    EXPECT_THROW(test::componentsOf("eth0"), ma::AdapterError);
    EXPECT_EQ(6, test::prepareImage("eth0", test::madeRom({{PXE, 5}})).status);
    EXPECT_EQ("IMG_PXE 1, IMG_UEFI 0", test::componentsOf("eth1"));
}

TEST(SimulatorTest, KeepsPrintableNamesOfAnyKindApart) {
    std::string description;
    int bus = 10;
    for (const std::string name : {"../eth0", "a/b", "\xC3\xA4 \\\"x\\\"", "%2e", "."})
        description += "[[adapter]]\nname = \"" + name + "\"\npci_address = \"" + std::to_string(bus++) +
                       ":00.0\"\npci_id = \"1af4:1041\"\nmac = \"52:54:00:00:00:00\"\n";
    const test::SimulatedAdapters adapters(description);
    const utils::StringArray found = ma::enumerateAdapters();
    ASSERT_EQ(5U, found.size());
    for (const std::string& name : found)
        EXPECT_TRUE(install(name, test::madeRom({{PXE, 1}})).done);
    // The next version must find them there.
    EXPECT_EQ((utils::StringArray{"%252e", "%2e", "%2e%2e%2feth0", "%c3%a4%20%22x%22", "a%2fb"}),
              os::listDirectory(adapters.stateDirectory()));
}

/// Looks at the progress from within every step of a write.
class WatchedFiles : public test::UnsyncedFiles {
  public:
    void write(int descriptor, std::span<const std::uint8_t> bytes) override {
        FlashFiles::write(descriptor, bytes);
        // From another thread, and with a prepare in between: neither may disturb the write.
        std::thread([this] { seen.push_back(ma::getFlashImageUpdateProgress("eth0")); }).join();
        EXPECT_EQ(booted, test::componentsOf("eth0")) << "half an update was seen";
        const Rom rom = test::madeRom({{PXE, 9}});
        EXPECT_EQ(0, test::prepareImage("eth0", rom).status);
        const test::WriteResult second = test::writeImage("eth0", rom);
        EXPECT_EQ("adapter eth0 is being written to by process " + std::to_string(::getpid()) +
                      " (MidApiSimulator); wait until it is done",
                  second.text);
    }

    std::chrono::milliseconds patience() const override { return {}; }

    std::string booted = "IMG_PXE 1, IMG_UEFI 0";
    std::vector<std::uint16_t> seen;
};

TEST(SimulatorTest, MovesProgressOnlyForward) {
    const auto files = std::make_shared<WatchedFiles>();
    const test::SimulatedAdapters adapters(test::kTestAdapters, files);
    const Rom newer = test::withRevision(test::realRom("pxe-virtio"), 2);
    const test::PreparedImage prepared = test::prepareImage("eth0", newer);
    EXPECT_EQ(0, ma::getFlashImageUpdateProgress("eth0"));
    EXPECT_TRUE(test::writeImage("eth0", prepared.image).done);
    EXPECT_EQ(100, ma::getFlashImageUpdateProgress("eth0"));
    EXPECT_TRUE(std::is_sorted(files->seen.begin(), files->seen.end()));
    EXPECT_LT(15, std::set<std::uint16_t>(files->seen.begin(), files->seen.end()).size());
    EXPECT_EQ(99, files->seen.back()) << "100 only when it is in force";

    adapters->injectFault("eth0", {.percent = 50, .code = 1, .text = "worn out", .once = true});
    files->booted = "IMG_PXE 2, IMG_UEFI 0";
    EXPECT_EQ(0, test::prepareImage("eth0", newer).status);
    EXPECT_EQ(0, ma::getFlashImageUpdateProgress("eth0"));
    EXPECT_FALSE(test::writeImage("eth0", prepared.image).done);
    EXPECT_NEAR(54, ma::getFlashImageUpdateProgress("eth0"), 5);
    EXPECT_TRUE(test::writeImage("eth0", prepared.image).done);
}

TEST(SimulatorTest, WritesOnlyOverTheFirmwareThatAnImageWasHeldAgainst) {
    const test::SimulatedAdapters adapters;
    const test::PreparedImage prepared = test::prepareImage("eth0", test::madeRom({{PXE, 2}}));
    // Another process.
    ma::Simulator other(ma::loadAdapterDescriptions(adapters.descriptionFile()), adapters.stateDirectory());
    const Rom newer = test::madeRom({{PXE, 3}});
    std::uint32_t code = 0;
    std::string text;
    EXPECT_TRUE(
        other.writeFlashImage("eth0", newer.data(), static_cast<std::uint32_t>(newer.size()), code, text));
    const test::WriteResult refused = test::writeImage("eth0", prepared.image);
    EXPECT_EQ(ma::WriteError::Busy, refused.code);
    EXPECT_EQ(
        "adapter eth0 has other firmware than when the image was checked: somebody else has updated it; "
        "check the image again",
        refused.text);
    EXPECT_EQ("IMG_PXE 3, IMG_UEFI 0", test::componentsOf("eth0"));
}

}  // namespace
