// SPDX-License-Identifier: Apache-2.0
#include "System/Session.h"

#include "MidAPI/Image/OptionRom.h"
#include "Support/SimulatedAdapters.h"
#include "Support/TestRoms.h"

namespace {

using test::madeRom;
using test::realRom;
using enum utils::FirmwareType;

/// Simulated adapters of its own, those of SimulatedAdapters.h, and images for them.
class SessionTest : public ::testing::TestWithParam<std::string> {
  protected:
    SessionTest() {
        m_folder.write("adapters.toml", test::kTestAdapters);
        m_folder.write("default.conf", "");
        m_folder.write("policy.toml", "# As if there were none.\n");
        m_folder.write("old.rom", realRom("efi-virtio"));
        m_folder.write("new.rom", test::withRevision(realRom("efi-virtio"), 2));
        m_folder.write("rtl8139.rom", realRom("efi-rtl8139"));
        m_folder.write("pcnet.rom", realRom("efi-pcnet"));
        m_folder.write("vmxnet3.rom", madeRom({{PXE, 2}}, 0x15ad, 0x07b0));
        m_folder.write("clp.rom", madeRom({{CLP, 3}}));
        m_folder.write("pxe.rom", madeRom({{PXE, 4}}));
        m_folder.write("vga.rom", ma::makeRomImage({.type = PXE,
                                                    .vendorId = 0x1af4,
                                                    .deviceId = 0x1041,
                                                    .furtherDeviceIds = {},
                                                    .classCode = 0x030000}));
    }

    const test::TempFolder m_folder;
};

TEST_P(SessionTest, ShowsWhatIsWrittenDown) {
    // Never the machine's own settings.
    test::expectSession(GetParam(), m_folder, R"(
        SOURCE=')" QUENX_SOURCE R"(' BUILD=')" QUENX_BUILD R"(' CMAKE=')" CMAKE R"('
        quenxctl() {
            case " $* " in *" --config "*) ;; *) set -- --config default.conf "$@" ;; esac
            case " $* " in *" --policy "*) ;; *) set -- --policy policy.toml "$@" ;; esac
            command quenxctl --adapters adapters.toml "$@"
        }
    )");
}

INSTANTIATE_TEST_SUITE_P(Shell, SessionTest,
                         ::testing::Values("Ansible", "BadFiles", "CommandLine", "ConfigCheck", "Daemon",
                                           "Domains", "Help", "History", "Identities", "ImagePolicy",
                                           "Install", "Json", "Many", "Pages", "Policy", "Registration",
                                           "Rollback", "Settings", "Staged", "Trust", "UsersFile",
                                           "WrongImages"),
                         [](const auto& session) { return session.param; });

}  // namespace
