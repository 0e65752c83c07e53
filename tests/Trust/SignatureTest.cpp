// SPDX-License-Identifier: Apache-2.0
#include <dlfcn.h>
#include <gmock/gmock.h>
#include <sys/stat.h>

#include "Support/Program.h"
#include "Trust/Workshop.h"

namespace {

using core::ReasonId;
using core::TrustVerdict;

/// By a text that ends so: before it stands the folder, or what is another one each time.
void expectRefused(const TrustVerdict& verdict, ReasonId reason, const std::string& text) {
    EXPECT_EQ(verdict.reason, reason) << verdict.text;
    EXPECT_TRUE(verdict.text.ends_with(text)) << verdict.text;
    EXPECT_EQ(verdict.key, "");
}

std::time_t nextYear() {
    return std::time(nullptr) + std::time_t{365} * 24 * 60 * 60;
}

/// One with two keys, of which "acme" is trusted.
class SignatureTest : public testing::Test {
  protected:
    SignatureTest() {
        workshop.makeKey("acme");
        workshop.makeKey("other");
        workshop.pin("acme");
    }

    test::Workshop workshop;
};

TEST_F(SignatureTest, TrustsWhatPinnedKeysHaveSigned) {
    workshop.makeKey("rsa-acme", "rsa");
    workshop.pin("rsa-acme");
    const std::string other = workshop / "other";
    struct Case {
        const char* key;
        test::Workshop::Options options;
    };
    const Case cases[] = {{"acme", {}},
                          {"rsa-acme", {}},
                          {"rsa-acme", {"-md", "sha512"}},
                          {"acme", {"-md", "sha384", "-keyid"}},
                          {"acme", {"-noattr", "-nocerts"}},
                          {"acme", {"-signer", other + ".pem", "-inkey", other + ".key"}}};
    for (const Case& one : cases) {
        workshop.sign(workshop.image, one.key, one.options);
        const TrustVerdict verdict = workshop.judge();
        EXPECT_TRUE(verdict.isTrusted()) << testing::PrintToString(one.options) << verdict.text;
        EXPECT_EQ(verdict.key, one.key);
    }
}

TEST_F(SignatureTest, RefusesOtherBytesAndOtherKeys) {
    expectRefused(workshop.judge(), ReasonId::NotSigned,
                  workshop.image + " has no signature; put it into " + workshop.image +
                      ".p7s, or put a signed manifest beside the image");
    workshop.sign(workshop.image, "other");
    expectRefused(workshop.judge(), ReasonId::KeyUnknown,
                  " of CN=other, which is not among the trusted keys");
    workshop.sign(workshop.image, "acme", {"-md", "sha1"});
    expectRefused(workshop.judge(), ReasonId::SignatureWrong,
                  "/port.rom.p7s, signed with the key \"acme\": ECDSA-SHA1 is too weak; sign with SHA-256 or "
                  "a stronger digest");
    workshop.sign(workshop.image, "acme");
    workshop.bytes.back() ^= 1;
    expectRefused(
        workshop.judge(), ReasonId::SignatureWrong,
        "/port.rom.p7s, signed with the key \"acme\": it is not the signature of this content (Public key "
        "signature verification has failed.); get image and signature anew from their source");
    workshop.bytes.clear();
    expectRefused(workshop.judge(), ReasonId::SignatureWrong,
                  "/port.rom.p7s: there is nothing that it could be the signature of");
}

TEST_F(SignatureTest, TakesNoContentThatTheSignatureBringsAlong) {
    workshop.sign(workshop.image, "acme", {"-nodetach"});
    workshop.bytes.push_back(0);
    expectRefused(
        workshop.judge(), ReasonId::SignatureWrong,
        "/port.rom.p7s, signed with the key \"acme\": it is not the signature of this content (Public key "
        "signature verification has failed.); get image and signature anew from their source");
}

TEST_F(SignatureTest, RefusesFilesThatAreNoSignatures) {
    const std::string noSignature =
        "/port.rom.p7s is no signature: it has to be CMS in DER, such as \"openssl cms -sign -binary "
        "-outform DER\" makes";
    const std::vector<std::uint8_t> whole = test::readTestFile(workshop.sign(workshop.image, "acme"));
    for (std::size_t size = 0; size < whole.size(); size += 13) {
        workshop.folder.write("port.rom.p7s", std::span(whole).first(size));
        expectRefused(workshop.judge(), ReasonId::SignatureWrong, noSignature);
    }
    workshop.sign(workshop.image, "acme", {"-outform", "PEM"});
    expectRefused(workshop.judge(), ReasonId::SignatureWrong, noSignature);
    workshop.folder.write("port.rom.p7s", std::string((64 << 10) + 1, '0'));
    expectRefused(workshop.judge(), ReasonId::SignatureWrong,
                  "/port.rom.p7s: it is larger than 64 KiB; put a detached signature there");
    std::filesystem::remove(workshop / "port.rom.p7s");
    std::filesystem::create_directory(workshop / "port.rom.p7s");
    expectRefused(workshop.judge(), ReasonId::NotSigned, "/port.rom.p7s: it is not a file");
    std::filesystem::remove(workshop / "port.rom.p7s");
    // Nobody writes into it: opening it would never end.
    ASSERT_EQ(mkfifo((workshop / "fifo").c_str(), 0600), 0);
    std::filesystem::create_symlink("fifo", workshop / "port.rom.p7s");
    expectRefused(workshop.judge(), ReasonId::NotSigned, "/port.rom.p7s: it is not a file");
}

TEST_F(SignatureTest, NoByteOfASignatureMayChange) {
    const std::vector<std::uint8_t> whole =
        test::readTestFile(workshop.sign(workshop.image, "acme", {"-nocerts"}));
    ASSERT_TRUE(workshop.judge().isTrusted());
    // At the end are the two numbers that the key has made. Before them is also what nobody relies on.
    constexpr std::size_t kNumbers = 60;
    for (std::size_t place = 0; place < whole.size(); place += 5) {
        std::vector<std::uint8_t> changed = whole;
        changed[place] ^= 0x5A;
        workshop.folder.write("port.rom.p7s", changed);
        const TrustVerdict verdict = workshop.judge();
        EXPECT_EQ(verdict.isTrusted(), verdict.text.empty()) << place;
        EXPECT_FALSE(verdict.isTrusted() && place >= whole.size() - kNumbers) << place;
    }
}

TEST_F(SignatureTest, CertificatesHaveToBeValidWhenTheyWereUsed) {
    workshop.sign(workshop.image, "acme");
    EXPECT_TRUE(workshop.judge(nextYear).isTrusted()) << "the certificate is valid for 30 days";
    workshop.sign(workshop.image, "acme", {"-noattr"});
    EXPECT_EQ(workshop.judge(nextYear).reason, ReasonId::CertificateNotValid);
    workshop.makeOldKey("old");
    workshop.pin("old");
    workshop.sign(workshop.image, "old");
    const TrustVerdict verdict = workshop.judge();
    EXPECT_EQ(verdict.reason, ReasonId::CertificateNotValid);
    EXPECT_THAT(
        verdict.text,
        testing::MatchesRegex(".*/port.rom.p7s, signed with the key \"old\": its certificate is valid from "
                              "2020-01-01 00:00 UTC to 2021-01-01 00:00 UTC, and the signature is of "
                              "20..-..-.. ..:.. UTC"));
}

TEST_F(SignatureTest, TakingTheKeyOutRevokesIt) {
    workshop.makeKey("second");
    workshop.pin("second");
    workshop.sign(workshop.image, "acme");
    EXPECT_TRUE(workshop.judge().isTrusted());
    std::filesystem::remove(workshop.keys + "/acme.pem");
    expectRefused(workshop.judge(), ReasonId::KeyUnknown, " of CN=acme, which is not among the trusted keys");
    std::filesystem::remove(workshop.keys + "/second.pem");
    expectRefused(workshop.judge(), ReasonId::KeyUnknown,
                  "no key is trusted: put the signer's certificate into " + workshop.keys +
                      ", with a name that ends in .pem, .crt or .der");
}

TEST_F(SignatureTest, IsVerifiedByTheLibraryThatFrontsLoad) {
    workshop.sign(workshop.image, "acme");
    void* const library = dlopen(QUENX_TRUST_LIBRARY, RTLD_NOW | RTLD_LOCAL | RTLD_NODELETE);
    ASSERT_NE(library, nullptr) << dlerror();
    using Entry = core::ImageVerifier* (*)();
    const auto entry = reinterpret_cast<Entry>(dlsym(library, "quenx_imageVerifier"));
    ASSERT_NE(entry, nullptr) << dlerror();
    const TrustVerdict verdict = entry()->verify({workshop.image, workshop.bytes, workshop.keys, {}});
    EXPECT_EQ(verdict.key, "acme") << verdict.text;
}

}  // namespace
