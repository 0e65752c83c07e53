// SPDX-License-Identifier: Apache-2.0
#include <sys/stat.h>

#include <filesystem>
#include <nlohmann/json.hpp>

#include "System/Quenxctl.h"

namespace {

using test::ProgramResult;
using enum utils::FirmwareType;

class WrongUseTest : public test::Quenxctl {
  protected:
    /// Installing this on eth0 is refused for this reason, and so is a check.
    void expectRefusal(const std::string& image, const std::string& part, int status = 1) const {
        expectError("install --target eth0 " + image, status, part);
        expectError("check --target eth0 " + image, status, part);
    }
};

TEST_F(WrongUseTest, RefusesBadFilesWithTheReason) {
    const std::string fifo = m_folder / "fifo";
    ASSERT_EQ(mkfifo(fifo.c_str(), 0600), 0);
    const std::string huge = m_folder.write("huge", "");
    std::filesystem::resize_file(huge, std::uintmax_t{3} << 30);
    std::vector<std::uint8_t> cut = test::realRom("efi-virtio");
    cut.resize(100'000);

    const std::string none = m_folder / "none";
    expectRefusal(none, "quenxctl: Cannot read " + none + ": No such file or directory.\nCheck the path.\n",
                  4);
    expectRefusal("%n%s\n.rom", "%n%s\\x0a.rom: No such file or directory.", 4);
    expectRefusal(m_folder.path(), "is a directory.\nName a complete firmware image.");
    expectRefusal(fifo, "is not a regular file.");
    expectError("adapters --config " + fifo, 2, "The configuration file " + fifo + " is not a regular file.");
    expectRefusal(huge, "is larger than 2 GiB.");
    expectRefusal(m_folder.write("empty", ""), "is empty.");
    expectRefusal(m_folder.write("cut", cut), "is not a complete firmware image: ");
    expectRefusal("http://host/x.rom", "does not read images over \"http:\".");
    expectRefusal("file:/x", "file:/x is not a valid file URI.\nWrite it as file:///directory/file");
    EXPECT_EQ(firmwareOf("eth0"), "IMG_PXE 1, IMG_UEFI 0");
}

TEST_F(WrongUseTest, RefusesWrongImagesNamingBothSides) {
    const auto made = [&](const std::vector<utils::FirmwareVersionInfo>& components, std::uint16_t vendor,
                          std::uint16_t device) {
        return m_folder.write("made.rom", test::madeRom(components, vendor, device));
    };
    // Of the same versions as what is installed, too.
    expectRefusal(made({{PXE, 1}, {UEFI, 0}}, 0x10ec, 0x8139),
                  "The image is for 10ec:8139, but eth0 is 1af4:1041.\nGet the image made for 1af4:1041.");
    const ma::NewRomImage vga{
        .type = PXE, .vendorId = 0x1af4, .deviceId = 0x1041, .furtherDeviceIds = {}, .classCode = 0x030000};
    expectRefusal(m_folder.write("vga.rom", ma::makeRomImage(vga)),
                  "is for a device that is not a network adapter.");
    // The ids match.
    expectError("install --target eth3 " + made({{PXE, 2}}, 0x1022, 0x2000), 1,
                "quenxctl: The firmware of eth3 cannot be updated.\n");

    const std::string differing = "check --target eth4 " + made({{PXE, 2}}, 0x15ad, 0x07b0);
    const std::string types =
        "The image types differ: the image has IMG_PXE, which eth4 does not: it has IMG_iSCSI 1, IMG_UEFI "
        "0.\n";
    expectError(differing, 1, types + "Use an image with the same types, or --force, which works unless");
    EXPECT_EQ(quenxctl(differing + " --force").status, 0);
    expectError(differing + " --force --config " + m_folder.write("provider.conf", "OEMCustomizeable=5\n"), 1,
                types + "Use an image with the same types: --force does not help");

    ASSERT_EQ(quenxctl("install --target eth0 IMAGE").status, 0);
    const std::string older = test::realRomPath("efi-virtio");
    expectRefusal(older,
                  "quenxctl: IMG_PXE 1 is older than the installed 2, IMG_UEFI 0 than the installed 2.\n"
                  "Use a newer image, or install this one with --force.\n");
    EXPECT_EQ(quenxctl("install --target eth0 --force " + older).status, 0);
    EXPECT_EQ(firmwareOf("eth0"), "IMG_PXE 1, IMG_UEFI 0");

    // A CLP entry comes, and would go, with the image that has it.
    const std::string clp = made({{CLP, 3}}, 0x1af4, 0x1041);
    EXPECT_EQ(quenxctl("install --target eth0 --force --types IMG_CLP " + clp).status, 0);
    EXPECT_EQ(firmwareOf("eth0"), "IMG_CLP 3, IMG_PXE 3, IMG_UEFI 0");
    expectRefusal(made({{PXE, 4}}, 0x1af4, 0x1041),
                  "The image types differ: eth0 has IMG_CLP, but the image does not.\n");
}

TEST_F(WrongUseTest, SaysWhatIsWrongWithACommandLineAndWhatToDo) {
    const std::string none = m_folder / "none";
    const std::tuple<std::string, int, std::string> table[] = {
        {"install --target eth7 IMAGE", 4, "\nThe adapters are eth0, eth1, eth2, eth3, eth4."},
        {"install --target EHT2 IMAGE", 4, "\"EHT2\".\nDid you mean eth2? The adapters are eth0, "},
        {"install --target 0001:03:00.0 IMAGE", 4, "There is no adapter \"0001:03:00.0\"."},
        {"install --target eth0 IMAGE --types IMG_PXE,IMG_FCoE", 1,
         "no IMG_FCoE.\nIt has IMG_PXE, IMG_UEFI.\n"},
        {"install --target eth0 IMAGE --types img_pxe", 2, "Did you mean IMG_PXE? The types are"},
        {"install --target eth0", 2, "Name one image, either as a file or with --identity."},
        {"install IMAGE", 2, "--target is required"},
        {"install IMAGE --target", 2, "--target needs a value.\n\"quenxctl help install\" lists"},
        {"install --target eth0 IMAGE --target eth1", 2, "--target can be given only once."},
        {"install --target eth0 IMAGE other", 2, "Unexpected argument \"other\"."},
        {"install --traget=eth0 IMAGE", 2, "no option \"--traget\".\nDid you mean --target? "},
        {"adapters --target eth0", 2, "\"adapters\" has no option \"--target\"."},
        {"adapters --json=maybe", 2, "--json takes no value."},
        {"--jsno", 2, "There is no option \"--jsno\".\nDid you mean --json? "},
        {"adapters --user a", 2, "--user requires --server"},
        {"adapters --backend simulation", 2, "there is no backend \"simulation\"; it must be "},
        {"adapters --state=", 2, "--state needs a value."},
        {"adapters --server https://host", 2, " cannot be used with "},
        {"isntall --traget eth0", 2, "There is no verb \"isntall\".\nDid you mean install? "},
        {"help jbos", 2, "There is no verb \"jbos\".\nDid you mean jobs? "},
        {"", 2, "No verb was given."},
        {"instances", 2, "CLASS is required."},
        {"instances Quenx_EthernetProt --names", 4, "is served.\nDid you mean Quenx_EthernetPort? "},
        {"jobs", 2, "Jobs are kept by a server, and none was named"},
        {"adapters --server 127.0.0.1:5989", 2, "Write it as https://host:5989."},
        {"adapters --server https://a:b@host", 2, "Name the user with --user"},
        {"adapters --config /", 2, "The configuration file / is a directory.\nName a file."},
        {"associators nonsense", 2, "is not the path of an instance."},
        {"adapters --config " + none, 2, ": No such file or directory.\nCheck the path.\n"},
        {"adapters --providers " + none, 2, "Cannot read the provider directory"},
        {"adapters --providers " + m_folder.path(), 2, "There is no provider library in "},
    };
    for (const auto& [line, status, part] : table)
        expectError(line, status, part);
    // No bad input: the empty name after the plus sign asks for no type at all.
    EXPECT_EQ(quenxctl("install --target eth0 IMAGE --types IMG_PXE+").status, 0);
    EXPECT_EQ(quenxctl("adapters", {"QUENXCTL_USER=a"}).status, 0) << "set for whenever there is a server";

    const ProgramResult named =
        test::run({QUENXCTL, "--config", m_configuration, "adapters"}, {"QUENX_ADAPTERS=" + none});
    EXPECT_EQ(named.error,
              "quenxctl: QUENX_ADAPTERS: there is no adapter description " + none +
                  "; name a readable file.\nCorrect QUENX_ADAPTERS or the file that it names.\n");
    m_folder.write("adapters.toml", "[[adapter]]\nname = \"eth0\"\nspeeed = 1\n");
    expectError("adapters", 2, "adapters.toml, line ");
}

TEST_F(WrongUseTest, WritesOneJsonDocumentForErrorsToo) {
    const std::tuple<std::string, int, const char*, nlohmann::json> table[] = {
        {"adapters", 0, "/adapters/0/name", "eth0"},
        {"instances Quenx_EthernetPort", 0, "/instances/0/class", "Quenx_EthernetPort"},
        {"identities", 0, "/identities/0/installable", false},
        {"instances No_Such", 4, "/exitStatus", 4},
        {"frobnicate", 2, "/error", "There is no verb \"frobnicate\"."},
        {"check --target eth0 none.rom", 4, "/result", "refused"},
        {"check --target eth0 IMAGE", 0, "/result", "installable"},
        {"install --target eth3 IMAGE", 1, "/returnValue", 4097},
        {"install --target eth0 IMAGE", 0, "/job/state", 7},
        {"install --target eth0 IMAGE", 3, "/result", "already current"},
        {"install --target eth0 IMAGE --force", 0, "/after/0/version", 2},
    };
    for (const auto& [line, status, key, value] : table) {
        const ProgramResult result = quenxctl(line + " --json");
        EXPECT_EQ(result.status, status) << result.out << result.error;
        const auto document = nlohmann::json::parse(result.out, nullptr, false);
        EXPECT_EQ(document.value(nlohmann::json::json_pointer(key), nlohmann::json()), value) << result.out;
    }
}

TEST_F(WrongUseTest, HelpsByVerbAndByOption) {
    const std::string help = quenxctl("help").out;
    EXPECT_EQ(help, quenxctl("--help").out);
    for (const char* part : {"install, update", "3  already current", "4  not found"})
        EXPECT_TRUE(test::contains(help, part)) << help;
    EXPECT_EQ(quenxctl("help update").out, quenxctl("install --help").out);
}

}  // namespace
