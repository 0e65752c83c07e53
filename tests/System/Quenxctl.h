// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "Support/SimulatedAdapters.h"
#include "Support/TempFolder.h"
#include "Support/TestRoms.h"
#include "System/Program.h"

namespace test {

/// The words of a command line: what stands between its spaces. The word IMAGE becomes the image's path.
std::vector<std::string> wordsOf(const std::string& line, const std::string& image = "");

/// quenxctl on simulated adapters of its own, those of SimulatedAdapters.h.
class Quenxctl : public ::testing::Test {
  protected:
    Quenxctl() { describeAdapters(); }

    /// Writes the description, with a fault of eth0; the adapters keep what they have.
    void describeAdapters(const std::string& fault = "");
    /// The program, the options that make its environment, and the words of the line.
    std::vector<std::string> command(const std::string& line) const;
    ProgramResult quenxctl(const std::string& line, const std::vector<std::string>& environment = {}) const {
        return run(command(line), environment);
    }
    /// Runs it, and expects this exit status and this in the error text.
    void expectError(const std::string& line, int status, const std::string& part) const;
    /// "IMG_PXE 1, IMG_UEFI 0": what an adapter carries, as a new process sees it.
    std::string firmwareOf(const std::string& adapter) const;

    TempFolder m_folder;
    /// The providers' settings, where a test does not name others: the defaults.
    std::string m_configuration = m_folder.write("default.conf", "");
    /// For eth0 and eth1: a real one with IMG_PXE 2 and IMG_UEFI 2.
    std::string m_image = m_folder.write("new.rom", withRevision(realRom("efi-virtio"), 2));
};

}  // namespace test
