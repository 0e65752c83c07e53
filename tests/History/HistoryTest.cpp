// SPDX-License-Identifier: Apache-2.0
#include "History/History.h"

#include <gmock/gmock.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <csignal>
#include <filesystem>
#include <fstream>
#include <optional>
#include <regex>
#include <thread>

#include "History/Owner.h"
#include "Providers/SoftwareUpdate/HookedBackend.h"
#include "Support/SimulatedAdapters.h"
#include "Support/SyslogCapture.h"
#include "Utils/Export.h"
#include "Utils/Os/Linux/linux.h"

namespace {

using history::History;
using history::Record;
using ::testing::HasSubstr;

std::atomic<int> syncs{0};

}  // namespace

/// SQLite finds this one before the C library's.
extern "C" QUENX_EXPORT int fdatasync(int file) {
    ++syncs;
    return static_cast<int>(::syscall(SYS_fdatasync, file));
}

namespace {

/// The adapters of SimulatedAdapters.h, one of which is at 43 % of an update.
class Adapters : public test::HookedBackend {
  public:
    using HookedBackend::HookedBackend;
    std::uint16_t getFlashImageUpdateProgress(const std::string&) override { return 43; }
};

class HistoryTest : public ::testing::Test {
  protected:
    HistoryTest() : m_backend(std::make_shared<Adapters>(ma::setBackend(nullptr))) {
        ma::setBackend(m_backend);
    }

    history::Settings settings() const {
        return {.folder = [this] { return m_path; }};
    }
    static core::UpdateAttempt attempt() {
        return {.caller = {"alice", "192.0.2.1", "test"},
                .time = os::getuSecondsSinceEpoch(),
                .monotonic = os::getMonotonicuSeconds(),
                .target = "port",
                .adapter = "eth0",
                .uri = "file:///new.rom",
                .options = {5, 3},
                .values = {},
                .image = {"abc", 3, "IMG_PXE 2"},
                .mostRecords = 100};
    }
    static void update(History& history) {
        const auto record = history.begin(attempt());
        ASSERT_NE(record, nullptr);
        record->end(true, 0, "");
    }
    std::vector<Record> records() const { return History(settings()).find({}); }

