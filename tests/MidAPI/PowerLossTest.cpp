#include <gtest/gtest.h>

#include <memory>

#include "MidAPI/Simulator/FlashState.h"
#include "MidAPI/Simulator/Simulator.h"
#include "Support/PowerCut.h"
#include "Support/SimulatedAdapters.h"
#include "Support/TempFolder.h"
#include "Support/TestRoms.h"

namespace {

using test::Medium;
using utils::FirmwareType;
using Rom = std::vector<uint8_t>;

/// Of a length that takes three chunks.
Rom bigRom(uint16_t revision) {
    return ma::makeRomImage({.type = FirmwareType::PXE,
                             .vendorId = 0x1af4,
                             .deviceId = 0x1041,
                             .furtherDeviceIds = {},
                             .codeRevision = revision,
                             .length = 10'240});
}

ma::Simulator powerOn(const std::string& root, std::shared_ptr<ma::FlashFiles> files) {
    return {ma::parseAdapterDescriptions(test::TEST_ADAPTERS, ""), root, std::move(files)};
}

bool install(ma::Simulator& simulator, const Rom& image) {
    uint32_t code = 0;
    std::string text;
    const bool done =
        simulator.writeFlashImage("eth0", image.data(), static_cast<uint32_t>(image.size()), code, text);
    EXPECT_TRUE(done) << text;
    return done && simulator.updateCapabilityWord("eth0", {FirmwareType::PXE}, code, text) &&
           simulator.setBootType("eth0", ma::BootType::PXE);
}

/// Switches on, updates to revision 3 and loses power at the k-th call; for every k there is. Returns how
/// many that were.
int cutEverywhere(bool updatedBefore, const Medium& medium) {
    for (int cutAt = 1;; ++cutAt) {
        SCOPED_TRACE("cut at call " + std::to_string(cutAt));
        const test::TempFolder folder;
        const std::string root = folder.path();
        ma::Simulator before = powerOn(root, std::make_shared<test::UnsyncedFiles>());
        if (updatedBefore) install(before, bigRom(2));
        const Rom old = before.flashContent("eth0");

        const auto files = std::make_shared<test::CutFiles>(cutAt);
        files->adopt(root);
        bool finished = false;
        try {
            ma::Simulator simulator = powerOn(root, files);
            finished = install(simulator, bigRom(3));
        } catch (const test::Cut&) {
        }
        files->lose(medium, root);

        ma::Simulator after = powerOn(root, std::make_shared<test::UnsyncedFiles>());
        const Rom found = after.flashContent("eth0");
        const Rom updated = ma::mergeOptionRoms(old, bigRom(3));
        EXPECT_TRUE(found == updated || (!finished && found == old)) << test::describeRom(found);
        EXPECT_TRUE(install(after, bigRom(4)));
        EXPECT_EQ("IMG_PXE 4, IMG_UEFI 0", test::describeRom(after.flashContent("eth0")));
        if (!files->wasCut()) return cutAt - 1;
    }
}

TEST(PowerLoss, atEveryCallLeavesABootableBank) {
    for (const bool updatedBefore : {false, true}) {
        for (const Medium& medium : test::MEDIA) {
            SCOPED_TRACE(std::string(updatedBefore ? "second" : "first") + " update, entries " +
                         (medium.keepsEntries ? "kept" : "lost") + ", contents " +
                         (medium.keepsContents ? "kept" : "lost"));
            EXPECT_LT(15, cutEverywhere(updatedBefore, medium));
        }
    }
}

}  // namespace
