// SPDX-License-Identifier: Apache-2.0
// Many clients at once, while adapters are being written to and files come and go.
#include <filesystem>
#include <functional>
#include <random>
#include <thread>

#include "Framework/Classes/CimBroker.h"
#include "Framework/Classes/InstanceList.h"
#include "Providers/SoftwareUpdate/JobThread.h"
#include "Providers/SoftwareUpdate/UpdateTest.h"
#include "Reliability/Effort.h"
#include "Reliability/Interposed.h"
#include "Support/TestRoms.h"

namespace {

using core::CimPath;
using test::CallResult;
using utils::FirmwareType;
using Clock = std::chrono::steady_clock;
using Random = std::minstd_rand;

template <class Items>
auto& pick(const Items& items, Random& random) {
    return items[random() % items.size()];
}

class StressTest : public test::UpdateTest {
  protected:
    StressTest() {
        using enum FirmwareType;
        m_targets = {{"eth0", goodImage()},
                     {"eth1", goodImage()},
                     {"eth2", file("rtl.rom", test::madeRom({{PXE, 1}, {UEFI, 1}}, 0x10ec, 0x8139))},
                     {"eth4", file("vmx.rom", test::madeRom({{iSCSI, 1}, {UEFI, 0}}, 0x15ad, 0x07b0))}};
        for (const core::ClassChain& chain : m_requests.enumerateClasses("", true))
            m_classes.push_back(chain.front()->name);
        // Knows how many adapters are being written to at once, and takes its time for it.
        m_backend->hook = [this](const std::string& operation) {
            if (operation == "updateCapabilityWord") --m_writing;
            if (operation != "writeFlashImage") return;
            EXPECT_EQ(++m_writing, 1);
            utils::Thread::msleep(static_cast<unsigned>(m_writes++ % 4));
        };
    }

    /// Lets the clients act for this time, and on until it is enough.
    void run(std::chrono::milliseconds time, const std::function<bool()>& isEnough) {
        constexpr unsigned clients = 6;
        const auto begin = Clock::now();
        m_stop = false;
        std::vector<std::jthread> threads;
        for (unsigned i = 0; i < clients; ++i)
            threads.emplace_back([this, i] { client(i + 1); });
        while (Clock::now() < begin + time || !isEnough())
            utils::Thread::msleep(5);
        m_stop = true;
    }
    void cleanUp() {
        deleteJobs();
        for (const char* name : {"new", "goes.rom"})
            std::filesystem::remove(m_folder / name);
        // What the rebuilt association classes hold, is what is there without jobs.
        for (const std::string& name : m_classes)
            m_requests.enumerateInstances(name);
    }

    std::atomic<int> m_writing{0};
    std::atomic<std::uint64_t> m_writes{0};
    std::atomic<std::uint64_t> m_requestCount{0};
    std::atomic<std::uint64_t> m_started{0};
    std::atomic<std::uint64_t> m_refused{0};
    std::atomic<std::uint64_t> m_checked{0};
    std::atomic<std::uint64_t> m_deleted{0};

