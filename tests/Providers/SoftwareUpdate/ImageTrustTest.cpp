// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareUpdate/ImageTrust.h"

#include <atomic>
#include <filesystem>
#include <functional>

#include "Framework/Requests/ImageVerifier.h"
#include "Providers/SoftwareUpdate/UpdateTest.h"
#include "Support/TestRoms.h"
#include "Utils/Os/Linux/PolicyFile.h"

namespace {

using core::ReasonId;

/// Says what it is told to say, after it has done what it is told to do.
class Verifier : public core::ImageVerifier {
  public:
    core::TrustVerdict verify(const core::ImageToVerify& image) noexcept override {
        path = image.path;
        act();
        return verdict;
    }

    core::TrustVerdict verdict{.key = "vendor"};
    std::function<void()> act = [] {};
    std::string path;

  private:
    const core::InstalledVerifier m_installed{*this};
};

class ImageTrustTest : public test::UpdateTest {
  protected:
    ImageTrustTest() : m_policy(m_folder.write("policy.toml", "trust = \"signature\"\n")) {}

    void expectRefused(ReasonId reason, const std::string& why) {
        const test::CallResult result = install(m_uri, "eth0");
        EXPECT_EQ(result.returnValue, MethodReturn::UnsupportedTargetType);
        EXPECT_EQ(core::reasonCode(result.reason), core::reasonCode(reason));
        EXPECT_TRUE(m_log.says("Image " + m_uri + " may not be installed: " + why)) << why;
        EXPECT_EQ(claim(), "") << "others may have the adapter";
    }

    const std::string m_uri = goodImage();
    utils::PolicyFile m_policy;
};

TEST_F(ImageTrustTest, WithoutAVerifierNothingIsTrusted) {
    expectRefused(ReasonId::NoVerifier,
                  "the policy asks for a signature, and this program cannot verify any");
    m_folder.write("policy.toml", "trust = \"off\"\n");
    expectUpdateWorks();
}

TEST_F(ImageTrustTest, TheVerdictDecidesBeforeTheAdapterIsAsked) {
    Verifier verifier;
    std::atomic<bool> isAsked = false;  // the worker of a job asks the adapter, too
    m_backend->hook = [&](const std::string& operation) {
        if (operation == "prepareFlashImage") isAsked = true;
    };
    verifier.verdict = {.reason = ReasonId::SignatureWrong, .text = "it was forged"};
    expectRefused(ReasonId::SignatureWrong, "it was forged");
    EXPECT_FALSE(isAsked);
    verifier.verdict = {.key = "vendor"};
    expectUpdateWorks();
    EXPECT_TRUE(isAsked);
    m_backend->hook = nullptr;
}

// Whoever may write to the folder exchanges the file as soon as it was found good.
TEST_F(ImageTrustTest, WritesTheBytesThatWereVerified) {
    Verifier verifier;
    const auto good = test::madeRom({{utils::FirmwareType::PXE, 7}, {utils::FirmwareType::UEFI, 7}});
    const auto evil = test::madeRom({{utils::FirmwareType::PXE, 66}, {utils::FirmwareType::UEFI, 66}});
    const std::string uri = file("image.rom", good);
    verifier.act = [&] { file("image.rom", evil); };
    const test::CallResult result = install(uri, "eth0");
    ASSERT_TRUE(result.job.has_value());
    EXPECT_EQ(state(waitForEnd(*result.job)), 7U);
    EXPECT_EQ(test::componentsOf("eth0"), "IMG_PXE 7, IMG_UEFI 7");
    EXPECT_EQ(verifier.path, std::filesystem::canonical(m_folder / "image.rom"));
}

TEST_F(ImageTrustTest, ImagesLieWhereThePolicyHasThemLie) {
    const std::string allowed = m_folder / "allowed";
    std::filesystem::create_directories(allowed);
    m_folder.write("policy.toml", "image_directories = [\"" + allowed + "\"]\n");
    const std::string outside = std::filesystem::canonical(m_folder / "good.rom").string();
    const std::string where =
        "it is " + outside + ", and the policy allows images below " + allowed + " only";
    expectRefused(ReasonId::OutsideImageDirectories, where);
    // What lies beside a folder whose name begins like that of the allowed one, is not in it.
    std::filesystem::create_directories(allowed + "2");
    m_folder.write("policy.toml", "keep_images = \"" + std::filesystem::path(outside).parent_path().string() +
                                      "\"\nimage_directories = []\n");
    expectUpdateWorks();
    m_folder.write("policy.toml", "largest_image = 100\n");
    expectRefused(ReasonId::LargerThanPolicy, "it has " +
                                                  std::to_string(std::filesystem::file_size(outside)) +
                                                  " bytes, and the policy allows 100");
}

}  // namespace
