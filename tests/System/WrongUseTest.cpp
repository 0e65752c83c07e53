#include <sys/stat.h>

#include <filesystem>
#include <nlohmann/json.hpp>

#include "System/Quenxctl.h"

namespace {

using test::ProgramResult;

class WrongUse : public test::Quenxctl {
  protected:
    /// Installs on eth0 and expects this exit status and this in the error text; nothing may change.
    void expectRefusal(const std::vector<std::string>& arguments, int status, const std::string& part) {
        std::vector<std::string> all = {"install", "--target", "eth0"};
        all.insert(all.end(), arguments.begin(), arguments.end());
        const ProgramResult result = quenxctl(all);
        EXPECT_EQ(result.status, status) << arguments.front() << "\n" << result.out << result.error;
        EXPECT_NE(result.error.find(part), std::string::npos)
            << arguments.front() << ": " << result.error << "\nwanted: " << part;
        EXPECT_EQ(result.out, "") << arguments.front();
    }

    std::string rom(const std::string& name, const std::vector<std::uint8_t>& bytes) const {
        return folder_.write(name, bytes);
    }
};

TEST_F(WrongUse, BadFilesAreRefusedWithTheReason) {
    const std::string fifo = folder_ / "fifo";
    ASSERT_EQ(mkfifo(fifo.c_str(), 0600), 0);
    const std::string huge = folder_.write("huge", "");
    std::filesystem::resize_file(huge, std::uintmax_t{3} << 30);
    std::vector<std::uint8_t> cut = test::realRom("efi-virtio");
    cut.resize(100'000);

    expectRefusal({folder_ / "none"}, 1, "No such file or directory.");
    expectRefusal({folder_.path()}, 1, "is a directory.");
    expectRefusal({fifo}, 1, "is not a regular file.");
    expectRefusal({"/dev/zero"}, 1, "is not a regular file.");
    expectRefusal({huge}, 1, "is larger than 2 GiB.");
    expectRefusal({folder_.write("empty", "")}, 1, "is empty.");
    expectRefusal({rom("cut", cut)}, 1, "is no whole firmware image: ");
    expectRefusal({"http://host/x.rom"}, 1, "does not read images by \"http:\".");
    expectRefusal({"file:/x"}, 1, "is no well-formed file URI.");
    expectRefusal({"%n%s\n.rom"}, 1, "%n%s\\x0a.rom cannot be read: No such file or directory.");
    EXPECT_EQ(firmwareOf("eth0"), "IMG_PXE 0, IMG_UEFI 0");
}

TEST_F(WrongUse, WrongImagesAreRefusedWithBothSides) {
    using utils::FirmwareType;
    expectRefusal({test::realRomPath("efi-rtl8139")}, 1,
                  "The image is for 10ec:8139, and eth0 is 1af4:1041.");
    expectRefusal({test::realRomPath("efi-ne2k_pci")}, 1, "The image is for ");
    ma::NewRomImage vga;
    vga.type = FirmwareType::PXE;
    vga.vendorId = 0x1af4;
    vga.deviceId = 0x1041;
    vga.classCode = 0x030000;
    expectRefusal({rom("vga.rom", ma::makeRomImage(vga))}, 1,
                  "another kind of device than a network adapter.");
    expectRefusal({image_, "--types", "IMG_FCoE"}, 1, "The image holds no IMG_FCoE.");

    ASSERT_EQ(quenxctl({"install", "--target", "eth0",
                        rom("v7.rom", test::withRevision(test::realRom("efi-virtio"), 7))})
                  .status,
              0);
    expectRefusal({image_}, 1,
                  "Installed on eth0: IMG_PXE 7, IMG_UEFI 7; in the image: IMG_PXE 1, IMG_UEFI 0.\nUse a "
                  "newer image, or --force");
    const ProgramResult forced = quenxctl({"install", "--target", "eth0", image_, "--force"});
    EXPECT_EQ(forced.status, 0) << forced.error;
    EXPECT_EQ(firmwareOf("eth0"), "IMG_PXE 1, IMG_UEFI 0");
}

TEST_F(WrongUse, OtherAdaptersAndNames) {
    const struct {
        std::vector<std::string> arguments;
        int status;
        std::string part;
    } rows[] = {
        {{"install", "--target", "eth3", image_}, 1, "The firmware of eth3 cannot be updated."},
        {{"install", "--target", "eth4", image_}, 1, "The image types differ."},
        {{"install", "--target", "eth7", image_}, 1, "Name one of these: eth0, eth1, eth3, eth4."},
        {{"install", "--target", "X.A=\"\\\"\\\\", image_}, 1, "There is no adapter \"X.A="},
        {{"install", "--target", "eth0", image_, "--types", "img_pxe"}, 2, "\"img_pxe\" is no image type."},
        {{"install", "--target", "eth0", image_, "--types", "IMG_X"}, 2, "\"IMG_X\" is no image type."},
        {{"install", "--target", "eth0"}, 2, "name one image"},
        {{"install", "--target", "eth0", image_, "--identity", "x"}, 2, "name one image"},
        {{"install", image_}, 2, "--target is required"},
        {{"frobnicate"}, 2, "frobnicate"},
        {{}, 2, "A subcommand is required"},
        {{"instances", "No_Such"}, 1, "\"quenxctl mof\" prints the classes"},
        {{"associators", "nonsense"}, 2, "is no path of an instance."},
        {{"adapters", "--config", folder_ / "none"}, 2, "Cannot read the configuration file"},
        {{"adapters", "--providers", folder_ / "none"}, 1, "Cannot read the provider directory"},
        {{"adapters", "--providers", folder_.path()}, 1, "There is no provider library in "},
    };
    for (const auto& row : rows) {
        const ProgramResult result = quenxctl(row.arguments);
        EXPECT_EQ(result.status, row.status) << row.part << "\n" << result.out << result.error;
        EXPECT_NE(result.error.find(row.part), std::string::npos) << result.error << "\nwanted: " << row.part;
    }
    // No bad input: the empty name after the plus sign asks for no type at all.
    EXPECT_EQ(quenxctl({"install", "--target", "eth0", image_, "--types", "IMG_PXE+"}).status, 0);
}

TEST_F(WrongUse, AMistakeInTheDescriptionIsNamed) {
    folder_.write("adapters.toml", "[[adapter]]\nname = \"eth0\"\nspeeed = 1\n");
    const ProgramResult result = quenxctl({"adapters"});
    EXPECT_EQ(result.status, 1);
    EXPECT_NE(result.error.find("adapters.toml, line "), std::string::npos) << result.error;
}

TEST_F(WrongUse, JsonIsOneDocumentAlsoForErrors) {
    const struct {
        std::vector<std::string> arguments;
        int status;
        std::string key;
    } rows[] = {
        {{"adapters"}, 0, "adapters"},
        {{"instances", "Quenx_SoftwareInstallationService"}, 0, "instances"},
        {{"instances", "Quenx_EthernetPort", "--names"}, 0, "paths"},
        {{"mof"}, 0, "mof"},
        {{"identities"}, 0, "identities"},
        {{"instances", "No_Such"}, 1, "error"},
        {{"install", "--target", "eth9", image_}, 1, "error"},
        {{"install", "--target", "eth3", image_}, 1, "returnValue"},
        {{"install", "--target", "eth0", image_}, 0, "job"},
        {{"install", "--target", "eth0", image_}, 3, "result"},
    };
    for (const auto& row : rows) {
        std::vector<std::string> arguments = row.arguments;
        arguments.emplace_back("--json");
        const ProgramResult result = quenxctl(arguments);
        EXPECT_EQ(result.status, row.status) << result.out << result.error;
        const auto document = nlohmann::json::parse(result.out, nullptr, false);
        ASSERT_FALSE(document.is_discarded()) << result.out;
        EXPECT_TRUE(document.contains(row.key)) << result.out;
        EXPECT_EQ(document.value("exitStatus", row.status), row.status) << result.out;
    }
}

TEST_F(WrongUse, HelpDocumentsTheExitStatuses) {
    for (const std::vector<std::string>& arguments :
         {std::vector<std::string>{"--help"}, {"install", "--help"}, {"check", "--help"}}) {
        const ProgramResult result = quenxctl(arguments);
        EXPECT_EQ(result.status, 0);
        EXPECT_NE(result.out.find("3  already current"), std::string::npos) << result.out;
    }
}

}  // namespace
