#include <sys/stat.h>

#include <algorithm>
#include <filesystem>
#include <thread>

#include "Providers/InventoryInterfaces.h"
#include "Providers/SoftwareInventory/InventoryTest.h"
#include "Support/SimulatedAdapters.h"
#include "Support/SyslogCapture.h"
#include "Support/TestRoms.h"
#include "Utils/Os/Linux/SMASHv2Config.h"
#include "Utils/Uri.h"

namespace {

namespace fs = std::filesystem;
using Rows = std::vector<std::string>;
using utils::FirmwareType;

/// Two firmware directories, and adapters that carry nothing unless a test says so.
class Firmware : public InventoryTest {
  protected:
    Firmware() {
        fs::create_directory(folder / "a");
        fs::create_directory(folder / "b");
        folder.write("quenx.conf", "FWFilePath=" + (folder / "a") + ";" + (folder / "b") + "\n");
    }

    /// Kinds of ROM that differ by ids or version, so that each is a firmware of its own.
    static std::vector<std::uint8_t> rom(std::uint32_t version, std::uint16_t device = 0x1041) {
        return test::madeRom({{FirmwareType::PXE, version}, {FirmwareType::UEFI, 0}}, 0x1af4, device);
    }

    Rows images() const { return table("Quenx_SoftwareIdentity", {"ElementName"}); }
    /// The files' names.
    Rows files() const { return table("Quenx_SoftwareIdentityResource", {"ElementName"}); }

