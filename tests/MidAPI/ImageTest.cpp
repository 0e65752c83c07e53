// SPDX-License-Identifier: Apache-2.0
#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <map>
#include <numeric>
#include <sstream>

#include "MidAPI/Image/ImagePreparation.h"
#include "MidAPI/Image/OptionRom.h"
#include "MidAPI/Image/RomFormat.h"
#include "MidAPI/ma.h"
#include "Support/SimulatedAdapters.h"
#include "Support/SyslogCapture.h"
#include "Support/TempFolder.h"
#include "Support/TestRoms.h"
#include "Utils/Utils.h"

namespace {

using utils::FirmwareType;
using enum utils::FirmwareType;
using Rom = std::vector<std::uint8_t>;
using Types = std::vector<FirmwareType>;

void mend(Rom& image) {
    const auto sum = static_cast<std::uint8_t>(std::accumulate(image.begin(), image.end(), 0U));
    image[ma::rom::kHeaderChecksum] = static_cast<std::uint8_t>(image[ma::rom::kHeaderChecksum] - sum);
}

// A flash that was never written to is made anew at each start, and must be the one that it was.
TEST(OptionRomTest, MakesTheSameImagesInEveryVersion) {
    const auto sumOf = [](ma::NewRomImage wanted) {
        wanted.vendorId = 0x1af4;
        wanted.deviceId = 0x1041;
        wanted.codeRevision = 0x0102;
        return ma::crc32(ma::makeRomImage(wanted));
    };
    EXPECT_EQ(0x4CC7F4EDU, sumOf({.type = PXE, .furtherDeviceIds = {0x1000, 0x1042}, .length = 1025}));
    EXPECT_EQ(0xDB2FF73DU, sumOf({.type = PXE, .furtherDeviceIds = std::vector<std::uint16_t>(65, 7)}));
    EXPECT_EQ(0xB22184A6U, sumOf({.type = iSCSI, .furtherDeviceIds = {}, .clp = true, .length = 0}));
    EXPECT_EQ(0xE957D3B4U,
              sumOf({.type = FCoE, .furtherDeviceIds = {}, .length = 256 * 512, .classCode = 0x123456}));
    EXPECT_EQ(0xAE5827B9U, sumOf({.type = UEFI, .furtherDeviceIds = {}, .clp = true}));
    EXPECT_EQ(0x4018C716U, sumOf({.type = CLP, .furtherDeviceIds = {}}));
}

TEST(OptionRomTest, ReadsPrintableTextsOfBoundedLength) {
    Rom rom = test::madeRom({{PXE, 1}});
    const ma::RomImage made = ma::parseOptionRom(rom).images.at(0);
    EXPECT_EQ("Simulator", made.manufacturer);
    EXPECT_EQ("Simulated PXE boot", made.product);
    std::fill_n(rom.begin() + 0x70, 256, 'x');
    const Rom edges = test::bytesOf("1f 20 7e 7f 80");
    std::ranges::copy(edges, rom.begin() + 0x70);
    mend(rom);
    EXPECT_EQ("? ~??" + std::string(250, 'x'), ma::parseOptionRom(rom).images.at(0).product);
    // Up to the end of the image, and none at all.
    std::ranges::copy(std::string_view("end"), rom.end() - 3);
    ma::writeLe16(rom, 0x40 + ma::rom::kPnpProduct, 0x3FD);
    ma::writeLe16(rom, 0x40 + ma::rom::kPnpManufacturer, 0);
    mend(rom);
    EXPECT_EQ("end", ma::parseOptionRom(rom).images.at(0).product);
    EXPECT_EQ("", ma::parseOptionRom(rom).images.at(0).manufacturer);
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

/// As a line of the sample says it.
void breakRom(Rom& rom, const std::string& step) {
    if (step == "mend") return mend(rom);
    std::istringstream words(step.starts_with("length ") ? step.substr(7) : step);
    std::size_t place = 0;
    words >> std::hex >> place;
    if (step.starts_with("length ")) return rom.resize(place);
    for (unsigned int byte = 0; words >> byte; ++place)
        rom.at(place) = static_cast<std::uint8_t>(byte);
}

TEST(OptionRomTest, NamesWhatIsBroken) {
    for (const auto& row : test::readTestTable(QUENX_MIDAPI_TEST_DIR "/samples/broken-images")) {
        Rom rom = test::madeRom({{PXE, 1}});
        for (std::size_t i = 1; i < row.size(); ++i)
            breakRom(rom, row[i]);
        const std::string error = ma::parseOptionRom(rom).error.value_or("none");
        EXPECT_TRUE(error.ends_with(row[0])) << error << "\nwanted: " << row[0];
    }
}

Rom pxeFor(std::uint16_t device, std::vector<std::uint16_t> others,
           std::uint32_t classCode = ma::rom::kEthernetClass) {
    return ma::makeRomImage({.type = PXE,
                             .vendorId = 0x1af4,
                             .deviceId = device,
                             .furtherDeviceIds = std::move(others),
                             .codeRevision = 1,
                             .classCode = classCode});
}

/// As the sample names it.
Rom fileOf(const std::string& text) {
    Rom otherProcessor = test::madeRom({{CLP, 1}});
    otherProcessor[0x1C + ma::rom::kPcirCodeType] = ma::rom::CodeType::OpenFirmware;
    const std::map<std::string, Rom> described = {
        {"for another processor", otherProcessor},
        {"for a graphics card", pxeFor(0x1041, {}, 0x030000)},
        {"for 1000 and 1041", pxeFor(0x1000, {0x1041})},
        {"for 1000, 1042 and 1043", pxeFor(0x1000, {0x1042, 0x1043})}};
    if (described.contains(text)) return described.at(text);
    const std::size_t comma = text.find(", ");
    if (!text.starts_with("IMG_")) {
        Rom rom = test::realRom(text.substr(0, comma));
        if (comma != std::string::npos) rom.resize(std::stoul(text.substr(text.rfind(' '))));
        return rom;
    }
    std::vector<utils::FirmwareVersionInfo> components;
    std::istringstream words(text);
    for (std::string type, version; words >> type >> version;)
        components.push_back({test::typesOf(type).at(0), static_cast<std::uint32_t>(std::stoul(version))});
    return test::madeRom(components);
}

TEST(ImagePreparationTest, AnswersByTheTable) {
    const test::SimulatedAdapters adapters;
    for (const auto& row : test::readTestTable(QUENX_MIDAPI_TEST_DIR "/samples/preparations")) {
        SCOPED_TRACE(row[0] + " " + row.at(1));
        const Rom file = fileOf(row[0].substr(5));
        const Types requested = test::typesOf(row[1]);
        const int status = std::stoi(row.at(2));
        const Types written = row[2].size() > 2 ? test::typesOf(row[2].substr(2)) : Types();
        test::SyslogCapture::clear();
        const test::PreparedImage prepared = test::prepareImage(row[0].substr(0, 4), file, requested);
        EXPECT_EQ(status, prepared.status);
        EXPECT_EQ(written, prepared.types);
        const std::string said = "simulated adapter " + row[0].substr(0, 4) + ": status ";
        EXPECT_EQ(status == 0 ? "" : said + std::to_string(status) + ": " + row.at(3),
                  utils::joined(test::SyslogCapture::messages("error")));
        if (status != 0 && status != 3 && status != 4) {
            EXPECT_EQ(file.size(), prepared.image.size()) << "the size was changed";
            continue;
        }
        // Also when the caller must insist, the output is an image that can be written.
        const ma::RomFile rom = ma::parseOptionRom(prepared.image);
        ASSERT_FALSE(rom.error) << *rom.error;
        Types found;
        for (const utils::FirmwareVersionInfo& component : rom.components())
            found.push_back(component.type);
        EXPECT_EQ(written, found);
    }
}

TEST(ImagePreparationTest, TakesTheLossOfTheClpEntryForAnotherType) {
    const ma::PreparationTarget target{0x1af4, 0x1041, true, {{CLP, 1}, {PXE, 1}}};
    EXPECT_EQ(ma::PrepareStatus::ImageTypesDiffer,
              ma::assessImage(target, test::madeRom({{PXE, 1}}), {}).status);
    EXPECT_EQ(ma::PrepareStatus::Prepared, ma::assessImage(target, test::madeRom({{CLP, 1}}), {PXE}).status);
}

TEST(ImagePreparationTest, RefusesABufferThatIsMissingOrTooSmall) {
    const test::SimulatedAdapters adapters;
    const Rom rom = test::madeRom({{PXE, 1}});
    Rom output(rom.size() - 1);
    auto imageSize = static_cast<std::uint32_t>(output.size());
    Types types;
    const test::SyslogCapture log;
    EXPECT_EQ(1, ma::prepareFlashImage("eth0", rom.data(), imageSize + 1, output.data(), &imageSize, types));
    for (const auto& [file, into] :
         {std::pair<const std::uint8_t*, std::uint8_t*>{nullptr, output.data()}, {rom.data(), nullptr}})
        EXPECT_EQ(1, ma::prepareFlashImage("eth0", file, imageSize, into, &imageSize, types));
    EXPECT_EQ(1, ma::prepareFlashImage("eth0", nullptr, 0, nullptr, nullptr, types));
    EXPECT_EQ(utils::StringArray(4, "simulated adapter eth0: status 1: a buffer is missing or too small"),
              test::SyslogCapture::messages("error"));
}

}  // namespace
