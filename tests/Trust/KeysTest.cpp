// SPDX-License-Identifier: Apache-2.0
#include "Trust/Keys.h"

#include <gtest/gtest.h>
#include <unistd.h>

#include "Support/Program.h"
#include "Trust/Refusal.h"
#include "Trust/Workshop.h"

namespace {

namespace fs = std::filesystem;

class KeysTest : public testing::Test {
  protected:
    KeysTest() {
        workshop.makeKey("acme");
        workshop.pin("acme");
    }

    /// What is said of the folder as it is now; empty where it can be used.
    std::string problem() const try {
        trust::readKeys(workshop.keys);
        return "";
    } catch (const trust::Refusal& refusal) {
        EXPECT_EQ(refusal.reason(), core::ReasonId::KeysFolderBad);
        return refusal.what();
    }

    test::Workshop workshop;
    const std::string file = workshop.keys + "/acme.pem";
};

TEST_F(KeysTest, AreAllCertificatesOfTheFolder) {
    workshop.makeKey("second");
    ASSERT_EQ(test::run({"/usr/bin/openssl", "x509", "-in", workshop / "second.pem", "-outform", "DER",
                         "-out", workshop.keys + "/second.der"})
                  .status,
              0);
    workshop.folder.write("keys/README", "no certificate");
    const auto keys = trust::readKeys(workshop.keys);
    ASSERT_EQ(keys.size(), 2U);
    EXPECT_EQ(keys[0].name, "acme");
    EXPECT_EQ(keys[1].name, "second");
}

TEST_F(KeysTest, AreRefusedWhereOthersCouldChangeThem) {
    fs::permissions(workshop.keys, fs::perms::group_write, fs::perm_options::add);
    EXPECT_EQ(problem(), workshop.keys +
                             ": the folder of trusted keys can be changed by others than its "
                             "owner; run: chmod go-w " +
                             workshop.keys);
    fs::permissions(workshop.keys, fs::perms::group_write, fs::perm_options::remove);
    fs::permissions(file, fs::perms::others_write, fs::perm_options::add);
    EXPECT_TRUE(test::contains(problem(), "run: chmod go-w " + file)) << problem();
    fs::permissions(file, fs::perms::others_write, fs::perm_options::remove);
    EXPECT_EQ(problem(), "");
    if (geteuid() != 0) return;  // only root can give files away
    constexpr uid_t kNobody = 65534;
    ASSERT_EQ(chown(file.c_str(), kNobody, kNobody), 0);
    EXPECT_TRUE(
        test::contains(problem(), "belongs to user 65534, who could change it; run: chown root " + file))
        << problem();
}

TEST_F(KeysTest, AreRefusedWhereTheyAreSomethingElse) {
    const auto expect = [this](const std::string& text) {
        EXPECT_TRUE(problem().ends_with(text)) << problem();
    };
    fs::rename(file, workshop / "moved.pem");
    fs::create_symlink(workshop / "moved.pem", file);
    expect("/acme.pem: it is a symbolic link, which others may turn; put the certificate itself there");
    fs::remove(file);
    fs::create_directory(file);
    expect("/acme.pem: it is not a regular file; put a certificate there, or remove it");
    fs::remove(file);
    workshop.folder.write("keys/acme.pem", "-----BEGIN CERTIFICATE-----\nMIIB\n-----END CERTIFICATE-----\n");
    expect(
        "/acme.pem: it is no certificate (ASN1 parser: Error in DER parsing.); put one there in PEM or DER, "
        "or remove it");
    workshop.folder.write("keys/acme.pem", std::string((64 << 10) + 1, ' '));
    expect("/acme.pem: it is larger than 64 KiB; put one certificate there");
    fs::remove_all(workshop.keys);
    expect("/keys: there is no such folder; make it, and put the certificates there that are trusted");
}

TEST_F(KeysTest, AreNotMoreThanCanBeTried) {
    for (int i = 0; i < 256; ++i)
        workshop.folder.write("keys/" + std::to_string(i) + ".crt", "");
    EXPECT_TRUE(test::contains(problem(), "more than 256 certificates")) << problem();
}

}  // namespace
