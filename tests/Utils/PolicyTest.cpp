// SPDX-License-Identifier: Apache-2.0
#include "Utils/Policy.h"

#include <gtest/gtest.h>

#include "Support/TempFolder.h"

namespace {

using utils::Policy;

Policy parsed(const std::string& text) {
    return utils::parsePolicy(text, "F");
}

TEST(PolicyTest, IsReadWhole) {
    const Policy none = parsed("");
    EXPECT_TRUE(!none.administrators && !none.imageDirectories && !none.releaseClaimAfterCheck);
    EXPECT_EQ(none.history, utils::HistoryRule::Wanted);
    EXPECT_EQ(none.historyRecords, 100'000);
    EXPECT_EQ(none.trust, utils::TrustRule::Off);
    EXPECT_EQ(none.keepImages, "");
    const Policy all = parsed(
        "history = 'required'\nadministrators = ['root', 'al ice']\nhistory_records = 1000\n"
        "history_served = true\nrelease_claim_after_check = false\nkeep_images = '/kept'\n"
        "image_directories = ['/a', '/b']\nlargest_image = 1\ntrust = 'signature'\ntrust_keys = '/keys'\n");
    EXPECT_EQ(all.history, utils::HistoryRule::Required);
    EXPECT_EQ(all.administrators, (std::vector<std::string>{"root", "al ice"}));
    EXPECT_EQ(all.administratorsPlace, "F, line 2");
    EXPECT_EQ(all.historyRecords, 1000);
    EXPECT_TRUE(all.historyServed);
    EXPECT_EQ(all.releaseClaimAfterCheck, false);
    EXPECT_EQ(all.keepImages, "/kept");
    EXPECT_EQ(all.imageDirectories, (std::vector<std::string>{"/a", "/b"}));
    EXPECT_EQ(all.largestImage, 1);
    EXPECT_EQ(all.trust, utils::TrustRule::Signature);
    EXPECT_EQ(all.trustKeys, "/keys");
    EXPECT_EQ(parsed("history = 'off'").history, utils::HistoryRule::Off);
    EXPECT_EQ(parsed("trust = 'off'").trust, utils::TrustRule::Off);
    EXPECT_EQ(parsed("history_records = 10000000").historyRecords, 10'000'000);
    EXPECT_EQ(parsed("largest_image = 2147483647").largestImage, 2'147'483'647);
    EXPECT_EQ(parsed("administrators = ['" + std::string(256, 'a') + "']").administrators->size(), 1U);
}

TEST(PolicyTest, NamesWhatIsWrong) {
    std::string said;
    for (const std::string text : {"histroy = 'off'",
                                   "history = 'on'",
                                   "history_records = 999",
                                   "history_records = 10000001",
                                   "history_served = 1",
                                   "release_claim_after_check = 'no'",
                                   "keep_images = 'kept'",
                                   "keep_images = 1",
                                   "image_directories = ['a']",
                                   "image_directories = '/a'",
                                   "largest_image = 0",
                                   "largest_image = 2147483648",
                                   "trust = 'yes'",
                                   "trust_keys = ''",
                                   "administrators = ['']",
                                   "administrators = ['@wheel']",
                                   "administrators = ['a*']",
                                   "administrators = [' a']",
                                   "administrators = [\"a\\u007F\"]",
                                   "administrators = 'root'",
                                   "administrators = [1]",
                                   "[history]",
                                   "\n\nhistory = 'on'"})
        try {
            parsed(text);
            said += text + ": accepted\n";
        } catch (const utils::PolicyError& error) {
            said += text + ": " + error.what() + "\n";
        }
    EXPECT_THROW(parsed("administrators = ['" + std::string(257, 'a') + "']"), utils::PolicyError);
    const auto expected = test::readTestFile(QUENX_UTILS_SAMPLES "/wrong-policies");
    EXPECT_EQ(said, std::string(expected.begin(), expected.end()));
}

}  // namespace