  private:
    void client(unsigned seed) {
        Random random(seed);
        while (!m_stop) {
            try {
                act(random);
            } catch (const core::CimError& error) {
                // Another client deleted it meanwhile.
                EXPECT_EQ(error.status(), core::CimStatus::NotFound) << error.what();
            }
        }
    }
    void act(Random& random) {
        ++m_requestCount;
        const auto action = random() % 8;
        if (action == 0) m_requests.enumerateInstances(pick(m_classes, random));
        if (action == 1 || action == 2) {
            const auto paths = m_requests.enumerateInstanceNames(pick(m_classes, random));
            if (paths.empty()) return;
            const CimPath& path = pick(paths, random);
            m_requests.getInstance(path);
            m_requests.associators(path, {});
            m_requests.referenceNames(path, {});
            m_requests.references(path, {pick(m_classes, random), "", "", ""});
        }
        if (action == 3) check(random);
        if (action == 4) deleteSome(random);
        if (action == 5) {
            EXPECT_EQ(utils::logLevel, 0);
            // A file comes, goes, or is replaced.
            const std::string path = m_folder / "goes.rom";
            const auto rom = test::madeRom({{FirmwareType::PXE, static_cast<uint32_t>(random() % 9)}});
            m_folder.write("new", std::span(rom));
            std::error_code ignored;  // another client was faster
            std::filesystem::rename(m_folder / "new", path, ignored);
            if (random() % 2 == 0) std::filesystem::remove(path, ignored);
        }
        if (action > 5) startInstall(random);
    }
    void startInstall(Random& random) {
        const auto& [adapter, uri] = pick(m_targets, random);
        const CallResult result = install(uri, port(adapter), "5,3");
        EXPECT_EQ(result.error, "");
        if (result.job) {
            ++m_started;
            if (random() % 4 == 0) m_requests.deleteInstance(*result.job);  // just started
            if (random() % 4 == 1) m_requests.getInstance(*result.job);
            return;
        }
        // In use, or another one is.
        EXPECT_TRUE(result.returnValue == 6U || result.returnValue == 2U) << result.returnValue;
        ++m_refused;
    }
    void check(Random& random) {
        const auto sources = m_requests.enumerateInstanceNames("Quenx_SoftwareIdentity");
        const std::string target = port(pick(m_targets, random).first).toString();
        const CallResult result = call("CheckSoftwareIdentity",
                                       "Source=" + pick(sources, random).toString() + "; Target=" + target);
        EXPECT_EQ(result.error, "");
        if (result.returnValue == 0) ++m_checked;
    }
    void deleteSome(Random& random) {
        const auto jobs = m_requests.enumerateInstanceNames("Quenx_ConcreteJob");
        if (jobs.size() < random() % 8) return;
        for (const CimPath& job : jobs) {
            if (random() % 2 == 0) continue;
            m_requests.deleteInstance(job);
            ++m_deleted;
        }
    }

    const test::LogLevelGuard m_silent{0};
    std::vector<std::pair<const char*, std::string>> m_targets;  ///< adapters and images for them
    std::vector<std::string> m_classes;
    std::atomic<bool> m_stop{false};
};

TEST_F(StressTest, LosesNothing) {
    m_folder.write("quenx.conf", "ReleaseClaimAfterCheck=1\nFWFilePath=" + m_folder.path() + "\n");
    const std::int32_t executionsBefore = JobThread::executionCount;
    // Ends only when every outcome has come, on a busy machine the rarer ones take longer: what is kept from
    // the first of each is there then.
    const auto hasMetAll = [&] { return m_refused > 0 && m_checked > 0 && m_deleted > 0; };
    run(std::chrono::milliseconds(300), [&] { return m_started >= 10 && hasMetAll(); });
    cleanUp();
    // But for what is kept once, as the room of lists for more elements: each job takes about 10 KB. What is
    // lost is lost in each round, what is kept once in one of them.
    constexpr int kRounds = 3;
    std::int64_t kept = 0;
    for (int round = 0; round < kRounds; ++round) {
        const std::int64_t before = test::liveBytes();
        const std::uint64_t wanted = m_started + test::effort.jobs;
        run(test::effort.stress, [&] { return m_started >= wanted && hasMetAll(); });
        cleanUp();
        kept = test::liveBytes() - before;
        if (kept < 5000) break;
    }
    EXPECT_LT(kept, 5000);
    EXPECT_EQ(claim(), "");
    // Every job that was started has run, and each flash has ended well.
    EXPECT_EQ(static_cast<std::uint64_t>(JobThread::executionCount - executionsBefore), m_started);
    EXPECT_EQ(m_writes, m_started);
    EXPECT_EQ(test::componentsOf("eth4"), "IMG_iSCSI 1, IMG_UEFI 0");
    test::count("requests made under stress", m_requestCount);
    test::count("jobs created and deleted under stress", m_started);
    expectUpdateWorks();
}

}  // namespace
