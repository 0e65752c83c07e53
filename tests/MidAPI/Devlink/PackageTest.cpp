// SPDX-License-Identifier: Apache-2.0
// Firmware packages: what is read of them, and what that means for a card.
#include <gmock/gmock.h>

#include "MidAPI/Devlink/ComponentTable.h"
#include "MidAPI/Devlink/PackageVerdict.h"
#include "MidAPI/Devlink/PldmPackage.h"
#include "MidAPI/Devlink/Settings.h"
#include "MidAPI/Image/Bytes.h"
#include "MidAPI/Image/OptionRom.h"
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

/// Makes firmware packages of DSP0267, with images of 16 bytes behind the header.
struct TestPackage {
    /// Of a device: types and values.
    using Descriptors = std::vector<std::pair<unsigned, unsigned>>;
    struct Image {
        unsigned identifier;
        std::string version;
    };

    unsigned revision = 1;
    std::vector<Descriptors> cards = {{{0x0000, 0x1af4}, {0x0100, 0x1041}}};
    std::string version = "2.0";               ///< the same for all cards
    std::vector<Image> images = {{1, "2.0"}};  ///< at most 8
    unsigned applicable = 1;                   ///< the bitmap of them, the same for all cards
    unsigned imageSize = 16;                   ///< as the header tells it

    static constexpr std::size_t kSizeField = 17;

    Bytes bytes() const {
        std::string header = identifier() + number(revision, 1) + number(0, 2) + std::string(13, '\0') +
                             number(8, 2) + text("package");
        header += number(cards.size(), 1);
        for (const Descriptors& card : cards)
            header += record(card);
        if (revision >= 2) header += number(1, 1) + number(4, 2) + number(0, 2);  // a downstream device
        header += number(images.size(), 2);
        std::string list = entries(0);
        list = entries(header.size() + list.size() + 4);
        header += list;
        Bytes file(header.begin(), header.end());
        file.resize(file.size() + 4 + images.size() * 16);
        ma::writeLe16(file, kSizeField, static_cast<std::uint16_t>(header.size() + 4));
        seal(file);
        return file;
    }

    /// Corrects the checksum after a change of the header.
    static void seal(Bytes& file) {
        const std::size_t checked = ma::readLe16(file, kSizeField) - 4U;
        ma::writeLe32(file, checked, ma::crc32(std::span(file).first(checked)));
    }

  private:
    static std::string number(std::size_t value, int length) {
        std::string bytes;
        for (int index = 0; index < length; ++index)
            bytes += static_cast<char>(value >> 8 * index & 0xFF);
        return bytes;
    }
    /// ASCII, with its type and length in front.
    static std::string text(const std::string& value) {
        return number(1, 1) + number(value.size(), 1) + value;
    }
    std::string identifier() const {
        static constexpr const char* kIdentifiers[] = {
            "\xF0\x18\x87\x8C\xCB\x7D\x49\x43\x98\x00\xA0\x2F\x05\x9A\xCA\x02",
            "\x12\x44\xD2\x64\x8D\x7D\x47\x18\xA0\x30\xFC\x8A\x56\x58\x7D\x5A",
            "\x31\x19\xCE\x2F\xE8\x0A\x4A\x99\xAF\x6D\x46\xF8\xB1\x21\xF6\xBF",
            "\x7B\x29\x1C\x99\x6D\xB6\x42\x08\x80\x1B\x02\x02\x6E\x46\x3C\x78"};
        return {kIdentifiers[revision - 1], 16};
    }
    std::string record(const Descriptors& card) const {
        std::string body = number(card.size(), 1) + number(0, 4) + number(1, 1) + number(version.size(), 1) +
                           number(0, 2) + number(applicable, 1) + version;
        for (const auto& [type, value] : card)
            body += number(type, 2) + number(2, 2) + number(value, 2);
        return number(body.size() + 2, 2) + body;
    }
    std::string entries(std::size_t firstImage) const {
        std::string list;
        for (const Image& image : images) {
            list += number(10, 2) + number(image.identifier, 2) + number(7, 4) + number(2, 2) + number(0, 2) +
                    number(firstImage, 4) + number(imageSize, 4) + text(image.version);
            if (revision >= 3) list += number(3, 4) + "abc";  // opaque data
            firstImage += 16;
        }
        return list;
    }
};

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
    EXPECT_THAT(errorOf(TestPackage{.imageSize = 17}.bytes()), HasSubstr("may be cut short"));
    EXPECT_THAT(errorOf(TestPackage{.applicable = 3}.bytes()), HasSubstr("names image 2 of 1"));
    changed = whole;
    changed[16] = 2;
    EXPECT_THAT(errorOf(changed), HasSubstr("format revision 2"));
    changed = whole;
    changed[44] = 1;  // the length of a record
    TestPackage::seal(changed);
    EXPECT_THAT(errorOf(changed), HasSubstr("record of"));
}

