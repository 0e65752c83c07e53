#pragma once

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "Support/TempFolder.h"
#include "Support/TestRoms.h"
#include "System/Program.h"

namespace test {

/// quenxctl on simulated adapters of its own: eth0 and eth1 are 1af4:1041 with IMG_PXE 0 and IMG_UEFI 0, so
/// the real image "efi-virtio" is newer; eth3 cannot be updated; eth4 carries iSCSI.
class Quenxctl : public ::testing::Test {
  protected:
    Quenxctl() { describeAdapters(); }

    /// Writes the description, with further lines on eth0; the adapters keep what they have.
    void describeAdapters(const std::string& more = "");
    std::vector<std::string> command(const std::vector<std::string>& arguments) const;
    ProgramResult quenxctl(const std::vector<std::string>& arguments,
                           const std::vector<std::string>& environment = {}) const;
    /// Runs it, and expects this exit status and this in the error text.
    void expectError(const std::vector<std::string>& arguments, int status, const std::string& part) const;
    /// "IMG_PXE 1, IMG_UEFI 0": what an adapter carries, as a new process sees it.
    std::string firmwareOf(const std::string& adapter) const;

    /// A configuration that offers the images in the folder "firmware" of folder_, which it makes.
    std::string offerFirmware();

    TempFolder folder_;
    std::string image_ = realRomPath("efi-virtio");
};

}  // namespace test
