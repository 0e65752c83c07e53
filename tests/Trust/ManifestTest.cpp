// SPDX-License-Identifier: Apache-2.0
#include "Trust/Manifest.h"

#include <gtest/gtest.h>

#include "Control/Sha256.h"
#include "Support/Program.h"
#include "Trust/Workshop.h"

namespace {

using core::ReasonId;
using core::TrustVerdict;

class ManifestTest : public testing::Test {
  protected:
    ManifestTest() {
        workshop.makeKey("acme");
        workshop.pin("acme");
    }

    /// A right one, in which a part is replaced.
    std::string text(const std::string& part = "", const std::string& by = "") const {
        control::Sha256 sum;
        sum.add(workshop.bytes.data(), workshop.bytes.size());
        std::string all = "name = \"port.rom\"\nsize = " + std::to_string(workshop.bytes.size()) +
                          "\nsha256 = \"" + sum.take() +
                          "\"\npci_ids = [\"8086:10fb\", \"1AF4:1041:1af4:1100\"]\n"
                          "versions = { IMG_PXE = \"2.1\" }\nlowest_versions = { IMG_PXE = \"2.0\" }\n";
        const std::size_t place = all.find(part);
        EXPECT_NE(place, std::string::npos) << part;
        return all.replace(place, part.size(), by);
    }

    TrustVerdict verdictOn(const std::string& manifest) const {
        workshop.writeManifest(manifest, "acme");
        return workshop.judge();
    }