/// What a card 1af4:1041 of subsystem 1af4:1100, which runs fw 1.9 and fw.mgmt 3.1, says to a file: status
/// and reason, or types and components and what could not be checked.
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
    return answer + utils::joined(verdict.components) + ": " + utils::joined(verdict.unchecked, "; ");
}

TEST(PackageVerdictTest, FollowsFromIdsVersionsAndTypes) {
    const std::string older = "whether it is older than what is installed";
    const std::string card = "which card the file is for";
    const std::string opaque = "whether the file is intact; " + card + "; " + older;
    const TestPackage::Descriptors foreign = {{0, 0x8086}, {0x100, 0x1592}};
    const TestPackage::Descriptors subsystem = {{0, 0x1af4}, {0x100, 0x1041}, {0x101, 0x1af4}, {0x102, 7}};
    const Bytes zeros(100);
    Bytes broken = TestPackage().bytes();
    broken[50] ^= 1;
    const std::tuple<Bytes, std::vector<FirmwareType>, std::string> table[] = {
        {TestPackage().bytes(), {}, "0 : "},
        {TestPackage{.cards = {foreign, foreign, {{0, 0x1af4}, {0x101, 1}}}}.bytes(),
         {},
         "2 the package is for PCI device 8086:1592, 1af4:any, the adapter is 1af4:1041: "},
        {TestPackage{.cards = {subsystem}}.bytes(),
         {},
         "2 the package is for PCI device 1af4:1041 (subsystem 1af4:0007), the adapter is 1af4:1041 "
         "(subsystem 1af4:1100): "},
        {TestPackage{.cards = {}}.bytes(),
         {},
         "2 the package is for no PCI device, the adapter is 1af4:1041: "},
        {TestPackage{.version = "1.8.5"}.bytes(),
         {},
         "3 fw would go back from version 1.9 (installed) to 1.8.5 (in the file): "},
        // What only the driver can tell.
        {TestPackage{.version = "spring"}.bytes(), {}, "0 : " + older},
        {TestPackage{.cards = {{{0, 0x1af4}}}}.bytes(), {}, "0 : " + card},
        {TestPackage{.revision = 4}.bytes(), {}, "0 : " + opaque},
        {zeros, {None}, "0 : " + opaque},
        {zeros, {PXE, None, PXE}, "0 IMG_PXE fw.undi: " + opaque},
        {zeros,
         {PXE, UEFI},
         "5 the driver takes no component \"fw.uefi\", which IMG_UEFI is here; without types the whole "
         "device is updated: "},
        {zeros,
         {static_cast<FirmwareType>(77)},
         "5 type 77 is no component that a driver could be asked for: "},
        {TestPackage{.applicable = 0}.bytes(), {}, "5 the package has no image for this card: "},
        {{}, {}, "1 the file is empty: "},
        {Bytes(4097), {}, "1 the file has 4097 bytes, more than the 4096 that are allowed (largest_image): "},
        {broken,
         {},
         "1 the file is not an intact firmware package: it has a wrong checksum of the header (offset "
         "0x62): "},
    };
    for (const auto& [file, types, answer] : table)
        EXPECT_EQ(answer, answerTo(file, types));
    EXPECT_EQ("2 this adapter cannot be updated: it has gone: ", answerTo(zeros, {}, "it has gone"));
    const Bytes olderPart = TestPackage{.images = {{256, "3.0"}}}.bytes();
    EXPECT_EQ("0 : ", answerTo(olderPart, {}));
    ComponentTable components;
    components.set(ComponentTable::PackageRow{256, "fw.mgmt"});
    EXPECT_EQ("3 fw.mgmt would go back from version 3.1 (installed) to 3.0 (in the file): ",
              answerTo(olderPart, {}, "", components));
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
