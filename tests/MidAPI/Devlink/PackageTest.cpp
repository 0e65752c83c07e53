// SPDX-License-Identifier: Apache-2.0
// Firmware packages: what is read of them, and what that means for a card.
#include <gmock/gmock.h>

#include "MidAPI/Devlink/PackageVerdict.h"
#include "MidAPI/Devlink/PldmPackage.h"
#include "MidAPI/Devlink/Settings.h"
#include "MidAPI/Devlink/TestPackage.h"
#include "MidAPI/Devlink/VersionText.h"
#include "Utils/Utils.h"

namespace {

using ma::devlink::ComponentTable;
using ma::devlink::PackageVerdict;
using test::TestPackage;
using ::testing::ElementsAre;
using ::testing::HasSubstr;
using ::testing::IsEmpty;
using utils::FirmwareType;
using enum FirmwareType;
using Bytes = std::vector<std::uint8_t>;

TEST(VersionTextTest, PacksUpToFourFieldsOfAByte) {
    using ma::devlink::versionNumber;
    EXPECT_EQ(0x0E140A01U, versionNumber("14.20.10.1"));
    EXPECT_EQ(0x01020000U, versionNumber("1.2"));
    for (const char* text : {"", "1.2.3.4.5", "1.256", "1..2", "v1", "1.2-rc1", " 1"})
        EXPECT_EQ(0U, versionNumber(text)) << text;
}

TEST(VersionTextTest, ComparesFieldByField) {
    const auto compare = [](const char* left, const char* right) {
        const auto order = ma::devlink::compareVersions(left, right);
        return !order ? '?' : *order < 0 ? '<' : *order > 0 ? '>' : '=';
    };
    EXPECT_EQ('<', compare("1.9", "1.10"));
    EXPECT_EQ('>', compare("14.03.20", "14.3.9"));
    EXPECT_EQ('=', compare("1.02.0", "1.2"));
    EXPECT_EQ('<', compare("1.2", "1.2.0.1"));
    EXPECT_EQ('>', compare("1.99999999999999999999999", "1.99999999999999999999998"));
    EXPECT_EQ('=', compare("0x80017785", "0x80017785"));
    EXPECT_EQ('?', compare("0x80017785", "0x80017786"));
    EXPECT_EQ('?', compare("1.", "1"));
}

TEST(ComponentTableTest, MapsRunningVersionsToTypes) {
    ComponentTable table;
    table.set(ComponentTable::Row{UEFI, "boot.efi", "fw.efi"});
    std::string found;
    for (const auto& each : table.installed({{.name = "asic.id", .fixed = "7"},
                                             {.name = "fw.psid", .running = "9.9"},
                                             {.name = "fw.efi", .running = "1.2.3"},
                                             {.name = "fw.mgmt", .running = "4.5"},
                                             {.name = "fw.undi", .running = "text"}}))
        found += utils::formatStr("%d:%x ", static_cast<int>(each.type), each.version);
    EXPECT_EQ("0:4050000 3:0 4:1020300 ", found);
    EXPECT_EQ("boot.efi", table.componentOf(UEFI));
    EXPECT_EQ("fw.undi", table.componentOf(PXE));
    EXPECT_THAT(table.installed({}), IsEmpty());
}

TEST(PldmPackageTest, ReadsTheHeadersOfAllRevisions) {
    for (const unsigned revision : {1U, 2U, 3U}) {
        SCOPED_TRACE(revision);
        const Bytes file = TestPackage{.revision = revision,
                                       .cards = {{{2, 0x1234}, {0, 0x8086}, {0x101, 0x15b3}, {0x102, 0}}, {}},
                                       .images = {{0x100, "1.0"}, {0x200, "3\x1b"}},
                                       .applicable = 2}
                               .bytes();
        ASSERT_EQ(ma::devlink::PackageFormat::Known, ma::devlink::packageFormat(file));
        const auto package = ma::devlink::readPldmPackage(file);
        ASSERT_FALSE(package.error) << *package.error;
        ASSERT_EQ(2U, package.devices.size());
        const auto& device = package.devices[0];
        EXPECT_EQ(0x8086, device.vendor);
        EXPECT_EQ(0x15b3, device.subsystemVendor);
        EXPECT_FALSE(device.device || device.subsystemDevice);  // not told, and 0
        EXPECT_THAT(device.components, ElementsAre(1U));
        ASSERT_EQ(2U, package.components.size());
        const auto& component = package.components[1];
        EXPECT_EQ(0x200, component.identifier);
        EXPECT_EQ("3?", component.version);
        EXPECT_EQ(7U, component.comparisonStamp);
        EXPECT_EQ(file.size() - 16, component.offset);
    }
}

TEST(PldmPackageTest, NamesWhatIsBroken) {
    const auto errorOf = [](const Bytes& file) {
        return ma::devlink::readPldmPackage(file).error.value_or("none");
    };
    const Bytes whole = TestPackage().bytes();
    for (std::size_t length = 16; length < whole.size(); ++length)
        EXPECT_NE("none", errorOf({whole.begin(), whole.begin() + static_cast<std::ptrdiff_t>(length)}));
    Bytes changed = whole;
    changed[40] ^= 1;
    EXPECT_THAT(errorOf(changed), HasSubstr("wrong checksum"));
    // Every byte of a header that was sealed in the wrong: an error or not, never a byte too far.
    for (std::size_t place = 16; place + 20 < whole.size(); ++place) {
        changed = whole;
        changed[place] = 0xFF;
        if (place != TestPackage::kSizeField && place != TestPackage::kSizeField + 1)
            TestPackage::seal(changed);
        ma::devlink::readPldmPackage(changed);
    }
    EXPECT_THAT(errorOf(TestPackage{.imageSize = 17}.bytes()), HasSubstr("may be cut short"));
    EXPECT_THAT(errorOf(TestPackage{.applicable = 3}.bytes()), HasSubstr("names image 2 of 1"));
    changed = whole;
    changed[16] = 2;
    EXPECT_THAT(errorOf(changed), HasSubstr("format revision 2"));
    Bytes shortRecord = whole;
    shortRecord[44] = 1;  // its length
    TestPackage::seal(shortRecord);
    EXPECT_THAT(errorOf(shortRecord), HasSubstr("record of"));
}

/// What a card 1af4:1041 of subsystem 1af4:1100, which runs fw 1.9 and fw.mgmt 3.1, says to a file.
class PackageVerdictTest : public ::testing::Test {
  protected:
    PackageVerdict verdict(const Bytes& file, const std::vector<FirmwareType>& types = {}) const {
        return ma::devlink::assessPackage(
            {.ids = {0x1af4, 0x1041, 0x1af4, 0x1100},
             .canBeUpdated = updatable,
             .versions = {{.name = "fw", .running = "1.9"}, {.name = "fw.mgmt", .running = "3.1"}},
             .largestImage = 4096,
             .table = table,
             .accepts = [](const std::string& component) { return component == "fw.undi"; }},
            file, types);
    }
    void expectRefused(ma::PrepareStatus status, const std::string& reason,
                       const PackageVerdict& found) const {
        EXPECT_EQ(status, found.status);
        EXPECT_EQ(reason, found.reason);
    }

