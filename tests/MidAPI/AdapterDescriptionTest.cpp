// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Simulator/AdapterDescription.h"

#include <gmock/gmock.h>
#include <sys/stat.h>

#include "MidAPI/AdapterTypes.h"
#include "MidAPI/Simulator/Simulator.h"
#include "Support/SimulatedAdapters.h"
#include "Support/TestRoms.h"

namespace {

using ::testing::Matcher;
using ::testing::StartsWith;
using ::testing::ThrowsMessage;

std::string adapterAt(const std::string& address) {
    return "[[adapter]]\nname = \"eth0\"\npci_address = \"" + address +
           "\"\npci_id = \"1af4:1041\"\nmac = \"52:54:00:12:34:56\"\n";
}

/// An adapter that is in order, with one line more.
std::string adapterWith(const std::string& line) {
    return adapterAt("0000:03:00.0") + line + "\n";
}

ma::AdapterDescription parsed(const std::string& text) {
    return ma::parseAdapterDescriptions(text, "a.toml").at(0);
}

TEST(AdapterDescriptionTest, TakesKeysThatFewAdaptersHaveAndFillsInOthers) {
    const ma::AdapterDescription full = parsed(adapterWith(R"(subsystem_id = "1af4:1100"
components = [ { type = "IMG_CLP", revision = 65535 }, { type = "IMG_UEFI" } ])"));
    EXPECT_EQ("1af4:1100", ma::formatIds(full.ids.subsystemVendor, full.ids.subsystemDevice));
    EXPECT_EQ("IMG_CLP 65535, IMG_UEFI 1", test::describeComponents(full.components));
    const ma::AdapterDescription least = parsed(adapterWith(""));
    EXPECT_EQ("1af4:1041", ma::formatIds(least.ids.subsystemVendor, least.ids.subsystemDevice));
    EXPECT_TRUE(least.linkUp && least.canBeUpdated && least.speed == 0 && least.writeSpeed == 0);
    EXPECT_EQ(ma::BootType::None, least.bootType);
    unsigned int number = 0;  // as the flash keeps it
    for (const std::string word : {"none", "pxe", "iscsi", "fcoe", "uefi"})
        EXPECT_EQ(static_cast<ma::BootType>(number++),
                  parsed(adapterWith("boot_type = \"" + word + "\"")).bootType);
}

TEST(AdapterDescriptionTest, ReadsFaults) {
    using enum ma::Fault::Action;
    const std::vector<ma::Fault> faults = parsed(adapterWith(R"(fault = [
{ at = "enumerate", action = "fail" }, { at = "pci-address", action = "throw" },
{ at = "firmware-version", action = "stall" }, { at = "prepare", action = "power-loss" },
{ at = "write", action = "kill" }, { at = "capability-word", action = "fail" },
{ at = "boot-type", action = "fail", percent = 7, code = 8, milliseconds = 9, once = true, text = "gone" },
{ at = "info", action = "fail" } ])"))
                                              .faults;
    const ma::Fault::Action actions[] = {Fail, Throw, Stall, PowerLoss, Kill, Fail, Fail, Fail};
    for (std::size_t i = 0; i < std::size(actions); ++i)
        EXPECT_TRUE(faults.at(i).at == static_cast<ma::Operation>(i) && faults[i].action == actions[i]) << i;
    EXPECT_TRUE(faults[6].percent == 7 && faults[6].code == 8 && faults[6].milliseconds == 9);
    EXPECT_TRUE(faults[6].once && faults[6].text == "gone");
    EXPECT_TRUE(faults[7].percent == 0 && faults[7].code == 6 && faults[7].milliseconds == 0);
    EXPECT_TRUE(!faults[7].once && faults[7].text == "ordered fault: fail at info") << faults[7].text;
}

TEST(AdapterDescriptionTest, ReadsAddresses) {
    const auto addressOf = [](const std::string& address) { return parsed(adapterAt(address)).address; };
    EXPECT_EQ((utils::PCIAddr{0x1f, 0x1e, 7, false, "0000:1f:1e.7"}), addressOf("1f:1e.7"));
    EXPECT_EQ((utils::PCIAddr{0x1f, 0x1e, 0, true, "0001:1f:1e"}), addressOf("0001:1F:1e"));
    for (const char* address :
         {"0000:03:00.8", "0000:03:20.0", "0000:3:00.0", "03:00.", "03:00.0x", "", ":::"})
        EXPECT_THROW(addressOf(address), ma::AdapterError) << address;
}

TEST(AdapterDescriptionTest, NamesMistakesWithPlaceAndRemedy) {
    // Each description, after what is said of it.
    const auto bytes = test::readTestFile(QUENX_MIDAPI_TEST_DIR "/samples/mistakes");
    const std::string sample(bytes.begin(), bytes.end());
    ASSERT_TRUE(sample.starts_with("=== "));
    for (std::size_t begin = 0, end = 0; end != std::string::npos; begin = end + 1) {
        const std::size_t text = sample.find('\n', begin) + 1;
        end = sample.find("\n=== ", text);
        const std::string said = sample.substr(begin + 4, text - 1 - (begin + 4));
        // What follows a colon at the end is in the words of the library that reads TOML.
        const Matcher<std::string> whole =
            said.ends_with(": ") ? Matcher<std::string>(StartsWith(said)) : said;
        EXPECT_THAT([&] { ma::parseAdapterDescriptions(sample.substr(text, end - text), "a.toml"); },
                    ThrowsMessage<ma::AdapterError>(whole));
    }
}

TEST(AdapterDescriptionTest, NamesFilesThatCannotBeUsed) {
    const test::TempFolder folder;
    ASSERT_EQ(0, ::mkfifo((folder / "fifo").c_str(), 0600));  // must not hang
    folder.write("card.rom", "no rom at all, but long enough for a header");
    const auto naming = [&](const std::string& file) {
        return folder.write(file + ".toml", adapterWith("flash_file = \"" + file + "\""));
    };
    const std::string own = "adapter eth0: its flash_file " + folder / "";
    const std::pair<std::string, std::string> table[] = {
        {folder / "none.toml",
         "there is no adapter description " + folder / "none.toml" + "; name a readable file"},
        {folder.path(), "the adapter description: cannot read " + folder.path() + ": Is a directory"},
        {naming("missing.rom"), own + "missing.rom is not there; name an expansion ROM file"},
        {naming("card.rom"),
         own + "card.rom is not an intact ROM image: image 1 at 0x0: the signature 55 AA is "
               "missing (offset 0x0)"},
        {naming("fifo"),
         own + "fifo is not an intact ROM image: image 1 at 0x0: the file is empty (offset 0x0)"}};
    for (const auto& [description, expected] : table) {
        EXPECT_THAT([&file = description] { ma::Simulator(file, "state"); },
                    ThrowsMessage<ma::AdapterError>(expected));
    }
}

TEST(AdapterDescriptionTest, MakesTheFactoryFlashOfTheFileAndTheListedComponents) {
    const test::SimulatedAdapters adapters(
        adapterWith("flash_file = \"" + test::realRomPath("efi-virtio") +
                    "\"\ncomponents = [ { type = \"IMG_UEFI\", revision = 9 }, "
                    "{ type = \"IMG_iSCSI\", revision = 4 } ]"));
    EXPECT_EQ("IMG_iSCSI 4, IMG_PXE 1, IMG_UEFI 9", test::componentsOf("eth0"));
    EXPECT_FALSE(ma::parseOptionRom(adapters->flashContent("eth0")).error);

    // An image with a CLP entry is changed where it is, and not replaced by a made one, which is shorter.
    const auto clp = ma::makeRomImage({.type = utils::FirmwareType::CLP,
                                       .vendorId = 0x1af4,
                                       .deviceId = 0x1041,
                                       .furtherDeviceIds = {},
                                       .length = 4096});
    adapters.folder().write("clp.rom", std::span(clp));
    adapters.folder().write("clp.toml", adapterWith("flash_file = \"clp.rom\"\ncomponents = "
                                                    "[ { type = \"IMG_CLP\", revision = 9 } ]"));
    const ma::Simulator simulator(adapters.folder() / "clp.toml", adapters.stateDirectory());
    EXPECT_EQ(simulator.flashContent("eth0"), test::withRevision(clp, 9));
}

}  // namespace
