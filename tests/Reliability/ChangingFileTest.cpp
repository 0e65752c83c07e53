// SPDX-License-Identifier: Apache-2.0
// The image file changes under the update, or was never an ordinary file.
#include <sys/stat.h>

#include <filesystem>

#include "Providers/SoftwareUpdate/UpdateTest.h"
#include "Reliability/Effort.h"
#include "Support/TestRoms.h"
#include "Utils/Os/Linux/PatientReading.h"

namespace {

namespace fs = std::filesystem;
using test::CallResult;

/// Between two steps of an update. The file is looked at, opened and read; each is announced.
enum class When { BeforeOpening = 2, BeforeReading = 3, BeforePreparation, BeforeWrite };

class ChangingFileTest : public test::UpdateTest {
  protected:
    ~ChangingFileTest() override { os::beforeFileAccess = nullptr; }

    /// Has the change made once, when the update gets there.
    void arrange(When when, const std::function<void()>& change) {
        m_changed = false;
        m_accesses = 0;
        const auto changeOnce = [this, change] {
            if (!std::exchange(m_changed, true)) change();
        };
        m_backend->hook = [=](const std::string& called) {
            const char* const step = when == When::BeforeWrite ? "writeFlashImage" : "prepareFlashImage";
            if (when >= When::BeforePreparation && called == step) changeOnce();
        };
        m_atAccess = [=](int access) {
            if (access == static_cast<int>(when)) changeOnce();
        };
        os::beforeFileAccess = [](const std::string&) { m_atAccess(++m_accesses); };
    }
    CallResult installAndEnd(const std::string& uri) {
        CallResult result = install(uri, "eth0");
        EXPECT_TRUE(!result.job || state(waitForEnd(*result.job)) == JobStateCompleted);
        return result;
    }
    static std::vector<uint8_t> rom(uint16_t revision) {
        return test::madeRom({{utils::FirmwareType::PXE, revision}, {utils::FirmwareType::UEFI, revision}});
    }

    bool m_changed = false;
    static inline int m_accesses = 0;
    static inline std::function<void(int access)> m_atAccess;
    const std::string m_path = m_folder / "image.rom";
};

TEST_F(ChangingFileTest, WhatWasReadAndVerifiedIsWrittenWholeOrNothingIs) {
    auto longer = rom(3);
    longer.resize(longer.size() + 512, 0xEE);
    const auto replaceBy = [this](std::vector<uint8_t> content) {
        return [this, content] { fs::rename(m_folder.write("other.rom", std::span(content)), m_path); };
    };
    const auto inItsPlace = [this](const std::function<void()>& make) {
        return [this, make] {
            fs::remove(m_path);
            make();
        };
    };
    // The method's answer and the revision then in the flash: before the opening, and before the reading.
    constexpr const char* kOld = "4096/2";
    constexpr const char* kNew = "4096/3";
    const std::tuple<const char*, std::function<void()>, const char*, const char*> table[] = {
        {"truncated", [this] { fs::resize_file(m_path, 700); }, "5/1", "2/1"},
        {"emptied", [this] { fs::resize_file(m_path, 0); }, "5/1", "2/1"},
        {"extended", [this] { fs::resize_file(m_path, 9000); }, kOld, kOld},
        {"replaced", replaceBy(rom(3)), kNew, kOld},
        {"replaced by a longer one", replaceBy(longer), kNew, kOld},
        {"unlinked", inItsPlace([] {}), "5/1", kOld},
        {"a FIFO", inItsPlace([this] { mkfifo(m_path.c_str(), 0600); }), "5/1", kOld},
        {"a device", inItsPlace([this] { fs::create_symlink("/dev/zero", m_path); }), "5/1", kOld},
        {"a folder", inItsPlace([this] { fs::create_directory(m_path); }), "5/1", kOld},
    };
    for (const auto& [change, make, beforeOpening, beforeReading] : table) {
        for (const When when :
             {When::BeforeOpening, When::BeforeReading, When::BeforePreparation, When::BeforeWrite}) {
            SCOPED_TRACE(std::string(change) + " at step " + std::to_string(static_cast<int>(when)));
            fs::remove_all(m_path);
            fs::remove_all(m_adapters.stateDirectory());
            const std::string uri = file("image.rom", rom(2));
            arrange(when, make);
            test::SyslogCapture::clear();
            const CallResult result = installAndEnd(uri);
            EXPECT_TRUE(m_changed);
            EXPECT_EQ(claim(), "");
            const std::string outcome = std::to_string(result.returnValue) + '/' +
                                        test::componentsOf("eth0").substr(std::string("IMG_PXE ").size(), 1);
            EXPECT_EQ(outcome, when == When::BeforeOpening   ? beforeOpening
                               : when == When::BeforeReading ? beforeReading
                                                             : kOld);
            EXPECT_EQ(test::SyslogCapture::contains("Job cannot read the URI for '"), outcome == "2/1");
            test::count("files changed on the way");
        }
    }
}

TEST_F(ChangingFileTest, OddPathsAreRefusedOrReadLikeAnyOther) {
    const std::string huge = m_folder.write("huge", std::string_view("x"));
    const std::string larger = m_folder.write("larger", std::string_view("x"));
    fs::resize_file(huge, 1ULL << 31);
    fs::resize_file(larger, (1ULL << 32) + 5);
    mkfifo((m_folder / "fifo").c_str(), 0600);
    const std::string good = goodImage();
    for (const std::string& uri : {
             std::string("file:///proc/self/maps"),  // says that it is empty
             std::string("file:///proc/kcore"),
             std::string("file:///dev/null"),
             std::string("file:///dev/zero"),
             "file://" + huge,
             "file://" + larger,
             "file://" + (m_folder / "fifo"),
             "file:///" + std::string(5000, 'x'),
             good + std::string("\0.bak", 5),
             std::string("file://"),
             "file://\n" + good.substr(7),
         }) {
        EXPECT_EQ(installAndEnd(uri).returnValue, 5U) << uri.substr(0, 80);
        EXPECT_EQ(claim(), "") << uri.substr(0, 80);
        test::count("bad inputs tried");
    }
    const std::string oddName = m_folder / "new\nline %n \x01.rom";
    fs::create_symlink(good.substr(7), oddName);
    EXPECT_EQ(installAndEnd("file://" + oddName).returnValue, 4096U);
    expectUpdateWorks();
}

}  // namespace
