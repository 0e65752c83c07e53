// SPDX-License-Identifier: Apache-2.0
#include <sys/stat.h>

#include <filesystem>
#include <nlohmann/json.hpp>

#include "System/Quenxctl.h"

namespace {

using test::ProgramResult;

class WrongUse : public test::Quenxctl {
  protected:
    /// Installing this on eth0 is refused for this reason, and so is a check.
    void expectRefusal(const std::string& image, const std::string& part, int status = 1) const {
        expectError({"install", "--target", "eth0", image}, status, part);
        expectError({"check", "--target", "eth0", image}, status, part);
    }
};

TEST_F(WrongUse, BadFilesAreRefusedWithTheReason) {
    const std::string fifo = folder_ / "fifo";
    ASSERT_EQ(mkfifo(fifo.c_str(), 0600), 0);
    const std::string huge = folder_.write("huge", "");
    std::filesystem::resize_file(huge, std::uintmax_t{3} << 30);
    std::vector<std::uint8_t> cut = test::realRom("efi-virtio");
    cut.resize(100'000);

    constexpr int NOT_FOUND = 4;
    expectRefusal(
        folder_ / "none",
        "quenxctl: Cannot read " + (folder_ / "none") + ": No such file or directory.\nCheck the path.\n",
        NOT_FOUND);
    expectRefusal("%n%s\n.rom", "%n%s\\x0a.rom: No such file or directory.", NOT_FOUND);
    expectRefusal(folder_.path(), "is a directory.\nName a complete firmware image.");
    expectRefusal(fifo, "is not a regular file.");
    expectRefusal("/dev/zero", "is not a regular file.");
    expectRefusal(huge, "is larger than 2 GiB.");
    expectRefusal(folder_.write("empty", ""), "is empty.");
    expectRefusal(folder_.write("text", "hello"), "is not a complete firmware image: ");
    expectRefusal(folder_.write("cut", cut), "is not a complete firmware image: ");
    expectRefusal("http://host/x.rom", "does not read images over \"http:\".");
    expectRefusal("file:/x", "file:/x is not a valid file URI.\nWrite it as file:///directory/file");
    EXPECT_EQ(firmwareOf("eth0"), "IMG_PXE 1, IMG_UEFI 0");
}

TEST_F(WrongUse, WrongImagesAreRefusedWithBothSides) {
    using utils::FirmwareType;
    // Of the same versions as what is installed, too.
    const auto foreign = test::madeRom({{FirmwareType::PXE, 1}, {FirmwareType::UEFI, 0}}, 0x10ec, 0x8139);
    expectRefusal(folder_.write("foreign.rom", foreign),
                  "The image is for 10ec:8139, but eth0 is 1af4:1041.\nGet the image made for 1af4:1041.");
    ma::NewRomImage vga;
    vga.type = FirmwareType::PXE;
    vga.vendorId = 0x1af4;
    vga.deviceId = 0x1041;
    vga.classCode = 0x030000;
    expectRefusal(folder_.write("vga.rom", ma::makeRomImage(vga)),
                  "is for a device that is not a network adapter.");
    const std::string pxe = folder_.write("pxe.rom", test::madeRom({{FirmwareType::PXE, 2}}, 0x15ad, 0x07b0));
    std::vector<std::string> differing = {"check", "--target", "eth4", pxe};
    const std::string types =
        "The image types differ: the image has IMG_PXE, but eth4 has IMG_iSCSI 1, IMG_UEFI 0.\n";
    expectError(differing, 1, types + "Use an image with the same types, or --force, which works unless");
    differing.emplace_back("--force");
    EXPECT_EQ(quenxctl(differing).status, 0);
    differing.insert(differing.end(), {"--config", folder_.write("provider.conf", "OEMCustomizeable=5\n")});
    expectError(differing, 1, types + "Use an image with the same types: --force does not help");

    ASSERT_EQ(quenxctl({"install", "--target", "eth0", image_}).status, 0);
    const std::string older = test::realRomPath("efi-virtio");
    expectRefusal(older,
                  "quenxctl: IMG_PXE 1 is older than the installed 2, IMG_UEFI 0 than the installed 2.\n"
                  "Use a newer image, or install this one with --force.\n");
    EXPECT_EQ(quenxctl({"install", "--target", "eth0", older, "--force"}).status, 0);
    EXPECT_EQ(firmwareOf("eth0"), "IMG_PXE 1, IMG_UEFI 0");
}

TEST_F(WrongUse, OtherAdaptersAndNames) {
    const std::string fixed =
        folder_.write("fixed.rom", test::madeRom({{utils::FirmwareType::PXE, 2}}, 0x1022, 0x2000));
    const struct {
        std::vector<std::string> arguments;
        int status;
        std::string part;
    } rows[] = {
        // The ids match.
        {{"install", "--target", "eth3", fixed}, 1, "quenxctl: The firmware of eth3 cannot be updated.\n"},
        {{"install", "--target", "eth7", image_},
         4,
         "\"eth7\".\nThe adapters are eth0, eth1, eth2, eth3, eth4."},
        {{"install", "--target", "EHT2", image_}, 4, "\"EHT2\".\nDid you mean eth2? The adapters are eth0, "},
        {{"install", "--target", "0001:03:00.0", image_}, 4, "There is no adapter \"0001:03:00.0\"."},
        {{"install", "--target", "X.A=\"\\\"\\\\", image_}, 4, "There is no adapter \"X.A="},
        {{"install", "--target", "X.A=", image_}, 4, "There is no adapter \"X.A=\"."},
        {{"install", "--target", "eth0", image_, "--types", "IMG_FCoE"},
         1,
         "The image has no IMG_FCoE.\nIt has IMG_PXE, IMG_UEFI.\n"},
        {{"install", "--target", "eth0", image_, "--types", "img_pxe"},
         2,
         "Did you mean IMG_PXE? The types are"},
        {{"check", "--target", "eth0", image_, "--types", "IMG_X"}, 2, "There is no image type \"IMG_X\"."},
        {{"install", "--target", "eth0"}, 2, "name one image"},
        {{"install", "--target", "eth0", image_, "--identity", "x"}, 2, "name one image"},
        {{"install", image_}, 2, "--target is required"},
        {{"install", "--traget=eth0", image_},
         2,
         "\"install\" has no option \"--traget\".\nDid you mean --target? \"quenxctl help install\""},
        {{"adapters", "--target", "eth0"}, 2, "\"adapters\" has no option \"--target\"."},
        {{"--jsno"}, 2, "There is no option \"--jsno\".\nDid you mean --json? "},
        {{"isntall", "--traget", "eth0"}, 2, "There is no verb \"isntall\"."},
        {{"adapters", "--user", "a"}, 2, "--user requires --server"},
        {{"adapters", "--namespace", "root/cimv2"}, 2, "--namespace requires --server"},
        {{"frobnicate"}, 2, "There is no verb \"frobnicate\".\n\"quenxctl --help\" lists"},
        {{"isntall"}, 2, "There is no verb \"isntall\".\nDid you mean install? "},
        {{"help", "jbos"}, 2, "There is no verb \"jbos\".\nDid you mean jobs? "},
        {{}, 2, "No verb was given."},
        {{"instances", "No_Such"}, 4, "served.\n\"quenxctl mof\" prints the classes"},
        {{"instances", "Quenx_EthernetProt", "--names"},
         4,
         "No class \"Quenx_EthernetProt\" is served.\nDid you mean Quenx_EthernetPort? \"quenxctl mof\""},
        {{"adapters", "--server", ""}, 2, "--server \"\" does not begin with https:// or http://."},
        {{"adapters", "--server", "127.0.0.1:5989"}, 2, "Write it as https://host:5989."},
        {{"adapters", "--server", "https://a:b@host"}, 2, "Name the user with --user"},
        {{"associators", "nonsense"}, 2, "is not the path of an instance."},
        {{"adapters", "--config", folder_ / "none"}, 2, ": No such file or directory.\nCheck the path.\n"},
        {{"adapters", "--providers", folder_ / "none"}, 2, "Cannot read the provider directory"},
        {{"adapters", "--providers", folder_.path()}, 2, "There is no provider library in "},
    };
    for (const auto& row : rows)
        expectError(row.arguments, row.status, row.part);
    // No bad input: the empty name after the plus sign asks for no type at all.
    EXPECT_EQ(quenxctl({"install", "--target", "eth0", image_, "--types", "IMG_PXE+"}).status, 0);

    EXPECT_EQ(quenxctl({"adapters"}, {"QUENXCTL_USER=a"}).status, 0) << "set for whenever there is a server";

    const std::string none = folder_ / "none.toml";
    const ProgramResult named =
        test::run({QUENXCTL, "--config", configuration_, "adapters"}, {"QUENX_ADAPTERS=" + none});
    EXPECT_EQ(named.error,
              "quenxctl: QUENX_ADAPTERS: there is no adapter description " + none +
                  "; name a readable file.\nCorrect QUENX_ADAPTERS or the file that it names.\n");
    folder_.write("adapters.toml", "[[adapter]]\nname = \"eth0\"\nspeeed = 1\n");
    expectError({"adapters"}, 2, "adapters.toml, line ");
}

TEST_F(WrongUse, JsonIsOneDocumentAlsoForErrors) {
    const struct {
        std::vector<std::string> arguments;
        int status;
        std::string key;
        nlohmann::json value;
    } rows[] = {
        {{"adapters"}, 0, "/adapters/0/name", "eth0"},
        {{"instances", "Quenx_EthernetPort"}, 0, "/instances/0/class", "Quenx_EthernetPort"},
        {{"instances", "Quenx_EthernetPort", "--names"}, 0, "/paths/5", nullptr},
        {{"identities"}, 0, "/identities/0/file", nullptr},
        {{"instances", "No_Such"}, 4, "/exitStatus", 4},
        {{"frobnicate"}, 2, "/error", "There is no verb \"frobnicate\"."},
        {{"install", "--target", "eth9", image_}, 4, "/error", "There is no adapter \"eth9\"."},
        {{"check", "--target", "eth0", "none.rom"}, 4, "/result", "refused"},
        {{"check", "--target", "eth0", image_}, 0, "/result", "installable"},
        {{"install", "--target", "eth3", image_}, 1, "/returnValue", 4097},
        {{"install", "--target", "eth0", image_}, 0, "/job/state", 7},
        {{"install", "--target", "eth0", image_}, 3, "/result", "already current"},
        {{"install", "--target", "eth0", image_, "--force"}, 0, "/after/0/version", 2},
    };
    for (const auto& row : rows) {
        std::vector<std::string> arguments = row.arguments;
        arguments.emplace_back("--json");
        const ProgramResult result = quenxctl(arguments);
        EXPECT_EQ(result.status, row.status) << result.out << result.error;
        const auto document = nlohmann::json::parse(result.out, nullptr, false);
        EXPECT_EQ(document.value(nlohmann::json::json_pointer(row.key), nlohmann::json()), row.value)
            << result.out;
    }
}

TEST_F(WrongUse, HelpIsAVerbAndAnOption) {
    const std::string help = quenxctl({"help"}).out;
    EXPECT_EQ(help, quenxctl({"--help"}).out);
    for (const char* part : {"install, update", "3  already current", "4  not found"})
        EXPECT_TRUE(test::contains(help, part)) << help;
    EXPECT_EQ(quenxctl({"help", "update"}).out, quenxctl({"install", "--help"}).out);
}

}  // namespace
