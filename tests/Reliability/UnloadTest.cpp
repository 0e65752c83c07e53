// SPDX-License-Identifier: Apache-2.0
// The provider's library goes while its jobs are running or finished, and comes back.
#include <gtest/gtest.h>

#include <filesystem>
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

#ifndef __has_feature  // Clang has it
#define __has_feature(feature) false
#endif

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
    /// Unloads while an operation is held, and lets it go only then.
    void unloadWhileHeld() {
        m_backend->waitUntilHeld();
        const std::jthread later([this] {
            utils::Thread::msleep(100);
            m_backend->letGo();
        });
        m_library.reset();
    }
    void expectFlashedAndGone() const {
        EXPECT_EQ(test::componentsOf("eth0"), "IMG_PXE " + std::to_string(m_revision) + ", IMG_UEFI 1");
        if (!ProviderLibrary::isUnloadable()) return;
        EXPECT_FALSE(ProviderLibrary::isMapped(QUENX_UPDATE_LIBRARY));
    }
    test::LogLevelGuard m_level{2};
    test::TempFolder m_folder;
    utils::SMASHv2Config m_config{m_folder / "none.conf"};
    std::optional<os::OSLockerLinux> m_locker{std::in_place};
    test::SimulatedAdapters m_adapters;
    std::shared_ptr<test::HookedBackend> m_backend;
    std::optional<ProviderLibrary> m_inventory{QUENX_INVENTORY_LIBRARY};
    std::optional<ProviderLibrary> m_library;
    uint16_t m_revision = 1;
};

TEST_F(UnloadTest, WaitsForTheFlashAndStartsAnewAtTheNextLoading) {
    // Without unloading there is one load only, whose jobs stay.
    const int rounds = ProviderLibrary::isUnloadable() ? 3 : 1;
    for (int round = 0; round < rounds; ++round) {
        // Loading one provider starts no other.
        EXPECT_THROW(m_requests.enumerateInstances("Quenx_ConcreteJob"), core::CimError);
        m_library.emplace(QUENX_UPDATE_LIBRARY);
        const CallResult finished = installNext();
        ASSERT_TRUE(finished.job) << finished.returnValue << finished.error;
        EXPECT_EQ(finished.job->toString(),
                  "root/cimv2:Quenx_ConcreteJob.InstanceID=\"Quenx:FirmwareUpdate@Job#1\"");
        EXPECT_EQ(state(waitForEnd(*finished.job)), 7U);
        m_backend->hold("writeFlashImage");
        const CallResult running = installNext();
        ASSERT_TRUE(running.job);
        if (round == 1) m_requests.deleteInstance(*running.job);
        unloadWhileHeld();
        if (!ProviderLibrary::isUnloadable()) waitForEnd(*running.job);
        expectFlashedAndGone();
    }
    m_inventory.reset();
    if (!ProviderLibrary::isUnloadable()) return;
    EXPECT_FALSE(ProviderLibrary::isMapped(QUENX_INVENTORY_LIBRARY));
    EXPECT_THROW(m_requests.enumerateInstances("Quenx_EthernetPort"), core::CimError);
}

TEST_F(UnloadTest, WaitsForARequestThatIsCreatingAJob) {
    if (!ProviderLibrary::isUnloadable()) GTEST_SKIP() << "sanitizer builds keep the library";
    m_library.emplace(QUENX_UPDATE_LIBRARY);
    m_backend->hold("prepareFlashImage");
    CallResult result;
    std::thread client([&] { result = installNext(); });
    unloadWhileHeld();
    client.join();
    // The job was made, started and flashed to its end before the library went.
    EXPECT_EQ(result.returnValue, 4096U) << result.error;
    expectFlashedAndGone();
    EXPECT_EQ(m_requests.enumerateInstanceNames("Quenx_EthernetPort").size(), 5U);
}

TEST_F(UnloadTest, TheEndOfTheProcessWaitsForTheFlash) {
    // Neither library is closed: the static objects of all libraries go in the order that the loader chose.
    ::testing::GTEST_FLAG(death_test_style) = "threadsafe";
    EXPECT_EXIT(
        {
            test::SyslogCapture::observe([](const std::string& line) { std::fputs(line.c_str(), stderr); });
            m_library.emplace(QUENX_UPDATE_LIBRARY);
            m_backend->hold("writeFlashImage");
            if (!installNext().job) std::_Exit(3);
            m_backend->waitUntilHeld();
            std::thread([this] {
                utils::Thread::msleep(100);
                m_backend->letGo();
            }).detach();
            std::exit(0);
        },
        ::testing::ExitedWithCode(0), "Updating CapabilityWord");
}

/// What a program prints. The folder of the build may have blanks in its name.
std::string outputOf(const std::vector<std::string>& words) {
    std::string command;
    for (const std::string& word : words)
        command += "'" + word + "' ";
    const std::unique_ptr<std::FILE, int (*)(std::FILE*)> output(popen(command.c_str(), "r"), pclose);
    std::string text;
    for (int c = std::fgetc(output.get()); c != EOF; c = std::fgetc(output.get()))
        text += static_cast<char>(c);
    return text;
}

