// The provider's library goes while its jobs are new, running or finished, and comes back.
#include <gtest/gtest.h>

#include <thread>

#include "Providers/SoftwareUpdate/HookedBackend.h"
#include "Providers/SoftwareUpdate/UpdateClient.h"
#include "Support/ProviderLibrary.h"
#include "Support/SimulatedAdapters.h"
#include "Support/SyslogCapture.h"
#include "Support/TestRoms.h"
#include "Utils/Os/Linux/LinuxOSLocker.h"
#include "Utils/Os/Linux/SMASHv2Config.h"
#include "Utils/Os/Linux/Thread.h"

namespace {

using test::CallResult;
using test::ProviderLibrary;
using utils::FirmwareType;

class UnloadTest : public ::testing::Test, public test::UpdateClient {
  protected:
    UnloadTest() : m_backend(std::make_shared<test::HookedBackend>(ma::setBackend(nullptr))) {
        ma::setBackend(m_backend);
    }

    CallResult installNext() {
        const auto rom = test::madeRom({{FirmwareType::PXE, ++m_revision}, {FirmwareType::UEFI, 1}});
        return install("file://" + m_folder.write("image.rom", std::span(rom)), "eth0");
    }
    /// Holds up every call of an operation, and says when the first one has begun.
    void holdUp(const std::string& operation) {
        m_reached = false;
        m_backend->hook = [this, operation](const std::string& called, const std::string&) {
            if (called != operation) return;
            m_reached = true;
            utils::Thread::msleep(150);
        };
    }
    void waitUntilReached() const {
        while (!m_reached)
            utils::Thread::msleep(1);
    }
    void expectFlashed() const {
        EXPECT_EQ(test::componentsOf("eth0"), "IMG_PXE " + std::to_string(m_revision) + ", IMG_UEFI 1");
    }
    static void expectGone() {
        if (!ProviderLibrary::isUnloadable()) return;
        EXPECT_FALSE(ProviderLibrary::isMapped(QUENX_UPDATE_LIBRARY));
    }
    std::unique_ptr<ProviderLibrary> load() const {
        return std::make_unique<ProviderLibrary>(QUENX_UPDATE_LIBRARY);
    }

    test::LogLevelGuard m_level{2};
    test::TempFolder m_folder;
    utils::SMASHv2Config m_config{m_folder / "none.conf"};
    std::optional<os::OSLockerLinux> m_locker{std::in_place};
    test::SimulatedAdapters m_adapters;
    std::shared_ptr<test::HookedBackend> m_backend;
    ProviderLibrary m_inventory{QUENX_INVENTORY_LIBRARY};
    std::atomic<bool> m_reached{false};
    uint16_t m_revision = 1;
};

TEST_F(UnloadTest, WaitsForTheFlashAndStartsAnewAtTheNextLoading) {
    // Without unloading there is one load only, whose jobs stay.
    const int rounds = ProviderLibrary::isUnloadable() ? 3 : 1;
    for (int round = 0; round < rounds; ++round) {
        auto library = load();
        const CallResult finished = installNext();
        ASSERT_TRUE(finished.job) << finished.returnValue << finished.error;
        EXPECT_EQ(finished.job->toString(),
                  "root/cimv2:Quenx_ConcreteJob.InstanceID=\"Quenx:FirmwareUpdate@Job#1\"");
        EXPECT_EQ(state(waitForEnd(*finished.job)), 7U);
        expectFlashed();
        holdUp("writeFlashImage");
        const CallResult running = installNext();
        ASSERT_TRUE(running.job);
        waitUntilReached();
        if (round == 1) m_requests.deleteInstance(*running.job);
        library.reset();
        if (!ProviderLibrary::isUnloadable()) waitForEnd(*running.job);
        expectFlashed();
        expectGone();
        m_backend->hook = nullptr;
    }
}

TEST_F(UnloadTest, WaitsForARequestThatIsCreatingAJob) {
    if (!ProviderLibrary::isUnloadable()) GTEST_SKIP() << "sanitizer builds keep the library";
    auto library = load();
    const core::CimPath target = port("eth0");
    holdUp("prepareFlashImage");
    CallResult result;
    std::thread client([&] { result = installNext(); });
    waitUntilReached();
    library.reset();
    expectGone();
    client.join();
    // The job was made, started and flashed to its end before the library went.
    EXPECT_EQ(result.returnValue, 4096U) << result.error;
    expectFlashed();
    EXPECT_TRUE(m_requests.enumerateInstanceNames("Quenx_EthernetPort").size() >= 4);
    m_backend->hook = nullptr;
    library = load();
    const CallResult next = installNext();
    ASSERT_TRUE(next.job);
    EXPECT_EQ(state(waitForEnd(*next.job)), 7U);
}

TEST_F(UnloadTest, TheEndOfTheProcessWaitsForTheFlash) {
    // Neither library is closed: the static objects of all libraries go in the order that the loader chose.
    ::testing::GTEST_FLAG(death_test_style) = "threadsafe";
    EXPECT_EXIT(
        {
            [[maybe_unused]] static const auto* const neverClosed = load().release();
            holdUp("writeFlashImage");
            if (!installNext().job) std::_Exit(3);
            waitUntilReached();
            m_backend->hook = [](const std::string& operation, const std::string&) {
                if (operation == "updateCapabilityWord") std::fputs("flashed to its end\n", stderr);
            };
            std::exit(0);
        },
        ::testing::ExitedWithCode(0), "flashed to its end");
}

}  // namespace
