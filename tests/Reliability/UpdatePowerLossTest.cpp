// The power fails at the k-th change that an update makes to the flash, for every k.
#include <span>

#include "Providers/SoftwareUpdate/UpdateTest.h"
#include "Reliability/Effort.h"
#include "Support/PowerCut.h"
#include "Support/TestRoms.h"

namespace {

using test::CallResult;
using utils::FirmwareType;

class UpdatePowerLossTest : public test::UpdateTest {
  protected:
    std::shared_ptr<ma::Simulator> powerOn(const std::string& root, std::shared_ptr<ma::FlashFiles> files) {
        auto simulator = std::make_shared<ma::Simulator>(
            ma::parseAdapterDescriptions(test::TEST_ADAPTERS, ""), root, std::move(files));
        ma::setBackend(simulator);
        return simulator;
    }

    /// Loses the power at the k-th call of an update. False when the update made fewer.
    bool cutAt(int k, const test::Medium& medium);

    const std::string m_image = goodImage();
};

bool UpdatePowerLossTest::cutAt(int k, const test::Medium& medium) {
    const test::TempFolder folder;
    const auto files = std::make_shared<test::CutFiles>(k);
    files->adopt(folder.path());
    const std::string old = test::describeRom(powerOn(folder.path(), files)->flashContent("eth0"));
    const CallResult update = install(m_image, "eth0");
    EXPECT_EQ(update.returnValue, 4096U) << update.error;
    if (!update.job) return false;
    const core::InstanceValue job = waitForEnd(*update.job);
    const bool finished = state(job) == JobStateCompleted;
    EXPECT_EQ(finished, !files->wasCut());
    EXPECT_EQ(number(job, "ErrorCode"), finished ? 0U : 4U);
    EXPECT_EQ(claim(), "");

    files->lose(medium, folder.path());
    const auto after = powerOn(folder.path(), std::make_shared<test::UnsyncedFiles>());
    const std::string found = test::describeRom(after->flashContent("eth0"));
    EXPECT_TRUE(found == "IMG_PXE 2, IMG_UEFI 1" || (!finished && found == old)) << found;
    expectUpdateWorks();
    EXPECT_EQ(test::describeRom(after->flashContent("eth0")), "IMG_PXE 2, IMG_UEFI 1");
    m_requests.deleteInstance(*update.job);
    return files->wasCut();
}

TEST_F(UpdatePowerLossTest, LeavesAWholeImageAndAnAdapterThatCanBeUpdated) {
    const test::LogLevelGuard silent(0);
    // The simulator's own tests have all kinds of medium.
    for (const test::Medium& medium : std::span(test::MEDIA).first(test::effort.everything ? 4 : 2)) {
        int k = 1;
        for (; cutAt(k, medium); ++k)
            ASSERT_FALSE(HasFailure()) << "cut at call " << k;
        EXPECT_GT(k, 15);
        test::count("kill points tried", static_cast<unsigned>(k - 1));
    }
}

}  // namespace
