// SPDX-License-Identifier: Apache-2.0
// Firmware packages: what is read of them, and what that means for a card.
#include <gmock/gmock.h>

#include "MidAPI/Devlink/ComponentTable.h"
#include "MidAPI/Devlink/PackageVerdict.h"
#include "MidAPI/Devlink/PldmPackage.h"
#include "MidAPI/Devlink/Settings.h"
#include "MidAPI/Image/OptionRom.h"
#include "Support/TempFolder.h"
#include "Support/TestRoms.h"
#include "Utils/Utils.h"

namespace {

using ma::devlink::ComponentTable;
using ma::devlink::PackageVerdict;
using ::testing::ElementsAre;
using ::testing::HasSubstr;
using ::testing::IsEmpty;
using utils::FirmwareType;
using enum FirmwareType;
using Bytes = std::vector<std::uint8_t>;

/// A file of samples/packages.
Bytes package(const std::string& name) {
    std::string words;
    for (const auto& row : test::readTestTable(QUENX_MIDAPI_TEST_DIR "/samples/packages"))
        if (row[0] == name) words = utils::joined({row.begin() + 1, row.end()}, " ");
    EXPECT_NE("", words) << name;
    return test::bytesOf(words);
}

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
    for (const char* name : {"revision 1", "revision 2", "revision 3"}) {
        SCOPED_TRACE(name);
        const Bytes file = package(name);
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
        EXPECT_EQ(file.size() - 16, component.offset);
    }
}

TEST(PldmPackageTest, NamesWhatIsBroken) {
    const auto errorOf = [](const Bytes& file) {
        return ma::devlink::readPldmPackage(file).error.value_or("none");
    };
    const Bytes whole = package("whole");
    EXPECT_EQ("none", errorOf(whole));
    std::string said;
    std::string last;
    for (std::size_t length = 16; length < whole.size(); ++length) {
        const std::string error =
            errorOf({whole.begin(), whole.begin() + static_cast<std::ptrdiff_t>(length)});
        // Without what differs with each length.
        const std::string same = error.substr(0, error.find(" in a file of "));
        if (same != last) said += "to " + std::to_string(length) + ": " + error + "\n";
        last = same;
    }
    for (const char* name : {"wrong checksum", "image cut short", "image inside the checksum",
                             "image that is not there", "revision 2 by its number alone", "short record"})
        said += std::string(name) + ": " + errorOf(package(name)) + "\n";
    const Bytes expected = test::readTestFile(QUENX_MIDAPI_TEST_DIR "/samples/package-errors");
    EXPECT_EQ(said, std::string(expected.begin(), expected.end()));
}

/// What the card of samples/verdicts says to a file.
std::string answerTo(const Bytes& file, const std::vector<FirmwareType>& types,
                     const std::string& hindrance = "", const ComponentTable& table = {}) {
    const PackageVerdict verdict = ma::devlink::assessPackage(
        {.ids = {0x1af4, 0x1041, 0x1af4, 0x1100},
         .hindrance = hindrance,
         .versions = {{.name = "fw", .running = "1.9"}, {.name = "fw.mgmt", .running = "3.1"}},
         .largestImage = 4096,
         .table = table,
         .accepts = [](const std::string& component) { return component == "fw.undi"; }},
        file, types);
    std::string answer = std::to_string(verdict.status) + ' ' + verdict.reason;
    for (const FirmwareType type : verdict.types)
        answer += std::string(ma::firmwareTypeName(type)) + ' ';
    const std::string unchecked = utils::joined(verdict.unchecked, "; ");
    answer += utils::joined(verdict.components) + (unchecked.empty() ? ":" : ": ") + unchecked;
    for (const auto& [name, inFlash, inFile] : verdict.versions)
        answer += ' ' + name + ' ' + inFlash + " -> " + inFile;
    return answer + (verdict.isForCard ? " (for it)" : "");
}

TEST(PackageVerdictTest, FollowsFromIdsVersionsAndTypes) {
    for (const auto& row : test::readTestTable(QUENX_MIDAPI_TEST_DIR "/samples/verdicts")) {
        const bool isMade = row[0].ends_with(" zeros");
        EXPECT_EQ(row.at(2),
                  answerTo(isMade ? Bytes(std::stoul(row[0])) : package(row[0]), test::typesOf(row.at(1))))
            << row[0];
    }
    EXPECT_EQ("2 this adapter cannot be updated: it has gone:", answerTo(Bytes(100), {}, "it has gone"));
    ComponentTable components;
    components.set(ComponentTable::PackageRow{256, "fw.mgmt"});
    EXPECT_EQ(
        "3 fw.mgmt would go back from version 3.1 (installed) to 3.0 (in the file): fw 1.9 -> 2.0 (for it)",
        answerTo(package("image 256"), {}, "", components));
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
        {"[[component]]\ntype = 'IMG_X'\ncomponent = 'a'",
         "file, line 2: a component: \"type\" is \"IMG_X\", it must be IMG_CLP, IMG_iSCSI, IMG_PXE, IMG_UEFI "
         "or IMG_FCoE"},
        {"[[package_component]]\nversion = 'fw'",
         "file, line 1: a component of packages: \"identifier\" is missing; write for example identifier = "
         "256"},
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