    bool updatable = true;
    ComponentTable table;
};

TEST_F(PackageVerdictTest, RefusesAPackageForAnotherCardWithBothIds) {
    const TestPackage::Descriptors subsystem = {{0, 0x1af4}, {0x100, 0x1041}, {0x101, 0x1af4}, {0x102, 7}};
    expectRefused(ma::ImageNotSupported,
                  "the package is for PCI device 8086:1592, 1af4:any, the adapter is 1af4:1041",
                  verdict(TestPackage{.cards = {{{0, 0x8086}, {0x100, 0x1592}},
                                                {{0, 0x8086}, {0x100, 0x1592}},
                                                {{0, 0x1af4}, {0x101, 1}}}}
                              .bytes()));
    expectRefused(ma::ImageNotSupported,
                  "the package is for PCI device 1af4:1041 (subsystem 1af4:0007), the adapter is 1af4:1041 "
                  "(subsystem 1af4:1100)",
                  verdict(TestPackage{.cards = {subsystem}}.bytes()));
    expectRefused(ma::ImageNotSupported, "the package is for no PCI device, the adapter is 1af4:1041",
                  verdict(TestPackage{.cards = {}}.bytes()));
}

TEST_F(PackageVerdictTest, ComparesVersionsWhereBothSidesTellThem) {
    const PackageVerdict newer = verdict(TestPackage().bytes());
    EXPECT_EQ(ma::Prepared, newer.status) << newer.reason;
    EXPECT_THAT(newer.unchecked, IsEmpty());

    expectRefused(ma::ImageIsOlder, "fw would go back from version 1.9 (installed) to 1.8.5 (in the file)",
                  verdict(TestPackage{.version = "1.8.5"}.bytes()));
    const Bytes olderPart = TestPackage{.images = {{256, "3.0"}}}.bytes();
    EXPECT_EQ(ma::Prepared, verdict(olderPart).status);
    table.set(ComponentTable::PackageRow{256, "fw.mgmt"});
    expectRefused(ma::ImageIsOlder, "fw.mgmt would go back from version 3.1 (installed) to 3.0 (in the file)",
                  verdict(olderPart));
}

TEST_F(PackageVerdictTest, SaysWhatOnlyTheDriverCanTell) {
    const std::string older = "whether it is older than what is installed";
    const std::string card = "which card the file is for";
    EXPECT_THAT(verdict(TestPackage{.version = "spring"}.bytes()).unchecked, ElementsAre(older));
    EXPECT_THAT(verdict(TestPackage{.cards = {{{0, 0x1af4}}}}.bytes()).unchecked, ElementsAre(card));
    for (const Bytes& opaque : {Bytes(100, 0x55), TestPackage{.revision = 4}.bytes()}) {
        const PackageVerdict found = verdict(opaque);
        EXPECT_EQ(ma::Prepared, found.status);
        EXPECT_THAT(found.unchecked, ElementsAre("whether the file is intact", card, older));
    }
}

TEST_F(PackageVerdictTest, TakesTypesThatTheDriverTakesAsComponents) {
    const Bytes opaque(100);
    const PackageVerdict found = verdict(opaque, {PXE, None, PXE});
    EXPECT_EQ(ma::Prepared, found.status);
    EXPECT_THAT(found.types, ElementsAre(PXE));
    EXPECT_THAT(found.components, ElementsAre("fw.undi"));
    EXPECT_THAT(verdict(opaque, {None}).components, IsEmpty());
    expectRefused(
        ma::ImageNotApplicable,
        "the driver takes no component \"fw.uefi\", which IMG_UEFI is here; without types the whole "
        "device is updated",
        verdict(opaque, {PXE, UEFI}));
    EXPECT_EQ(ma::ImageNotApplicable, verdict(opaque, {static_cast<FirmwareType>(77)}).status);
    EXPECT_EQ(ma::ImageNotApplicable, verdict(TestPackage{.applicable = 0}.bytes()).status);
}

TEST_F(PackageVerdictTest, RefusesWhatCannotBeWrittenAtAll) {
    EXPECT_EQ(ma::InvalidParameter, verdict({}).status);
    expectRefused(ma::InvalidParameter,
                  "the file has 4097 bytes, more than the 4096 that are allowed (largest_image)",
                  verdict(Bytes(4097)));
    Bytes broken = TestPackage().bytes();
    broken[50] ^= 1;
    EXPECT_EQ(ma::InvalidParameter, verdict(broken).status);
    updatable = false;
    expectRefused(ma::ImageNotSupported, "this adapter cannot be updated", verdict(Bytes(100)));
}

TEST(DevlinkSettingsTest, AreReadWhole) {
    const auto settings = ma::devlink::parseSettings(
        "firmware_folder = '/lib/firmware'\nlargest_image = 5\n"
        "[[component]]\ntype = 'IMG_UEFI'\ncomponent = 'boot'\n"
        "[[package_component]]\nidentifier = 256\nversion = 'fw.mgmt'\n",
        "file");
    EXPECT_EQ("/lib/firmware", settings.firmwareFolder);
    EXPECT_EQ(5U, settings.largestImage);
    EXPECT_EQ("boot", settings.components.componentOf(UEFI));
    EXPECT_EQ("fw.mgmt", settings.components.versionOf(256));
}

TEST(DevlinkSettingsTest, NameWhatIsWrong) {
    const std::pair<const char*, const char*> table[] = {
        {"folder = ''", "file, line 1: the settings of devlink: unknown key \"folder\""},
        {"[[component]]\ntype = 'IMG_X'\ncomponent = 'a'", "\"type\" is \"IMG_X\", it must be IMG_CLP"},
        {"[[package_component]]\nversion = 'fw'", "\"identifier\" is missing"},
        {"largest_image = ", "file, line 1:"}};
    for (const auto& [text, problem] : table) {
        try {
            ma::devlink::parseSettings(text, "file");
            ADD_FAILURE() << text;
        } catch (const ma::AdapterError& error) {
            EXPECT_THAT(error.what(), HasSubstr(problem));
        }
    }
}

}  // namespace
