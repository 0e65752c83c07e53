#include "Cli/Explanation.h"

#include <gtest/gtest.h>
#include <sys/stat.h>

#include <filesystem>

#include "Cli/ReturnValues.h"
#include "Support/TempFolder.h"
#include "Support/TestRoms.h"

namespace {

using cli::Candidate;
using utils::FirmwareType;

cli::Adapter virtioAdapter() {
    cli::Adapter adapter;
    adapter.name = "eth0";
    adapter.ids = "1af4:1041";
    adapter.components = {{"IMG_PXE", 1}, {"IMG_UEFI", 0}};
    return adapter;
}

class Explanation : public ::testing::Test {
  protected:
    std::string explain(std::uint32_t returnValue, const std::string& uri,
                        const std::vector<std::string>& types = {}) const {
        const Candidate candidate = cli::makeCandidate(adapter_, uri, types, true);
        const cli::Explanation found = cli::explainRefusal(returnValue, candidate);
        return found.message + " " + found.advice;
    }

    void expectPart(const std::string& whole, const std::string& part) const {
        EXPECT_NE(whole.find(part), std::string::npos) << "not in: " << whole << "\nwanted: " << part;
    }

    test::TempFolder folder_;
    cli::Adapter adapter_ = virtioAdapter();
};

TEST_F(Explanation, SaysWhatIsWrongWithTheFile) {
    const std::string fifo = folder_ / "fifo";
    ASSERT_EQ(mkfifo(fifo.c_str(), 0600), 0);
    const std::string huge = folder_.write("huge", "");
    std::filesystem::resize_file(huge, std::uintmax_t{3} << 30);
    std::vector<std::uint8_t> whole = test::realRom("efi-virtio");
    whole.resize(100000);

    expectPart(explain(5, "file://" + (folder_ / "none")), "none cannot be read: No such file or directory.");
    expectPart(explain(5, "file://" + folder_.path()), "is a directory.");
    expectPart(explain(5, "file://" + fifo), "is not a regular file.");
    expectPart(explain(5, "file:///dev/null"), "is not a regular file.");
    expectPart(explain(5, "file://" + folder_.write("empty", "")), "is empty.");
    expectPart(explain(5, "file://" + huge), "is larger than 2 GiB.");
    expectPart(explain(5, "file://" + folder_.write("cut", whole)), "is no whole firmware image: ");
    expectPart(explain(5, "file://" + folder_.write("text", "hello")), "is no whole firmware image: ");
    expectPart(explain(5, "https://host/image.rom"), "The service does not read images by \"https:\".");
    expectPart(explain(5, "file:/x"),
               "file:/x is no well-formed file URI. Write it as file:///directory/file");
    expectPart(explain(2, "file://" + (folder_ / "none")), "No such file or directory.");
}

TEST_F(Explanation, NamesBothIdsAndBothVersions) {
    expectPart(explain(4097, "file://" + test::realRomPath("efi-rtl8139")),
               "The image is for 10ec:8139, and eth0 is 1af4:1041.");
    adapter_.components = {{"IMG_PXE", 3}, {"IMG_UEFI", 2}};
    expectPart(
        explain(4099, "file://" + test::realRomPath("efi-virtio")),
        "Installed on eth0: IMG_PXE 3, IMG_UEFI 2; in the image: IMG_PXE 1, IMG_UEFI 0. Use a newer image, "
        "or --force");
    adapter_.components = {{"IMG_iSCSI", 1}};
    expectPart(explain(4099, "file://" + test::realRomPath("efi-virtio")), "The image types differ.");
    expectPart(explain(4106, "file://" + test::realRomPath("efi-virtio"), {"IMG_FCoE"}),
               "The image holds no IMG_FCoE.");
    adapter_.updatable = false;
    expectPart(explain(4097, "file://" + test::realRomPath("efi-virtio")),
               "The firmware of eth0 cannot be updated.");
}

TEST_F(Explanation, VgaRomsAreNoNetworkImages) {
    ma::NewRomImage vga;
    vga.type = FirmwareType::PXE;
    vga.vendorId = 0x1af4;
    vga.deviceId = 0x1041;
    vga.classCode = 0x030000;
    expectPart(explain(4097, "file://" + folder_.write("vga.rom", ma::makeRomImage(vga))),
               "holds code for another kind of device than a network adapter.");
}

TEST(ReturnValues, EachHasAMeaningAndEachRefusalAnAdvice) {
    std::uint32_t previous = 0;
    for (const cli::ReturnValueText& row : cli::returnValueTexts()) {
        EXPECT_TRUE(row.value == 0 || row.value > previous) << row.value;
        EXPECT_TRUE(std::string(row.meaning).ends_with(".")) << row.value;
        const bool isSuccess = row.value == cli::RETURN_COMPLETED || row.value == cli::RETURN_JOB_STARTED;
        EXPECT_EQ(std::string(row.advice).ends_with("."), !isSuccess) << row.value;
        previous = row.value;
    }
    for (const std::uint32_t served : {0U, 2U, 4U, 5U, 6U, 4096U, 4097U, 4099U, 4100U, 4106U, 4108U}) {
        EXPECT_EQ(cli::returnValueText(served).value, served);
    }
    EXPECT_NE(cli::returnValueText(77).value, 77U);
}

}  // namespace