    test::Workshop workshop;
};

TEST_F(ManifestTest, IsTrustedForItsImageAndItsDevices) {
    TrustVerdict verdict = verdictOn(text());
    EXPECT_TRUE(verdict.isTrusted()) << verdict.text;
    EXPECT_EQ(verdict.key, "acme");
    workshop.ids = {{0x8086, 0x10fb, 1, 2}};
    EXPECT_TRUE(workshop.judge().isTrusted());
    workshop.ids = {{0x1af4, 0x1041, 0x1af4, 0x1101}};
    EXPECT_EQ(workshop.judge().reason, ReasonId::ManifestForOtherDevice);
    workshop.ids = std::nullopt;
    EXPECT_EQ(workshop.judge().reason, ReasonId::ManifestForOtherDevice);
}

TEST_F(ManifestTest, ServesNoOtherImageAndHasNoOtherKeys) {
    const struct {
        const char* part;
        const char* by;
        ReasonId reason;
        const char* said;
    } cases[] = {
        {"port.rom", "card.rom", ReasonId::ManifestForOtherImage,
         "/port.rom.manifest.toml is for \"card.rom\", not for \"port.rom\""},
        {"size = ", "size = 1", ReasonId::ManifestDiffers,
         "/port.rom.manifest.toml names 128 bytes, and the image has 28"},
        {"sha256 = \"", "sha256 = \"0", ReasonId::ManifestBad,
         "...\", it must be 64 hexadecimal digits in lower case"},
        {"pci_ids", "pci_id", ReasonId::ManifestBad,
         "/port.rom.manifest.toml, line 4: the manifest: unknown key \"pci_id\"; the keys are name, size, "
         "sha256, pci_ids, versions or lowest_versions"},
        {"\"8086:10fb\", ", "\"8086\", ", ReasonId::ManifestBad,
         "/port.rom.manifest.toml, line 4: the manifest: \"pci_ids\" must be a list of PCI ids, such as "
         "[\"1af4:1041\", \"1af4:1041:1af4:1100\"], not \"8086\""},
        {"\"8086:10fb\", \"1AF4:1041:1af4:1100\"", "", ReasonId::ManifestBad,
         "/port.rom.manifest.toml, line 4: the manifest: \"pci_ids\" must be a list of PCI ids, such as "
         "[\"1af4:1041\", \"1af4:1041:1af4:1100\"]"},
        {"\"2.0\"", "2.0", ReasonId::ManifestBad,
         "/port.rom.manifest.toml, line 6: lowest_versions: \"IMG_PXE\" must be a text in quotes"},
        {"{ IMG_PXE = \"2.1\" }", "\"2.1\"", ReasonId::ManifestBad,
         "/port.rom.manifest.toml, line 5: the manifest: \"versions\" must be a table, such as { IMG_PXE = "
         "\"2.1\" }"},
        {"name = \"port.rom\"\n", "", ReasonId::ManifestBad,
         "/port.rom.manifest.toml, line 1: the manifest: \"name\" is missing; write for example name = "
         "\"port.rom\""},
        {"size = ", "size = -", ReasonId::ManifestBad,
         "/port.rom.manifest.toml, line 2: the manifest: \"size\" must be a whole number from 0 to "
         "9223372036854775807"},
        {"size", "# size", ReasonId::ManifestBad,
         "/port.rom.manifest.toml, line 1: the manifest: \"size\" is missing; write the bytes of the image"},
    };
    for (const auto& one : cases) {
        const TrustVerdict verdict = verdictOn(text(one.part, one.by));
        EXPECT_EQ(verdict.reason, one.reason) << one.by << verdict.text;
        EXPECT_TRUE(verdict.text.ends_with(one.said)) << verdict.text;
    }
    EXPECT_EQ(verdictOn(text("name", "[[[")).reason, ReasonId::ManifestBad);
}

TEST_F(ManifestTest, RulesOutOlderImagesOfTheDevice) {
    workshop.makeKey("stranger");
    const std::string next = text("{ IMG_PXE = \"2.0\" }", "{ IMG_PXE = \"2.2\" }");
    EXPECT_TRUE(verdictOn(text()).isTrusted());
    workshop.writeManifest(next, "stranger", "next.rom");
    EXPECT_TRUE(workshop.judge().isTrusted()) << "who is not trusted rules out nothing";
    workshop.writeManifest(next, "acme", "next.rom");
    TrustVerdict verdict = workshop.judge();
    EXPECT_EQ(verdict.reason, ReasonId::BelowLowestVersion);
    EXPECT_EQ(verdict.text, "the image has IMG_PXE 2.1, and " + workshop / "next.rom.manifest.toml" +
                                " allows IMG_PXE 2.2 or newer");
    // Of other types there may be any, and what runs on other devices does not matter.
    EXPECT_TRUE(verdictOn(text("versions = { IMG_PXE", "versions = { IMG_UEFI")).isTrusted());
    EXPECT_EQ(verdictOn(text("versions = { IMG_PXE = \"2.1\" }\n")).reason, ReasonId::BelowLowestVersion);
    EXPECT_TRUE(verdictOn(text("\"2.1\"", "\"2.10\"")).isTrusted());
    workshop.writeManifest(text("\"8086:10fb\", \"1AF4:1041:1af4:1100\"", "\"8086:10fb\""), "acme",
                           "next.rom");
    EXPECT_TRUE(verdictOn(text()).isTrusted());
}

TEST_F(ManifestTest, NamesTheImageByItsSum) {
    workshop.writeManifest(text(), "acme");
    workshop.bytes.back() ^= 1;
    const TrustVerdict verdict = workshop.judge();
    EXPECT_EQ(verdict.reason, ReasonId::ManifestDiffers);
    EXPECT_TRUE(test::contains(verdict.text, "names the SHA-256 ")) << verdict.text;
}

TEST_F(ManifestTest, AloneCountsWhereItIs) {
    workshop.sign(workshop.image, "acme");
    ASSERT_TRUE(workshop.judge().isTrusted());
    const std::string manifest = workshop.folder.write("port.rom.manifest.toml", text());
    EXPECT_EQ(workshop.judge().reason, ReasonId::NotSigned);
    workshop.writeManifest(text(), "acme");
    ASSERT_TRUE(workshop.judge().isTrusted());
    // One that was changed after it had been signed.
    workshop.folder.write("port.rom.manifest.toml", text("2.0", "1.0"));
    EXPECT_EQ(workshop.judge().reason, ReasonId::SignatureWrong);
    std::filesystem::remove(manifest);
    const TrustVerdict verdict = workshop.judge();
    EXPECT_EQ(verdict.reason, ReasonId::NotSigned);
    EXPECT_TRUE(test::contains(verdict.text, "port.rom.manifest.toml is not there")) << verdict.text;
}

}  // namespace
