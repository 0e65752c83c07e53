// SPDX-License-Identifier: Apache-2.0
// From the loading of the front to its end, as object managers decide them.
#include <gtest/gtest.h>
#include <unistd.h>

#include <atomic>
#include <csignal>
#include <fstream>
#include <future>
#include <iterator>
#include <thread>

#include "Cmpi/Listener.h"
#include "Support/ProviderLibrary.h"
#include "Support/SimulatedAdapters.h"
#include "Support/TestRoms.h"
#include "Utils/Build.h"
#include "Utils/Os/Linux/SMASHv2Config.h"

#ifndef __has_feature  // Clang has it
#define __has_feature(feature) false
#endif

/// Asked by the leak sanitizer. A forked child cannot end the history's thread, which is its parent's, so it
/// leaves alone what belongs to that.
extern "C" __attribute__((visibility("default"))) const char* __lsan_default_suppressions();
const char* __lsan_default_suppressions() {
    return "leak:history::History::process\n";
}

namespace {

using core::CimPath;
using core::CimType;
using core::CimValue;
using test::LoadedFront;
using test::Request;

/// One adapter, which takes half a second to write to.
const std::string kSlowAdapters = [] {
    std::string text = test::kTestAdapters;
    return text.insert(text.find(" },\n{ name = \"eth1\""),
                       R"(, fault = [ { at = "write", action = "stall", milliseconds = 500 } ])");
}();

void pause(int milliseconds) {
    std::this_thread::sleep_for(std::chrono::milliseconds(milliseconds));
}

int isMapped(const char* library) {
    void* const handle = dlopen(library, RTLD_NOW | RTLD_NOLOAD);
    return handle == nullptr ? 0 : (dlclose(handle), 1);
}

class CmpiLifeTest : public ::testing::TestWithParam<test::Dialect> {
  protected:
    /// What a manager with a client writes down. The first adapter gets a real image, of a revision of its
    /// own.
    std::string run(const std::string& scenario) {
        const auto image = test::withRevision(test::realRom("efi-virtio"), ++m_revision);
        const std::string uri = "file://" + m_adapters.folder().write("image.rom", std::span(image));
        const std::string file = m_adapters.folder() / "transcript";
        const int status = test::asChild([&] {
            m_out.open(file);
            // Descriptors and signals as the daemon has them.
            ::close(STDIN_FILENO);
            ::close(STDERR_FILENO);
            for (const int ignored : {SIGTERM, SIGHUP, SIGUSR2, SIGPIPE})
                std::signal(ignored, SIG_IGN);
            LoadedFront front(QUENX_CMPI_LIBRARY, GetParam());
            serve(front, scenario, uri);
        });
        EXPECT_EQ(status, 0);
        m_adapters.restart();
        EXPECT_EQ(test::componentsOf("eth0"), test::describeRom(image));
        std::ifstream transcript(file);
        return {std::istreambuf_iterator<char>(transcript), {}};
    }

    void serve(LoadedFront& front, const std::string& scenario, const std::string& uri) {
        if (scenario == "fork") {
            front.create();
            m_out << "first " << front.first("Quenx_EthernetPort").getClassName() << std::endl;
            std::_Exit(test::asChild([&] { serve(front, "follow", uri); }) == 0 ? 0 : 1);
        }
        if (scenario == "listen" || scenario == "gone" || scenario == "hang")
            serveListener(front, scenario, uri);
        const CimPath job = install(front, uri);
        if (scenario == "exit" || scenario == "unload") {
            m_out << "shutdown:" << front.cleanup(true) << std::endl;
            if (scenario == "exit") std::exit(0);  // with all that is loaded
        } else {
            follow(front, job, scenario == "delete");
        }
        front.unload();
        m_out << "mapped: " << isMapped(QUENX_CMPI_LIBRARY) << isMapped("libQuenx_SoftwareUpdate.so")
              << std::endl;
    }

    CimPath install(const LoadedFront& front, const std::string& uri) {
        const core::MethodResult result = front.install(uri, front.first("Quenx_EthernetPort"));
        m_out << "returned " << result.returnValue << std::endl;
        return *result.outputs.at(0).value.get<CimPath>();
    }

    /// With a subscription; the manager ends in the middle of the update.
    void serveListener(LoadedFront& front, const std::string& scenario, const std::string& uri) {
        test::Listener listener(front);
        std::promise<void> isIn;
        front.broker.deliveries.whileDelivering = [&]() -> cmpi::ReturnCode {
            if (scenario == "hang") isIn.set_value();
            while (scenario == "hang")
                pause(1000);
            return cmpi::ReturnCode::Ok;
        };
        listener.begin();
        install(front, uri);
        if (scenario == "hang") isIn.get_future().wait();
        if (scenario == "listen") m_out << "asked:" << listener.cleanup() << std::endl;
        if (scenario != "gone") m_out << "shutdown:" << listener.cleanup(true) << std::endl;
        if (scenario == "listen") m_out << "contexts: " << front.broker.deliveries.contexts() << std::endl;
        if (scenario == "hang") front.unload();
        std::exit(0);
    }

