// SPDX-License-Identifier: Apache-2.0
// The process is killed at the k-th step of an update, for every k: before and after it tells of the
// beginning and of the end, and in the middle of each change to the flash.
#include <gmock/gmock.h>
#include <sys/wait.h>

#include <csignal>

#include "History/History.h"
#include "Providers/SoftwareUpdate/UpdateTest.h"
#include "Support/TestRoms.h"

#ifndef __has_feature  // Clang has it
#define __has_feature(feature) false
#endif

namespace {

using history::Record;

struct Steps {
    void take() {
        if (++taken == killAt) ::kill(::getpid(), SIGKILL);
    }
    int taken = 0;
    int killAt = 0;
};

class KillingFiles : public test::UnsyncedFiles {
  public:
    explicit KillingFiles(Steps& steps) : m_steps(steps) {}
    void makeFolder(const std::string& path) override {
        m_steps.take();
        FlashFiles::makeFolder(path);
    }
    int create(const std::string& path) override {
        m_steps.take();
        return FlashFiles::create(path);
    }
    void write(int descriptor, std::span<const std::uint8_t> bytes) override {
        FlashFiles::write(descriptor, bytes.first(bytes.size() / 2));
        m_steps.take();
        FlashFiles::write(descriptor, bytes.subspan(bytes.size() / 2));
    }
    void rename(const std::string& from, const std::string& to) override {
        m_steps.take();
        FlashFiles::rename(from, to);
    }

  private:
    Steps& m_steps;
};

class KillingRecord : public core::UpdateRecord {
  public:
    KillingRecord(std::shared_ptr<core::UpdateRecord> record, Steps& steps)
        : m_record(std::move(record)), m_steps(steps) {}
    void end(bool succeeded, std::uint32_t code, const std::string& text) noexcept override {
        m_steps.take();
        m_record->end(succeeded, code, text);
        m_steps.take();
    }

  private:
    const std::shared_ptr<core::UpdateRecord> m_record;
    Steps& m_steps;
};

class KillingHistory : public history::History {
  public:
    KillingHistory(history::Settings settings, Steps& steps) : History(std::move(settings)), m_steps(steps) {}
    std::shared_ptr<core::UpdateRecord> begin(const core::UpdateAttempt& attempt) noexcept override {
        m_steps.take();
        auto record = std::make_shared<KillingRecord>(History::begin(attempt), m_steps);
        m_steps.take();
        return record;
    }

  private:
    Steps& m_steps;
};

class KilledUpdateTest : public test::UpdateTest {
  protected:
    struct Found {
        bool isKilled;
        std::string components;
        std::vector<Record> records;
    };

    /// One update that is killed at the k-th step, and what the next process finds.
    Found killAt(int k) {
        Steps steps;
        test::SimulatedAdapters adapters(test::kTestAdapters, std::make_shared<KillingFiles>(steps));
        const history::Settings settings{[&] { return adapters.folder() / "history"; }};
        const pid_t child = ::fork();
        if (child == 0) {
            steps.killAt = k;
            core::InstalledSink installed(std::make_shared<KillingHistory>(settings, steps));
            waitForEnd(*install(m_image, "eth0").job);
            ::_exit(0);
        }
        int status = -1;
        ::waitpid(child, &status, 0);
        adapters.restart();
        return {status != 0, test::componentsOf("eth0"), history::History(settings).find({})};
    }

    const std::string m_image = goodImage();
};

TEST_F(KilledUpdateTest, LeavesARecordThatTellsWhatTheAdapterHas) {
    if (__has_feature(thread_sanitizer)) GTEST_SKIP() << "the thread sanitizer knows no threads after a fork";
    const test::LogLevelGuard silent(0);
    const std::string before = test::componentsOf("eth0");
    int interrupted = 0;
    for (int k = 1;; ++k) {
        const Found found = killAt(k);
        SCOPED_TRACE(k);
        if (!found.isKilled) break;
        if (k == 1) {
            EXPECT_TRUE(found.records.empty());
            EXPECT_EQ(found.components, before);
            continue;
        }
        ASSERT_EQ(found.records.size(), 1U);
        const Record& record = found.records[0];
        EXPECT_EQ(record.versionsBefore, before);
        EXPECT_EQ(record.versionsAfter, found.components);
        if (record.outcome == "written") {
            EXPECT_NE(found.components, before);
            continue;
        }
        ++interrupted;
        EXPECT_EQ(record.outcome + " " + record.reasonId, "interrupted QX-0710");
        EXPECT_THAT(
            record.reason,
            ::testing::EndsWith((found.components == before ? "still has " : "now has ") + found.components));
    }
    EXPECT_GT(interrupted, 10);
}

}  // namespace
