// The image file changes under the update, or was never an ordinary file.
#include <sys/stat.h>

#include <filesystem>

#include "Providers/SoftwareUpdate/UpdateTest.h"
#include "Reliability/Effort.h"
#include "Support/TestRoms.h"

namespace {

namespace fs = std::filesystem;
using test::CallResult;
using test::madeRom;
using utils::FirmwareType;

/// Between two steps of an update.
enum class When { BeforeSize, BeforeRead, BeforePreparation, BeforeWrite };

class ChangingFileTest : public test::UpdateTest {
  protected:
    ~ChangingFileTest() override { test::SyslogCapture::observe(nullptr); }

    /// Has the change made once, when the update gets there.
    void arrange(When when, std::function<void()> change);
    std::vector<uint8_t> rom(uint16_t revision) const {
        return madeRom({{FirmwareType::PXE, revision}, {FirmwareType::UEFI, revision}});
    }
    CallResult installAndEnd(const std::string& uri) {
        CallResult result = install(uri, "eth0");
        EXPECT_TRUE(!result.job || state(waitForEnd(*result.job)) == JobStateCompleted);
        return result;
    }
    std::string revision() const {
        return test::componentsOf("eth0").substr(std::string("IMG_PXE ").size(), 1);
    }

    bool m_changed = false;
    int m_sizes = 0;
};

void ChangingFileTest::arrange(When when, std::function<void()> change) {
    m_changed = false;
    m_sizes = 0;
    const auto once = [this, change = std::move(change)] {
        if (!std::exchange(m_changed, true)) change();
    };
    m_backend->hook = nullptr;
    test::SyslogCapture::observe(nullptr);
    if (when == When::BeforePreparation || when == When::BeforeWrite) {
        const std::string operation = when == When::BeforeWrite ? "writeFlashImage" : "prepareFlashImage";
        m_backend->hook = [once, operation](const std::string& called, const std::string&) {
            if (called == operation) once();
        };
        return;
    }
    // The size is asked for twice: to see whether there is a file, and to make room for it. Each says so.
    const int wanted = when == When::BeforeSize ? 1 : 2;
    test::SyslogCapture::observe([this, once, wanted](const std::string& line) {
        if (line.find("Output size of file") != std::string::npos && ++m_sizes == wanted) once();
    });
}

TEST_F(ChangingFileTest, WhatWasReadAndVerifiedIsWrittenWholeOrNothingIs) {
    struct Change {
        const char* name;
        std::function<void(const std::string& path)> make;
    };
    const auto replace = [this](const std::string& path, const std::vector<uint8_t>& content) {
        const std::string other = m_folder.write("other.rom", std::span(content));
        fs::rename(other, path);
    };
    auto longer = rom(3);
    longer.resize(longer.size() + 512, 0xEE);
    const std::vector<Change> changes = {
        {"truncated", [](const std::string& path) { fs::resize_file(path, 700); }},
        {"emptied", [](const std::string& path) { fs::resize_file(path, 0); }},
        {"extended", [](const std::string& path) { fs::resize_file(path, 9000); }},
        {"replaced", [&](const std::string& path) { replace(path, rom(3)); }},
        {"replaced by a longer one", [&](const std::string& path) { replace(path, longer); }},
        {"unlinked", [](const std::string& path) { fs::remove(path); }},
        {"a FIFO",
         [](const std::string& path) {
             fs::remove(path);
             mkfifo(path.c_str(), 0600);
         }},
        {"a device",
         [](const std::string& path) {
             fs::remove(path);
             fs::create_symlink("/dev/zero", path);
         }},
        {"a folder",
         [](const std::string& path) {
             fs::remove(path);
             fs::create_directory(path);
         }},
    };
    // For each change: the method's answer, and the revision then in the flash. 2K: 2, with the claim kept.
    struct Row {
        When when;
        std::array<const char*, 9> outcomes;
    };
    constexpr const char* kOld = "4096/2";
    constexpr const char* kNew = "4096/3";
    for (const Row& row : {
             Row{When::BeforeSize, {"5/1", "5/1", kOld, kNew, kNew, "2K/1", "2K/1", "2K/1", "2K/1"}},
             Row{When::BeforeRead, {"2/1", "2/1", kOld, kNew, kNew, "2/1", "2/1", "2/1", "2/1"}},
             Row{When::BeforePreparation, {kOld, kOld, kOld, kOld, kOld, kOld, kOld, kOld, kOld}},
             Row{When::BeforeWrite, {kOld, kOld, kOld, kOld, kOld, kOld, kOld, kOld, kOld}},
         }) {
        for (std::size_t i = 0; i < changes.size(); ++i) {
            SCOPED_TRACE(std::string(changes[i].name) + " at step " +
                         std::to_string(static_cast<int>(row.when)));
            fs::remove_all(m_folder / "image.rom");
            fs::remove_all(m_adapters.stateDirectory());
            const std::string uri = file("image.rom", rom(2));
            arrange(row.when, [&] { changes[i].make(m_folder / "image.rom"); });
            const CallResult result = installAndEnd(uri);
            EXPECT_TRUE(m_changed);
            EXPECT_EQ(std::to_string(result.returnValue) + (claim().empty() ? "/" : "K/") + revision(),
                      row.outcomes[i]);
            Quenx_ConcreteJob::m_servicedAdapter = std::string();
            test::count("files changed on the way");
        }
    }
}

TEST_F(ChangingFileTest, OddPathsAreRefusedOrReadLikeAnyOther) {
    const std::string huge = m_folder.write("huge", std::string_view("x"));
    fs::resize_file(huge, 5ULL << 30);
    const std::string good = goodImage();
    const std::string oddName = file("new\nline %n \x01.rom", test::readTestFile(good.substr(7)));
    struct Row {
        std::string uri;
        unsigned returnValue;
    };
    for (const Row& row : std::vector<Row>{
             {"file:///proc/self/maps", 5},  // says that it is empty
             {"file:///proc/kcore", 5},
             {"file:///proc/self/mem", 5},
             {"file:///dev/null", 5},
             {"file:///dev/tty", 5},
             {"file://" + huge, 5},
             {"file:///" + std::string(5000, 'x'), 5},
             {"file:///" + std::string(2500, '/') + std::string(2500, '.'), 5},
             {good + std::string("\0.bak", 5), 5},
             {std::string("file://\0", 8), 5},
             {"file://", 5},
             {"file://\n" + good.substr(7), 5},
             {oddName, 4096},
         }) {
        EXPECT_EQ(installAndEnd(row.uri).returnValue, row.returnValue) << row.uri.substr(0, 80);
        EXPECT_EQ(claim(), "") << row.uri.substr(0, 80);
        test::count("bad inputs tried");
    }
    expectUpdateWorks();
}

}  // namespace
