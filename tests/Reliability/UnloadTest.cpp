// SPDX-License-Identifier: Apache-2.0
// The provider's libraries go while jobs are running or being made, and come back.
#include <gtest/gtest.h>

#include <filesystem>

#include "Support/Program.h"
#include "Support/ProviderLibrary.h"
#include "Support/SimulatedAdapters.h"
#include "Support/TestRoms.h"

#ifndef __has_feature  // Clang has it
#define __has_feature(feature) false
#endif

namespace {

using test::ProviderLibrary;
using utils::FirmwareType;

/// A program of C with both providers, on adapters of which the first fails as a test says it.
class HostOfCTest : public ::testing::Test {
  protected:
    /// What it prints, given the libraries in the order of their loading, which one is closed first, and a
    /// use.
    std::string run(std::vector<std::string> words, const std::string& fault = "") {
        std::string adapters = test::kTestAdapters;
        adapters.insert(
            adapters.find(" },\n{ name = \"eth1\""),
            R"(, fault = [ { at = "write", action = "stall", milliseconds = 200 })" + fault + "]");
        m_adapters.folder().write("adapters.toml", adapters);
        const auto rom = test::madeRom({{FirmwareType::PXE, ++m_revision}, {FirmwareType::UEFI, 1}});
        words.insert(words.begin(), QUENX_HOST_OF_C);
        words.insert(words.begin() + 3, QUENX_FLASH_STARTER);
        words.push_back("file://" + m_adapters.folder().write("image.rom", std::span(rom)));
        const test::ProgramResult result =
            test::run(words, {"QUENX_ADAPTERS=" + m_adapters.descriptionFile(),
                              "QUENX_ADAPTER_STATE=" + m_adapters.stateDirectory()});
        EXPECT_EQ(result.status, 0) << result.error;
        return result.out;
    }

    std::string image() const { return "IMG_PXE " + std::to_string(m_revision) + ", IMG_UEFI 1"; }
    std::string firmware() {
        m_adapters.restart();
        return test::componentsOf("eth0");
    }

    test::SimulatedAdapters m_adapters;
    std::uint16_t m_revision = 1;
};

// dlclose holds the loader's lock while it waits for workers and requests. Whatever these do for the first
// time in the process or on their thread must not need that lock: a backtrace, a thread-local variable, an
// exception.
TEST_F(HostOfCTest, UnloadsEitherProviderFirstAfterItsFlashesAndRequests) {
    if (!ProviderLibrary::isUnloadable()) GTEST_SKIP() << "sanitizer builds keep the library";
    for (const auto& [one, other] : {std::pair(QUENX_INVENTORY_LIBRARY, QUENX_UPDATE_LIBRARY),
                                     std::pair(QUENX_UPDATE_LIBRARY, QUENX_INVENTORY_LIBRARY)}) {
        for (const auto& [closedFirst, left, action] :
             {std::tuple("0", "0 1", "fail"), std::tuple("1", "1 0", "throw"), std::tuple("0", "0 1", "")}) {
            const bool fails = *action != 0;
            const std::string fault =
                R"(, { at = "write", percent = 50, text = "the device went away", action = ")" +
                std::string(action) + "\" }";
            for (const std::string use : {"flash", "calls"}) {
                SCOPED_TRACE(use + ", closed first: " + closedFirst + " of " + one + ", " + action);
                const std::string before = firmware();
                EXPECT_EQ(run({one, other, closedFirst, use}, fails ? fault : ""),
                          std::string("2 agents, mapped: 1 1\njob 1\n1 agents, mapped: ") + left +
                              "\n0 agents, mapped: 0 0\n" + (use == "flash" ? "job 1\n" : "") + "any: 0\n");
                EXPECT_EQ(firmware(), fails ? before : image());
            }
        }
    }
}

TEST_F(HostOfCTest, EndsOnlyWithItsFlashAndLetsAChildUnloadAndEnd) {
    if (__has_feature(thread_sanitizer)) GTEST_SKIP() << "the thread sanitizer has a thread that never ends";
    const char* const child = "1 agents, mapped: 1 0\n2 agents, mapped: 1 1\nchild: 0\n";
    for (const auto& [use, said] :
         {std::pair("leave", ""), std::pair("exit", ""), std::pair("fork", child)}) {
        EXPECT_EQ(run({QUENX_INVENTORY_LIBRARY, QUENX_UPDATE_LIBRARY, "0", use}),
                  std::string("2 agents, mapped: 1 1\njob 1\n") + said);
        EXPECT_EQ(firmware(), image());
    }
}

TEST(LibrariesTest, AreLinkedForBeingUnloaded) {
    const std::string reader =
        std::filesystem::path(QUENX_UPDATE_LIBRARY).replace_filename("libQuenx_FileReader.so");
    const std::pair<std::string, const char*> table[] = {
        // A worker that binds a symbol late waits for the loader's lock, too.
        {QUENX_INVENTORY_LIBRARY, "BIND_NOW"},
        {QUENX_UPDATE_LIBRARY, "BIND_NOW"},
        // A thread in it may be held by a file system for longer than anything else is loaded.
        {reader, "NODELETE"}};
    for (const auto& [library, flag] : table)
        EXPECT_TRUE(test::contains(test::run({"/usr/bin/env", "readelf", "-d", library}).out, flag))
            << library;
}

}  // namespace
