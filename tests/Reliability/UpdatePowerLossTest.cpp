// SPDX-License-Identifier: Apache-2.0
// The power fails at the k-th change that an update makes to the flash, for every k.
#include <fstream>
#include <limits>
#include <map>

#include "Providers/SoftwareUpdate/UpdateTest.h"
#include "Reliability/Effort.h"
#include "Support/TestRoms.h"

namespace {

namespace fs = std::filesystem;
using utils::FirmwareType;

/// What CutFiles throws where the power fails.
struct Cut {};

/// What may be on the medium after a cut: of the folder entries and of the contents that were not synced,
/// either all or none.
struct Medium {
    bool keepsEntries;
    bool keepsContents;
};

/// Cuts the power at the k-th call from some point on, in the middle of it where it writes, and knows what
/// had been synced until then. Used by one thread at a time.
class CutFiles : public ma::FlashFiles {
  public:
    void cutAt(int call) {
        m_calls = 0;
        m_cutAt = call;
    }
    bool wasCut() const { return m_calls >= m_cutAt; }

    void makeFolder(const std::string& path) override {
        count();
        FlashFiles::makeFolder(path);
        m_entries[path] = nullptr;
    }
    int create(const std::string& path) override {
        count();
        std::shared_ptr<Content>& content = m_entries[path];
        if (!content) content = std::make_shared<Content>();
        content->now.clear();
        const int descriptor = FlashFiles::create(path);
        m_open[descriptor] = content;
        return descriptor;
    }
    void write(int descriptor, std::span<const uint8_t> bytes) override {
        const bool cut = m_calls + 1 == m_cutAt;
        const std::span<const uint8_t> reaching = cut ? bytes.first(bytes.size() / 2) : bytes;
        Bytes& now = m_open[descriptor]->now;
        now.insert(now.end(), reaching.begin(), reaching.end());
        FlashFiles::write(descriptor, reaching);
        count();
    }
    void sync(int descriptor) override {
        count();
        m_open[descriptor]->synced = m_open[descriptor]->now;
    }
    void rename(const std::string& from, const std::string& to) override {
        count();
        FlashFiles::rename(from, to);
        m_entries[to] = m_entries[from];
        m_entries.erase(from);
    }
    void syncFolder(const std::string& path) override {
        count();
        const auto isIn = [&](const auto& entry) { return fs::path(entry.first).parent_path() == path; };
        std::erase_if(m_syncedEntries, isIn);
        for (const auto& entry : m_entries)
            if (isIn(entry)) m_syncedEntries.insert(entry);
    }

    /// Makes the real files what the medium holds.
    void lose(const Medium& medium, const std::string& root) const {
        for (const auto& found : fs::recursive_directory_iterator(root))
            if (found.is_regular_file() && found.path().extension() != ".lock") fs::remove(found.path());
        for (const auto& [path, content] : medium.keepsEntries ? m_entries : m_syncedEntries) {
            if (!content || !fs::exists(fs::path(path).parent_path())) continue;
            const Bytes& bytes = medium.keepsContents ? content->now : content->synced;
            std::ofstream(path, std::ios::binary) << std::string(bytes.begin(), bytes.end());
        }
    }

  private:
    using Bytes = std::vector<uint8_t>;
    struct Content {
        Bytes now;
        Bytes synced;
    };
    using Entries = std::map<std::string, std::shared_ptr<Content>>;

    void count() {
        if (++m_calls >= m_cutAt) throw Cut{};
    }

    int m_cutAt = std::numeric_limits<int>::max();
    int m_calls = 0;
    Entries m_entries;
    Entries m_syncedEntries;
    std::map<int, std::shared_ptr<Content>> m_open;
};

class UpdatePowerLossTest : public test::UpdateTest {
  protected:
    /// Loses the power at the k-th call of an update. False when the update made fewer.
    bool cutAt(int k, bool updatedBefore, const Medium& medium) const {
        const auto files = std::make_shared<CutFiles>();
        test::SimulatedAdapters adapters(test::kTestAdapters, files);
        fs::create_directory(adapters.stateDirectory());
        if (updatedBefore) waitForEnd(*install(m_first, "eth0").job);
        const std::vector<uint8_t> old = adapters->flashContent("eth0");
        files->cutAt(k);
        const test::CallResult update = install(m_image, "eth0");
        EXPECT_EQ(update.returnValue, 4096U) << update.error;
        if (!update.job) return false;
        const core::InstanceValue job = waitForEnd(*update.job);
        const bool finished = state(job) == JobStateCompleted;
        EXPECT_EQ(finished, !files->wasCut());
        EXPECT_EQ(text(job, "ErrorCode"), finished ? "0" : "4");
        EXPECT_EQ(claim(), "");

        files->lose(medium, adapters.stateDirectory());
        const bool wasCut = files->wasCut();
        files->cutAt(std::numeric_limits<int>::max());
        adapters.restart();
        const std::vector<uint8_t> found = adapters->flashContent("eth0");
        EXPECT_TRUE(found == m_new || (!finished && found == old)) << test::describeRom(found);
        expectUpdateWorks();
        EXPECT_EQ(test::componentsOf("eth0"), "IMG_PXE 2, IMG_UEFI 1");
        deleteJobs();
        return wasCut;
    }

    /// Of a length that takes several chunks.
    const std::vector<uint8_t> m_new = ma::mergeOptionRoms(ma::makeRomImage({.type = FirmwareType::PXE,
                                                                             .vendorId = 0x1af4,
                                                                             .deviceId = 0x1041,
                                                                             .furtherDeviceIds = {},
                                                                             .codeRevision = 2,
                                                                             .length = 10'240}),
                                                           test::madeRom({{FirmwareType::UEFI, 1}}));
    const std::string m_first =
        file("first.rom", test::madeRom({{FirmwareType::PXE, 1}, {FirmwareType::UEFI, 1}}));
    const std::string m_image = file("new.rom", m_new);
};

TEST_F(UpdatePowerLossTest, LeavesAWholeImageAndAnAdapterThatCanBeUpdated) {
    const test::LogLevelGuard silent(0);
    for (const bool updatedBefore : {false, true}) {
        for (const Medium medium : {Medium{true, true}, {false, false}, {true, false}, {false, true}}) {
            int k = 1;
            for (; cutAt(k, updatedBefore, medium); ++k)
                ASSERT_FALSE(HasFailure()) << (updatedBefore ? "second" : "first") << " update, entries "
                                           << (medium.keepsEntries ? "kept" : "lost") << ", contents "
                                           << (medium.keepsContents ? "kept" : "lost") << ", call " << k;
            EXPECT_GT(k, 15);
            test::count("kill points tried", static_cast<unsigned>(k - 1));
        }
    }
}

}  // namespace
