#include <nlohmann/json.hpp>

#include "System/Quenxctl.h"

namespace {

using test::ProgramResult;

/// The image "efi-virtio" in a directory that the inventory looks into.
class Identities : public test::Quenxctl {
  protected:
    Identities() {
        copy("new.rom", "efi-virtio");
        copy("other.rom", "efi-rtl8139");
        folder_.write("firmware/broken.rom", "no image");
    }

    ProgramResult withInventory(std::vector<std::string> arguments) const {
        arguments.insert(arguments.end(), {"--config", config_});
        return quenxctl(arguments);
    }

    /// The first id with this in it: an image's has the ids of its device, as "1af4-1041".
    std::string idOf(const std::string& part) const {
        const auto document = nlohmann::json::parse(withInventory({"identities", "--json"}).out);
        for (const auto& one : document["identities"]) {
            const std::string id = one["id"];
            if (id.find(part) != std::string::npos) return id;
        }
        return "no id with " + part;
    }

    void copy(const std::string& name, const std::string& rom) const {
        folder_.write("firmware/" + name, test::realRom(rom));
    }

    std::string config_ = offerFirmware();
};

TEST_F(Identities, ListsFilesAndWhatIsInstalled) {
    const ProgramResult result = withInventory({"identities"});
    EXPECT_EQ(result.status, 0) << result.error;
    for (const char* part : {"IMG_PXE 1, IMG_UEFI 0  IMG_PXE,IMG_UEFI  file://", "/firmware/new.rom",
                             "/firmware/other.rom", "Firmware of adapter eth0"}) {
        EXPECT_NE(result.out.find(part), std::string::npos) << part << "\n" << result.out;
    }
    EXPECT_EQ(result.out.find("broken.rom"), std::string::npos) << result.out;
}

TEST_F(Identities, ACheckChangesNothingAndAnInstallDoes) {
    const std::string id = idOf("1af4-1041");
    for (const std::vector<std::string>& image :
         {std::vector<std::string>{"--identity", id}, {folder_ / "firmware/new.rom"}}) {
        std::vector<std::string> check = {"check", "--target", "eth0"};
        check.insert(check.end(), image.begin(), image.end());
        const ProgramResult result = withInventory(check);
        EXPECT_EQ(result.status, 0) << result.error;
        EXPECT_EQ(result.out, "The image can be installed on eth0.\n");
    }
    EXPECT_EQ(firmwareOf("eth0"), "IMG_PXE 0, IMG_UEFI 0");
    EXPECT_EQ(withInventory({"install", "--target", "eth0", "--identity", id}).status, 0);
    EXPECT_EQ(firmwareOf("eth0"), "IMG_PXE 1, IMG_UEFI 0");
    EXPECT_EQ(withInventory({"check", "--target", "eth0", "--identity", id}).status, 3);
    EXPECT_EQ(withInventory({"install", "--target", "eth0", "--identity", id}).status, 3);
    EXPECT_EQ(withInventory({"install", "--target", "eth0", "--identity", id, "--force"}).status, 0);
}

TEST_F(Identities, RefusalsSayWhatToDo) {
    const std::string other = idOf("10ec-8139");
    const struct {
        std::vector<std::string> arguments;
        int status;
        std::string part;
    } rows[] = {
        {{"check", "--target", "eth0", "--identity", other}, 1, "is for 10ec:8139, and eth0 is 1af4:1041."},
        {{"install", "--target", "eth0", "--identity", other}, 1, "is for 10ec:8139, and eth0 is 1af4:1041."},
        {{"check", "--target", "eth0", "--identity", "none"}, 1, "There is no software identity \"none\"."},
        {{"check", "--target", "eth0", "--identity", idOf("eth0")}, 1, "there is no file of it"},
        {{"check", "--target", "eth0", image_}, 1, "put its directory into the line \"FWFilePath=\""},
        {{"check", "--target", "eth3", "--identity", idOf("1af4-1041")}, 1, "cannot be updated"},
        {{"install", "--target", "eth0", "--identity", other, "--types", "IMG_PXE"}, 2, "excludes --types"},
    };
    for (const auto& row : rows) {
        const ProgramResult result = withInventory(row.arguments);
        EXPECT_EQ(result.status, row.status) << row.part << result.out << result.error;
        EXPECT_NE(result.error.find(row.part), std::string::npos) << result.error << "\nwanted: " << row.part;
    }
}

TEST_F(Identities, AssociationsLeadFromThePortToItsFirmware) {
    const ProgramResult names = withInventory({"instances", "Quenx_EthernetPort", "--names"});
    const std::string port = names.out.substr(0, names.out.find('\n'));
    const ProgramResult all =
        withInventory({"associators", port, "--result-class", "Quenx_SoftwareIdentity"});
    EXPECT_NE(all.out.find("InstanceID = \"Quenx:eth0:IMG_PXE\""), std::string::npos) << all.out << all.error;
    const ProgramResult none = withInventory(
        {"associators", port, "--role", "Antecedent", "--class", "Quenx_ElementSoftwareIdentity"});
    EXPECT_EQ(none.status, 0) << none.error;
    EXPECT_EQ(none.out, "");
}

/// Every class after its superclass, and what the tables add where it belongs.
TEST_F(Identities, TheSchemaIsInOrderAndQualified) {
    const std::string mof = withInventory({"mof"}).out;
    std::istringstream lines(mof);
    std::string line;
    std::string defined = "\n";
    while (std::getline(lines, line)) {
        if (!line.starts_with("class ")) continue;
        const std::string name = line.substr(6, line.find_first_of(" {", 6) - 6);
        const auto colon = line.find(" : ");
        if (colon != std::string::npos) {
            const std::string superclass = line.substr(colon + 3, line.find(" {") - colon - 3);
            EXPECT_NE(defined.find("\n" + superclass + "\n"), std::string::npos) << line;
        }
        defined += name + "\n";
    }
    for (const char* part : {"\nQuenx_ConcreteJob\n", "\nQuenx_SoftwareInstallationService\n", "\nCIM_Job\n",
                             "\nQuenx_ElementSoftwareIdentity\n", "\nCIM_PortController\n"}) {
        EXPECT_NE(defined.find(part), std::string::npos) << defined;
    }
    for (const char* part : {"\"Completed\"", "\"Method Parameters Checked - Job Started\"", "[ Key ]",
                             "\"No Reboot Required\"", "uint16 JobState;", "CIM_ConcreteJob REF Job"}) {
        EXPECT_NE(mof.find(part), std::string::npos) << part;
    }
}

}  // namespace