    test::TempFolder folder;
    utils::SMASHv2Config config{folder / "quenx.conf"};
    test::SimulatedAdapters adapters{""};
};

TEST_F(Firmware, OfAFileIsDescribedByTheFile) {
    folder.write("a/efi-virtio.rom", test::realRom("efi-virtio"));
    folder.write("b/clp.rom", test::madeRom({{FirmwareType::iSCSI, 7}}, 0x15ad, 0x07b0));
    EXPECT_EQ(table("Quenx_SoftwareIdentity", {"ElementName", "VersionString", "MajorVersion", "TargetTypes",
                                               "Classifications", "IsEntity", "Manufacturer", "Name"}),
              (Rows{
                  "1af4:1041 IMG_PXE 1, IMG_UEFI 0; IMG_PXE 1, IMG_UEFI 0; 1; IMG_PXE, IMG_UEFI; 10, 2, 11; "
                  "FALSE; http://ipxe.org; iPXE",
                  "15ad:07b0 IMG_iSCSI 7; IMG_iSCSI 7; 7; IMG_iSCSI; 10, 11; FALSE; Simulator; Simulated "
                  "iSCSI boot",
              }));
    EXPECT_EQ(table("Quenx_SoftwareIdentity", {"IdentityInfoType", "IdentityInfoValue"}).front(),
              "Quenx:PCI Vendor and Device ID, Quenx:IMG_PXE, Quenx:IMG_UEFI; 1af4:1041, 1, 0");
}

TEST_F(Firmware, IsFoundByItsIdentifierWhereverItsFileIs) {
    folder.write("a/new.rom", rom(2));
    folder.write("a/old.rom", rom(1));
    folder.write("b/a copy::.rom", rom(2));
    const core::RequestScope scope;
    const auto identities = find<inventory::SoftwareIdentity>("Quenx_SoftwareIdentity");
    ASSERT_EQ(identities.size(), 2U);
    Rows found;
    for (const auto* resource : find<inventory::SoftwareIdentityResource>("Quenx_SoftwareIdentityResource")) {
        const auto it = std::find_if(identities.begin(), identities.end(), [&](const auto* identity) {
            return identity->getIdentifier() == resource->getFirmwareFileID();
        });
        ASSERT_NE(it, identities.end());
        EXPECT_EQ((*it)->getTypeCode(), 4);
        EXPECT_EQ((*it)->getTargetTypes(), (utils::StringArray{"IMG_PXE", "IMG_UEFI"}));
        const utils::Uri uri(resource->getAccessInfo());
        EXPECT_TRUE(uri.IsUriAccesible());
        found.push_back(std::to_string(it - identities.begin()) + " " + uri.getSourcePath());
    }
    EXPECT_EQ(found, (Rows{"0 " + (folder / "a/new.rom"), "1 " + (folder / "a/old.rom"),
                           "0 " + (folder / "b/a copy::.rom")}));
}

TEST_F(Firmware, ComesAndGoesWithItsFile) {
    EXPECT_EQ(images(), Rows{});
    folder.write("a/one.rom", rom(1));
    EXPECT_EQ(images(), Rows{"1af4:1041 IMG_PXE 1, IMG_UEFI 0"});
    const auto path = requests.enumerateInstanceNames("Quenx_SoftwareIdentity").front();
    EXPECT_TRUE(requests.getInstance(path).path.names(path));

    folder.write("b/two.rom", rom(2));
    EXPECT_EQ(files(), (Rows{"one.rom", "two.rom"}));
    // As an update of a file is usually done: same name and size, other content.
    folder.write("a/new", rom(3));
    fs::rename(folder / "a/new", folder / "a/one.rom");
    EXPECT_EQ(images(), (Rows{"1af4:1041 IMG_PXE 3, IMG_UEFI 0", "1af4:1041 IMG_PXE 2, IMG_UEFI 0"}));
    EXPECT_THROW(requests.getInstance(path), core::CimError);

    folder.write("quenx.conf", "FWFilePath=" + (folder / "b") + "\n");
    EXPECT_EQ(files(), Rows{"two.rom"});
    fs::remove(folder / "b/two.rom");
    EXPECT_EQ(files(), Rows{});
}

TEST_F(Firmware, ThatIsBrokenIsSkippedWithOneLine) {
    const test::LogLevelGuard level(1);
    std::vector<std::uint8_t> cut = rom(1);
    cut.resize(cut.size() - 512);
    folder.write("a/cut.rom", cut);
    folder.write("a/empty.rom", "");
    folder.write("a/readme.txt", "Notes on the images here");
    fs::create_symlink(folder / "nowhere", folder / "a/dangling.rom");
    fs::create_directory(folder / "a/subdirectory");
    ASSERT_EQ(mkfifo((folder / "a/fifo").c_str(), 0600), 0) << "reading it would never end";
    folder.write("a/good.rom", rom(5));
    folder.write("b/huge.rom", "\x55\xaa");
    fs::resize_file(folder / "b/huge.rom", 3'000'000'000);

    const test::SyslogCapture log;
    for (int round = 0; round < 3; round++) {
        EXPECT_EQ(images(), Rows{"1af4:1041 IMG_PXE 5, IMG_UEFI 0"});
        EXPECT_EQ(files(), Rows{"good.rom"});
    }
    EXPECT_EQ(log.count("is skipped: "), 5U);
    for (const char* name : {"cut.rom", "empty.rom", "readme.txt", "dangling.rom", "huge.rom"}) {
        EXPECT_EQ(log.count(std::string(name) + "' is skipped: "), 1U) << name;
    }

    folder.write("a/cut.rom", rom(6));
    folder.write("nowhere", rom(7));
    EXPECT_EQ(files(), (Rows{"cut.rom", "dangling.rom", "good.rom"}));
}

TEST_F(Firmware, IsReadOnceWhileItsFileDoesNotChange) {
    const test::LogLevelGuard level(2);
    for (std::uint16_t device = 1; device <= 1000; device++) {
        folder.write("a/" + std::to_string(device) + ".rom", rom(1, device));
    }
    const test::SyslogCapture log;
    EXPECT_EQ(images().size(), 1000U);
    EXPECT_EQ(files().size(), 1000U);
    EXPECT_EQ(log.count("Reading firmware file "), 1000U);
    folder.write("a/77.rom", rom(2, 77));
    EXPECT_EQ(images().size(), 1000U);
    EXPECT_EQ(log.count("Reading firmware file "), 1001U);
}

TEST_F(Firmware, ThatIsInstalledBelongsToItsPort) {
    const test::SimulatedAdapters usual;
    EXPECT_EQ(table("Quenx_SoftwareIdentity", {"InstanceID", "VersionString", "TargetTypes", "IsEntity"}),
              (Rows{
                  "Quenx:eth0:IMG_PXE; IMG_PXE 1; IMG_PXE; TRUE",
                  "Quenx:eth0:IMG_UEFI; IMG_UEFI 0; IMG_UEFI; TRUE",
                  "Quenx:eth1:IMG_PXE; IMG_PXE 1; IMG_PXE; TRUE",
                  "Quenx:eth1:IMG_UEFI; IMG_UEFI 0; IMG_UEFI; TRUE",
                  "Quenx:eth2:IMG_PXE; IMG_PXE 1; IMG_PXE; TRUE",
                  "Quenx:eth2:IMG_UEFI; IMG_UEFI 0; IMG_UEFI; TRUE",
                  "Quenx:eth3:IMG_PXE; IMG_PXE 1; IMG_PXE; TRUE",
                  "Quenx:eth4:IMG_iSCSI; IMG_iSCSI 1; IMG_iSCSI; TRUE",
                  "Quenx:eth4:IMG_UEFI; IMG_UEFI 0; IMG_UEFI; TRUE",
              }));
    {
        const core::RequestScope scope;
        for (const auto* identity : find<inventory::SoftwareIdentity>("Quenx_SoftwareIdentity")) {
            EXPECT_NE(identity->getTypeCode(), 4)
                << "cannot be installed from: " << identity->getIdentifier();
        }
    }
    EXPECT_EQ(table("Quenx_ElementSoftwareIdentity", {"UpgradeCondition"}),
              (Rows{"2", "2", "2", "2", "2", "2", "4", "2", "2"}));
    Rows walk;
    for (const auto& port : requests.enumerateInstances("Quenx_EthernetPort")) {
        std::string row = text(port, "Name");
        for (const auto& found : requests.associators(
                 port.path,
                 {"CIM_ElementSoftwareIdentity", "CIM_SoftwareIdentity", "Dependent", "Antecedent"})) {
            row += " " + text(found, "InstanceID");
        }
        walk.push_back(row);
    }
    EXPECT_EQ(walk, (Rows{
                        "eth0 Quenx:eth0:IMG_PXE Quenx:eth0:IMG_UEFI",
                        "eth1 Quenx:eth1:IMG_PXE Quenx:eth1:IMG_UEFI",
                        "eth2 Quenx:eth2:IMG_PXE Quenx:eth2:IMG_UEFI",
                        "eth3 Quenx:eth3:IMG_PXE",
                        "eth4 Quenx:eth4:IMG_iSCSI Quenx:eth4:IMG_UEFI",
                    }));
}

TEST_F(Firmware, ThatIsInstalledShowsTheNewVersionAfterAnUpdate) {
    const test::SimulatedAdapters usual;
    const core::CimPath installed("Quenx_SoftwareIdentity.InstanceID=\"Quenx:eth2:IMG_PXE\"");
    EXPECT_EQ(text(requests.getInstance(installed), "MajorVersion"), "1");
    const auto newer = test::madeRom({{FirmwareType::PXE, 9}, {FirmwareType::UEFI, 9}}, 0x10ec, 0x8139);
    const test::PreparedImage prepared = test::prepareImage("eth2", newer);
    ASSERT_EQ(prepared.status, 0);
    ASSERT_TRUE(test::writeImage("eth2", prepared.image).done);
    EXPECT_EQ(text(requests.getInstance(installed), "MajorVersion"), "9");
}

TEST_F(Firmware, IsServedToManyWhileFilesComeAndGo) {
    folder.write("a/stays.rom", rom(1));
    std::vector<std::jthread> clients;
    for (const char* name : {"Quenx_SoftwareIdentity", "Quenx_SoftwareIdentityResource", "CIM_Dependency",
                             "CIM_ManagedElement"}) {
        clients.emplace_back([this, name] {
            for (int round = 0; round < 40; round++)
                requests.enumerateInstances(name);
        });
    }
    for (int round = 0; round < 40; round++) {
        folder.write("b/goes.rom", rom(2));
        EXPECT_GE(images().size(), 1U);
        fs::remove(folder / "b/goes.rom");
    }
    clients.clear();
    EXPECT_EQ(files(), Rows{"stays.rom"});
}

TEST_F(Firmware, LibraryRegistersTheEthernetPortProfile) {
    EXPECT_EQ(table("Quenx_RegisteredProfile", {"InstanceID", "RegisteredName", "RegisteredOrganization"}),
              Rows{"Quenx:EthernetPort; Ethernet Port; 2"});
}

}  // namespace
