// SPDX-License-Identifier: Apache-2.0
#include <filesystem>
#include <nlohmann/json.hpp>
#include <regex>
#include <set>

#include "System/Quenxctl.h"

namespace {

using test::contains;
using test::ProgramResult;

/// Images in a directory that the inventory looks into.
class Identities : public test::Quenxctl {
  protected:
    Identities() {
        std::filesystem::create_directory(folder_ / "firmware");
        folder_.write("firmware/new.rom", test::readTestFile(image_));
        folder_.write("firmware/other.rom", test::realRom("efi-rtl8139"));
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
            if (contains(one["id"], part)) return one["id"];
        }
        return "no id with " + part;
    }

    std::string config_ = folder_.write("provider.conf", "FWFilePath=" + (folder_ / "firmware") + "\n");
};

TEST_F(Identities, ListsFilesAndWhatIsInstalled) {
    const ProgramResult result = withInventory({"identities"});
    EXPECT_EQ(result.status, 0) << result.error;
    for (const char* part : {"IMG_PXE 2, IMG_UEFI 2  IMG_PXE,IMG_UEFI  file://", "/firmware/new.rom",
                             "/firmware/other.rom", "Firmware of adapter eth0"}) {
        EXPECT_TRUE(contains(result.out, part)) << part << "\n" << result.out;
    }
    EXPECT_FALSE(contains(result.out, "broken.rom")) << result.out;
}

TEST_F(Identities, ACheckChangesNothingAndAnInstallDoes) {
    const std::string id = idOf("1af4-1041");
    const std::vector<std::string> check = {"check", "--target", "eth0", "--identity", id};
    const std::vector<std::string> install = {"install", "--target", "eth0", "--identity", id};
    EXPECT_EQ(withInventory(check).out, "The image can be installed on eth0.\n");
    // A file need not be in the inventory.
    EXPECT_EQ(withInventory({"check", "--target", "eth0", image_}).out,
              "The image can be installed on eth0.\n");
    EXPECT_EQ(firmwareOf("eth0"), "IMG_PXE 1, IMG_UEFI 0");
    EXPECT_EQ(withInventory(install).status, 0);
    EXPECT_EQ(firmwareOf("eth0"), "IMG_PXE 2, IMG_UEFI 2");
    EXPECT_EQ(withInventory(check).status, 3);
    EXPECT_EQ(withInventory(install).status, 3);
    EXPECT_EQ(withInventory({"install", "--target", "eth0", "--identity", id, "--force"}).status, 0);
}

TEST_F(Identities, RefusalsSayWhatToDo) {
    const std::string other = idOf("10ec-8139");
    const struct {
        std::vector<std::string> arguments;
        int status;
        std::string part;
    } rows[] = {
        {{"check", "--target", "eth0", "--identity", other}, 1, "is for 10ec:8139, but eth0 is 1af4:1041."},
        {{"install", "--target", "eth0", "--identity", other}, 1, "is for 10ec:8139, but eth0 is 1af4:1041."},
        {{"check", "--target", "eth0", "--identity", "none"}, 4, "There is no software identity \"none\"."},
        {{"check", "--target", "eth0", "--identity", idOf("eth0")}, 4, "there is no image file of it"},
        {{"check", "--target", "eth3", "--identity", idOf("1af4-1041")}, 1, "cannot be updated"},
        {{"install", "--target", "eth0", "--identity", other, "--types", "IMG_PXE"}, 2, "excludes --types"},
    };
    for (auto row : rows) {
        row.arguments.insert(row.arguments.end(), {"--config", config_});
        expectError(row.arguments, row.status, row.part);
    }
}

/// The words and signs of a MOF text, without what stands in quotes.
std::vector<std::string> wordsOf(const std::string& mof) {
    const std::string bare = std::regex_replace(mof, std::regex(R"("(\\.|[^"\\])*")"), "");
    const std::regex word(R"(\w+|[^\s\w])");
    std::vector<std::string> words;
    for (std::sregex_iterator each(bare.begin(), bare.end(), word), end; each != end; ++each)
        words.push_back(each->str());
    return words;
}

/// What a MOF compiler would refuse: classes and qualifiers that are used before they are declared.
std::string faultsOf(const std::vector<std::string>& words) {
    std::set<std::string> classes;
    std::set<std::string> qualifiers;
    std::string faults;
    const auto require = [&](const std::set<std::string>& known, const std::string& name) {
        if (!known.contains(name)) faults += name + " is not declared\n";
    };
    bool isInList = false;
    int depth = 0;  // inside a qualifier's value
    for (std::size_t i = 0; i + 1 < words.size(); ++i) {
        const std::string& word = words[i];
        const std::string& next = words[i + 1];
        if (word == "Qualifier") qualifiers.insert(next);
        if (word == "class") classes.insert(next);
        if (word == "class" && words[i + 2] == ":") require(classes, words[i + 3]);
        if (next == "REF") require(classes, word);
        if (word == "[") isInList = next != "]";
        if (word == "]") isInList = false;
        if (isInList) depth += word == "(" || word == "{" ? 1 : word == ")" || word == "}" ? -1 : 0;
        if (isInList && depth == 0 && (word == "[" || word == ",")) require(qualifiers, next);
    }
    return faults;
}

TEST_F(Identities, TheSchemaIsInOrderAndQualified) {
    const std::string mof = withInventory({"mof"}).out;
    const std::vector<std::string> words = wordsOf(mof);
    EXPECT_EQ(faultsOf(words), "");
    EXPECT_EQ(faultsOf(wordsOf("[ New ( \"[ Old\" ), Other ] class A : B { C REF D; };")),
              "New is not declared\nOther is not declared\nB is not declared\nC is not declared\n");
    std::string defined = "\n";
    for (std::size_t i = 1; i < words.size(); ++i)
        if (words[i - 1] == "class") defined += words[i] + "\n";
    for (const char* name : {"Quenx_ConcreteJob", "Quenx_SoftwareInstallationService", "CIM_Job",
                             "Quenx_ElementSoftwareIdentity", "CIM_PortController"}) {
        EXPECT_TRUE(contains(defined, "\n" + std::string(name) + "\n")) << defined;
    }
    for (const char* part :
         {"\"Completed\"", "\"Method Parameters Checked - Job Started\"", "[ Association,\n   Description ( ",
          "Qualifier Key : boolean = false,\n    Scope(property, reference),\n    Flavor(DisableOverride, "
          "ToSubclass);\n",
          "    [ Key ]\n    CIM_ManagedElement REF Antecedent;\n",
          "        [ In,\n           Description ( \"Where the image is.\" ) ]\n        string URI,\n",
          "        [ In ( false ),\n           Out,\n           Description ( \"The job that was started.\" "
          ") ]\n"
          "        CIM_ConcreteJob REF Job,\n",
          "    [ Key,\n       Override ( \"Antecedent\" ) ]\n",
          "ValueMap { \"1\", \"2\" },\n       Values { \"Local Time\", \"UTC Time\" } ]\n"
          "    uint16 LocalOrUtcTime;\n"}) {
        EXPECT_TRUE(contains(mof, part)) << part << "\n" << mof;
    }
}

}  // namespace