const std::string kAdapter = R"(
    [[adapter]]
    name = "eth0"
    pci_address = "0000:03:00.0"
    pci_id = "1af4:1041"
    mac = "52:54:00:00:00:10"
    components = [ { type = "IMG_PXE", revision = 1 }, { type = "IMG_UEFI", revision = 0 } ]
    )";

// dlclose holds the loader's lock while it waits for workers and requests. Whatever these do for the first
// time in the process or on their thread must not need that lock: a backtrace, a thread-local variable, an
// exception.
TEST(HostOfCTest, UnloadsEitherProviderFirstWhileFlashesFailAndRequestsAreRefused) {
    if (!ProviderLibrary::isUnloadable()) GTEST_SKIP() << "sanitizer builds keep the library";
    const test::TempFolder folder;
    const auto rom = test::madeRom({{FirmwareType::PXE, 2}, {FirmwareType::UEFI, 1}});
    const std::string uri = "file://" + folder.write("image.rom", std::span(rom));
    for (const auto& [one, other] : {std::pair(QUENX_INVENTORY_LIBRARY, QUENX_UPDATE_LIBRARY),
                                     std::pair(QUENX_UPDATE_LIBRARY, QUENX_INVENTORY_LIBRARY)}) {
        for (const std::string closedFirst : {"0", "1"}) {
            const bool isOne = closedFirst == "0";
            folder.write("adapters.toml", kAdapter + R"(
                [[adapter.fault]]
                at = "write"
                action = "stall"
                milliseconds = 200
                [[adapter.fault]]
                at = "write"
                percent = 50
                text = "the device went away"
                action = ")" + (isOne ? "fail" : "throw") +
                                              "\"\n");
            for (const std::string use : {"flash", "calls"}) {
                EXPECT_EQ(outputOf({"env", "QUENX_ADAPTERS=" + folder / "adapters.toml",
                                    "QUENX_ADAPTER_STATE=" + folder / "state", QUENX_HOST_OF_C, one, other,
                                    QUENX_FLASH_STARTER, closedFirst, use, uri}),
                          "2 agents, mapped: 1 1\n1 agents, mapped: " + std::string(isOne ? "0 1" : "1 0") +
                              "\n0 agents, mapped: 0 0\nany: 0\n")
                    << use << ", closed first: " << (isOne ? one : other);
            }
        }
    }
}

TEST(HostOfCTest, EndsWithItsLastThreadAndLetsAChildUnloadAndEnd) {
    if (__has_feature(thread_sanitizer)) GTEST_SKIP() << "the thread sanitizer has a thread that never ends";
    const test::TempFolder folder;
    folder.write("adapters.toml", kAdapter + R"(
        [[adapter.fault]]
        at = "write"
        action = "stall"
        milliseconds = 300
        )");
    std::uint16_t revision = 1;
    for (const auto& [use, said] : {std::pair("leave", ""), std::pair("fork",
                                                                      "1 agents, mapped: 1 0\n"
                                                                      "2 agents, mapped: 1 1\nchild: 0\n")}) {
        const auto rom = test::madeRom({{FirmwareType::PXE, ++revision}, {FirmwareType::UEFI, 1}});
        EXPECT_EQ(
            outputOf({"env", "QUENX_ADAPTERS=" + folder / "adapters.toml",
                      "QUENX_ADAPTER_STATE=" + folder / "state", "sh", "-c", "\"$@\"; echo $?", "sh",
                      QUENX_HOST_OF_C, QUENX_INVENTORY_LIBRARY, QUENX_UPDATE_LIBRARY, QUENX_FLASH_STARTER,
                      "0", use, "file://" + folder.write("new.rom", std::span(rom))}),
            std::string("2 agents, mapped: 1 1\n") + said + "0\n");
        const ma::Simulator after(folder / "adapters.toml", folder / "state");
        EXPECT_EQ(test::describeRom(after.flashContent("eth0")),
                  "IMG_PXE " + std::to_string(revision) + ", IMG_UEFI 1");
    }
}

/// A worker that binds a symbol late waits for the loader's lock, too.
TEST(LibrariesTest, BindAllSymbolsWhenTheyAreLoaded) {
    for (const char* library : {QUENX_INVENTORY_LIBRARY, QUENX_UPDATE_LIBRARY})
        EXPECT_NE(outputOf({"readelf", "-d", library}).find("BIND_NOW"), std::string::npos) << library;
}

/// A thread in it may be held by a file system for longer than anything else is loaded.
TEST(LibrariesTest, KeepTheReaderOfFilesMapped) {
    const std::string reader =
        std::filesystem::path(QUENX_UPDATE_LIBRARY).replace_filename("libQuenx_FileReader.so");
    EXPECT_NE(outputOf({"readelf", "-d", reader}).find("NODELETE"), std::string::npos);
}

}  // namespace