    /// While the manager asks every 100 ms whether it may unload.
    void follow(const LoadedFront& front, const CimPath& job, bool isDeleted) {
        std::atomic<int> refusals{0};
        std::thread idleCheck([&] {
            for (; front.cleanup() == " 50 50 50"; pause(100))
                ++refusals;
        });
        const auto state = [&] { return front.ask({"get", job}).instances.at(0).number("JobState"); };
        // The adapter of a deleted job is claimed, and written to, until the flash has ended.
        if (isDeleted) front.ask({"delete", job});
        while (!isDeleted && state() < 7)
            pause(20);
        for (const int enough = refusals + 3; refusals < enough;)
            pause(10);
        if (!isDeleted) {
            m_out << "ended with " << state() << std::endl;
            front.ask({"delete", job});
        }
        idleCheck.join();
        m_out << "then:" << front.cleanup() << std::endl;
    }

    test::SimulatedAdapters m_adapters{kSlowAdapters};
    std::uint16_t m_revision = 1;
    std::ofstream m_out;
    // The front, and a provider.
    const std::string m_gone =
        std::string("then: 0 0 0\nmapped: 0") + (test::ProviderLibrary::isUnloadable() ? "0\n" : "1\n");
};

TEST_P(CmpiLifeTest, StaysUntilTheClientHasReadTheEndAndDeletedTheJob) {
    EXPECT_EQ(run("follow"), "returned 4096\nended with 7\n" + m_gone);
    EXPECT_EQ(run("delete"), "returned 4096\n" + m_gone);
}

TEST_P(CmpiLifeTest, EndsAShutdownOnlyWithTheFlashAndServesAForkedChild) {
    if (__has_feature(thread_sanitizer)) GTEST_SKIP() << "the thread sanitizer has a thread that never ends";
    EXPECT_EQ(run("exit"), "returned 4096\nshutdown: 50 50 50\n");
    EXPECT_EQ(run("unload"), "returned 4096\nshutdown: 50 50 50\nmapped: 11\n");
    EXPECT_EQ(run("fork"), "first Quenx_EthernetPort\nreturned 4096\nended with 7\n" + m_gone);
}

TEST_P(CmpiLifeTest, EndsItsOwnThreadWithTheManagerWhateverThatDoes) {
    if (__has_feature(thread_sanitizer)) GTEST_SKIP() << "the thread sanitizer has a thread that never ends";
    EXPECT_EQ(run("listen"), "returned 4096\nasked: 50 50 50 50\nshutdown: 50 50 50 50\ncontexts: 0\n");
    EXPECT_EQ(run("gone"), "returned 4096\n") << "without a word";
    EXPECT_EQ(run("hang"), "returned 4096\nshutdown: 50 50 50 50\n");
}

INSTANTIATE_TEST_SUITE_P(Manager, CmpiLifeTest, ::testing::ValuesIn(test::kDialects));

TEST(CmpiFrontTest, DecidesAboutCleanupOnceUntilThereIsAnotherRequest) {
    const test::SimulatedAdapters adapters;
    const test::TempFolder folder;
    const utils::SMASHv2Config config(folder.write("quenx.conf", "FWFilePath=" + folder.path() + "\n"));
    const auto image = test::madeRom({{utils::FirmwareType::PXE, 2}, {utils::FirmwareType::UEFI, 1}});
    folder.write("image.rom", std::span(image));
    const LoadedFront front(QUENX_CMPI_LIBRARY, test::Dialect::Sfcb);
    EXPECT_EQ(front.cleanup(), " 0 0 0") << "never used";
    const auto identity = CimValue::of(CimType::Reference, front.first("Quenx_SoftwareIdentity"));
    const auto port = CimValue::of(CimType::Reference, front.first("Quenx_EthernetPort"));
    EXPECT_EQ(config.getInstance()->getImageLimits().silence, std::chrono::seconds(20)) << "calls have 40";
    EXPECT_EQ(front.cleanup(), " 0 0 0");
    EXPECT_EQ(front.cleanup(), " 0 0 0") << "once a class";
    const Request check{"invoke",
                        front.first("Quenx_SoftwareInstallationService"),
                        {},
                        {},
                        "CheckSoftwareIdentity",
                        {{"Source", identity}, {"Target", port}}};
    EXPECT_EQ(front.clean(front.instances), " 0");
    // Between the answers to two interfaces: the second one is decided anew.
    EXPECT_EQ(front.ask(check).called.returnValue, 0U);
    EXPECT_EQ(front.cleanup(), " 50 50 50") << "the check has claimed the adapter";
}

TEST(CmpiFrontTest, ServesNothingFromLibrariesOfAnotherBuild) {
    const auto bytes = test::readTestFile(QUENX_CMPI_LIBRARY);
    std::string library(bytes.begin(), bytes.end());
    const std::string own = utils::buildId();
    for (std::size_t at = 0; (at = library.find(own, at)) != std::string::npos;)
        library.replace(at, own.size(), own.size(), '0');
    const test::TempFolder folder;
    const LoadedFront whole(QUENX_CMPI_LIBRARY, test::Dialect::Sfcb);  // with the libraries below
    const LoadedFront other(folder.write("libother.so", library).c_str(), test::Dialect::Sfcb);
    try {
        other.first("Quenx_EthernetPort");
        ADD_FAILURE() << "served";
    } catch (const core::CimError& error) {
        EXPECT_EQ(error.what(),
                  "libQuenx_Cmpi.so is of build 000000000000, the other libraries are of build " + own +
                      ". Install all of them from one build, and restart the object manager.");
    }
    EXPECT_EQ(other.cleanup(), " 0 0 0");
}

}  // namespace