    const test::LogLevelGuard m_logLevel{1};
    const test::SyslogCapture m_log;
    const test::TempFolder m_folder;
    const std::string m_path = m_folder / "history";
    const std::string m_file = m_path + "/history.db";
    const test::SimulatedAdapters m_adapters;
    const std::shared_ptr<Adapters> m_backend;
};

TEST_F(HistoryTest, KeepsARefusalAndAnUpdateForThisUserAlone) {
    {
        History history(settings());
        history.refused(attempt(), 5, core::ReasonId::ImageDamaged, "it was wrong");
        update(history);
        const auto given = history.begin(attempt());  // and no end
    }
    const std::vector<Record> found = records();
    ASSERT_EQ(found.size(), 3U);
    const Record& refused = found[2];
    EXPECT_EQ(refused.outcome + ", " + refused.reason + ", " + refused.reasonId,
              "refused, it was wrong, QX-0301");
    EXPECT_EQ(refused.returnValue, 5);
    const Record& written = found[1];
    EXPECT_EQ(written.outcome, "written");
    EXPECT_EQ(written.user + " " + written.address + " " + written.front, "alice 192.0.2.1 test");
    EXPECT_EQ(written.adapter + " " + written.pciAddress + " " + written.uri,
              "eth0 0000:03:00.0 file:///new.rom");
    EXPECT_EQ(written.versionsBefore + " / " + written.imageVersions, "IMG_PXE 1, IMG_UEFI 0 / IMG_PXE 2");
    EXPECT_EQ(written.sha256 + " " + written.options, "abc 5,3");
    EXPECT_TRUE(written.active && written.ended && written.duration);
    EXPECT_EQ(found[0].reason + ", " + found[0].reasonId, "The update did not take place, QX-0405");
    for (const auto& [path, mode] : {std::pair{m_path, 0700U}, {m_file, 0600U}, {m_path + "/lock", 0600U}}) {
        struct stat status {};
        EXPECT_EQ(::stat(path.c_str(), &status), 0) << path;
        EXPECT_EQ(status.st_mode & 0777U, mode) << path;
    }
}

TEST(OwnerTest, KnowsTheStartOfTheMachine) {
    std::string id;
    std::getline(std::ifstream("/proc/sys/kernel/random/boot_id"), id);
    EXPECT_EQ(history::bootId(), id);
    EXPECT_EQ(id.size(), 36U);
}

TEST_F(HistoryTest, TakesNothingFromTheRecordBefore) {
    {
        History history(settings());
        history.refused(attempt(), 5, core::ReasonId::ImageDamaged, "it was wrong");
        core::UpdateAttempt bare;
        bare.mostRecords = attempt().mostRecords;
        history.refused(bare, 0, core::ReasonId::None, "");
    }
    const std::vector<Record> found = records();
    ASSERT_EQ(found.size(), 2U);
    EXPECT_EQ(found[0].uri + found[0].address + found[0].adapter + found[0].reason, "");
    EXPECT_FALSE(found[0].returnValue);
    EXPECT_EQ(found[1].reason, "it was wrong");
}

TEST_F(HistoryTest, ShowsRefusalsAtOnceAndSyncsManyTogether) {
    constexpr std::size_t kEach = 50;
    History history(settings());
    history.refused(attempt(), 5, core::ReasonId::ImageDamaged, "the first makes the file");
    const int before = syncs;
    {
        std::vector<std::jthread> clients;
        for (const char* adapter : {"eth0", "eth0", "none", ""})
            clients.emplace_back([&history, adapter] {
                core::UpdateAttempt wrong = attempt();
                wrong.adapter = adapter;
                wrong.mostRecords = 1000;
                for (std::size_t i = 0; i < kEach; ++i)
                    history.refused(wrong, 5, core::ReasonId::ImageDamaged, adapter);
            });
    }
    const std::vector<Record> found = history.find({});
    EXPECT_EQ(found.size(), 1 + 4 * kEach);
    EXPECT_EQ(records().size(), found.size()) << "others do not see what this process sees";
    for (const Record& record : found)
        EXPECT_EQ(record.pciAddress, record.adapter == "eth0" ? "0000:03:00.0" : "") << record.reason;
    const int during = syncs;
    EXPECT_LT(during - before, 20);

    history.refused(attempt(), 5, core::ReasonId::ImageDamaged, "the last");
    const auto end = std::chrono::steady_clock::now() + std::chrono::seconds(10);
    while (records().size() == found.size() && std::chrono::steady_clock::now() < end)
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
    EXPECT_NE(records().size(), found.size());
    while (syncs == during && std::chrono::steady_clock::now() < end)
        std::this_thread::sleep_for(std::chrono::milliseconds(20));
    EXPECT_GT(syncs, during) << "it never reached the disk";

    const int refused = syncs;
    const auto running = history.begin(attempt());
    EXPECT_GT(syncs, refused) << "an update waits for the disk";
}

TEST_F(HistoryTest, CompletesWhatAKilledProcessBeganAndNoOther) {
    const pid_t child = ::fork();
    History history(settings());
    const auto goesOn = history.begin(attempt());
    if (child == 0) {
        ::pause();
        ::_exit(0);
    }
    const auto bothAreSeen = [&] {
        const std::vector<Record> found = history.find({});
        return found.size() == 2 && found[0].percent == 43 && found[1].percent == 43;
    };
    while (!bothAreSeen())
        ::usleep(20'000);
    ::kill(child, SIGKILL);
    ::waitpid(child, nullptr, 0);
    std::vector<Record> found = records();
    ASSERT_EQ(found.size(), 2U);
    std::ranges::sort(found, {}, [&](const Record& each) { return each.process == child; });
    EXPECT_TRUE(found[0].isRunning());
    EXPECT_EQ(found[1].outcome, "interrupted");
    EXPECT_EQ(found[1].reason, "Interrupted at 43 %: test (process " + std::to_string(child) +
                                   ") ended during the update. eth0 still has IMG_PXE 1, IMG_UEFI 0");
    goesOn->end(false, 6, "broken");
    EXPECT_EQ(history.find({.adapter = "0000:03:00.0", .after = found[0].id - 1}).at(0).outcome, "failed");
}

TEST_F(HistoryTest, DoesNotCrossAFork) {
    History history(settings());
    update(history);
    const pid_t child = ::fork();
    if (child == 0) {
        const bool isNoneKept = history.begin(attempt()) == nullptr && history.begin(attempt()) == nullptr;
        const bool isToldOnce = test::SyslogCapture::lines().size() == 1 &&
                                test::SyslogCapture::lines()[0].text ==
                                    "[history] No record is kept of updates: this process was "
                                    "forked from one that keeps the history";
        const bool isTold = history.problem() == "this process was forked from one that keeps it";
        ::_exit((isNoneKept ? 0 : 1) + (isToldOnce ? 0 : 2) + (isTold ? 0 : 4));
    }
    int status = -1;
    ::waitpid(child, &status, 0);
    EXPECT_EQ(status, 0);
}

TEST_F(HistoryTest, TakesTheRecordsOfTwoProcessesAndRemovesTheOldest) {
    constexpr int kEach = 60;
    const pid_t child = ::fork();
    std::optional<History> history(settings());
    for (int i = 0; i < kEach; ++i)
        history->refused(attempt(), 2, core::ReasonId::FileNotRead, child == 0 ? "child" : "parent");
    if (child == 0) {
        history.reset();
        ::_exit(0);
    }
    ::waitpid(child, nullptr, 0);
    for (int i = 0; i < 2; ++i)
        history->refused(attempt(), 2, core::ReasonId::FileNotRead, "parent");
    const std::vector<Record> found = history->find({});
    // Whenever there are more than a hundred, two go.
    EXPECT_EQ(found.front().id, 2 * kEach + 2);
    EXPECT_GE(found.size(), 99U);
    EXPECT_LE(found.size(), 100U);
    EXPECT_TRUE(test::SyslogCapture::contains("operation=\"PruneHistory\" target=\"" + m_path +
                                              "\" arguments=\"\" outcome=\"removed records "));
    EXPECT_EQ(history->find({.failedOnly = true, .most = 7}).size(), 7U);
}

TEST_F(HistoryTest, NotesWhenTheNewFirmwareRuns) {
    ma::NamedVersion version{.name = "fw", .running = "1.1", .stored = "1.1"};
    m_backend->told = [&](const std::string&, ma::AdapterInfo& info) {
        info.versions = {version};
        info.resetNeeded = version.isPending() ? ma::ResetNeeded::Reboot : ma::ResetNeeded::None;
    };
    History history(settings());
    const auto record = history.begin(attempt());
    version.stored = "1.2";
    record->end(true, 0, "");
    Record found = history.find({}).at(0);
    EXPECT_EQ(found.versionsBefore + " -> " + found.versionsAfter, "fw 1.1 -> fw 1.2");
    EXPECT_FALSE(found.active);
    version.running = "1.2";
    found = history.find({}).at(0);
    EXPECT_EQ(found.outcome, "written");
    EXPECT_TRUE(found.active);
}

/// What is wrong with the history, and what the log says once.
struct Trouble {
    const char* name;
    void (*make)(const std::string& file);
    const char* said;
    std::size_t recordsAfter;  ///< that can be read after one update
};

class TroubledHistoryTest : public HistoryTest, public ::testing::WithParamInterface<Trouble> {};

TEST_P(TroubledHistoryTest, StopsNoUpdateAndIsToldOnce) {
    {
        History history(settings());
        update(history);
    }
    GetParam().make(m_file);
    {
        History history(settings());
        update(history);
        history.refused(attempt(), 2, core::ReasonId::FileNotRead, "again");
    }
    const auto lines = test::SyslogCapture::lines();
    EXPECT_EQ(std::ranges::count_if(
                  lines,
                  [](const auto& line) { return std::regex_search(line.text, std::regex(GetParam().said)); }),
              1);
    if (GetParam().recordsAfter == 0) {
        EXPECT_THROW(records(), history::HistoryError);
    } else {
        EXPECT_EQ(records().size(), GetParam().recordsAfter);
    }
}

INSTANTIATE_TEST_SUITE_P(
    All, TroubledHistoryTest,
    ::testing::Values(
        Trouble{
            "Damaged", [](const std::string& file) { std::filesystem::resize_file(file, 5000); },
            R"(^\[history\] The history is damaged \([^)]+\) and has been moved to \S+\. A new one begins\.$)",
            2},
        Trouble{
            "NoDatabase",
            [](const std::string& file) {
                std::filesystem::resize_file(file, 0);
                std::filesystem::resize_file(file, 5000);
            },
            R"(^\[history\] The history is damaged \([^)]+\) and has been moved to \S+\. A new one begins\.$)",
            2},
        Trouble{"Newer",
                [](const std::string& file) { history::Database(file).execute("PRAGMA user_version = 9"); },
                R"(written by a newer version \(schema 9; this one knows 1\))", 0},
        Trouble{"Link",
                [](const std::string& file) {
                    std::filesystem::rename(file, file + ".elsewhere");
                    std::filesystem::create_symlink(file + ".elsewhere", file);
                },
                "it is a link, or no regular file; remove it$", 0}),
    [](const auto& each) { return each.param.name; });

TEST_F(HistoryTest, KeepsAnUpdateWholeThatBeganWhileTheDiskWasFull) {
    History history(settings());
    history.refused(attempt(), 2, core::ReasonId::FileNotRead, "before");
    EXPECT_EQ(history.count(), 1);
    rlimit limit{};
    ::getrlimit(RLIMIT_FSIZE, &limit);
    const rlimit full{0, limit.rlim_max};
    const auto handler = std::signal(SIGXFSZ, SIG_IGN);
    ::setrlimit(RLIMIT_FSIZE, &full);
    const auto record = history.begin(attempt());
    history.refused(attempt(), 2, core::ReasonId::FileNotRead, "lost");
    core::UpdateAttempt required = attempt();
    required.mustBeKept = true;
    EXPECT_EQ(history.begin(required), nullptr);
    EXPECT_NE(history.problem(), "");
    ::setrlimit(RLIMIT_FSIZE, &limit);
    std::signal(SIGXFSZ, handler);
    record->end(true, 0, "");
    EXPECT_EQ(history.problem(), "");
    const std::vector<Record> found = history.find({});
    ASSERT_EQ(found.size(), 2U);
    EXPECT_EQ(found[0].outcome, "written");
    EXPECT_EQ(test::SyslogCapture::count("No record is kept of updates"), 1U);
}

}  // namespace
