// SPDX-License-Identifier: Apache-2.0
#include <gtest/gtest.h>

#include <algorithm>
#include <cctype>
#include <map>
#include <set>
#include <sstream>

#include "Framework/Classes/CimBroker.h"
#include "Framework/Model/ClassDeclaration.h"
#include "Providers/Schema/CIM_SoftwareInstallationService.h"
#include "Providers/Schema/SchemaTable.h"
#include "Support/ProviderLibrary.h"

namespace {

/// The classes of the schema, by name: those that the providers' own classes are built on.
std::map<std::string, const core::CimClassInfo*> allClasses() {
    std::map<std::string, const core::CimClassInfo*> classes;
    for (const core::AgentUse& use : core::GetCimBroker()->useAgents()) {
        for (const core::ServedClass* served : use.agent().getClasses().getAll()) {
            for (const auto* info = served->info; info != nullptr; info = info->superclass)
                if (std::string(info->name).starts_with("CIM_")) classes[info->name] = info;
        }
    }
    return classes;
}

const SchemaRow& rowOf(const std::string& name) {
    return *std::find_if(std::begin(kSchemaTable), std::end(kSchemaTable),
                         [&](const SchemaRow& row) { return name == row.name; });
}

std::string nameIn(const std::string& word) {
    const std::size_t start = word[0] == '+' ? 1 : 0;
    return word.substr(start, word.find(':') - start);
}

/// The words of a row, with ... written out.
std::vector<std::string> wordsOf(const SchemaRow& row) {
    std::istringstream text(row.properties);
    std::vector<std::string> words;
    std::set<std::string> names;
    for (std::string word; text >> word;) {
        if (word != "...") {
            words.push_back(word);
            names.insert(nameIn(word));
            continue;
        }
        for (const std::string& repeated : wordsOf(rowOf(row.superclass))) {
            if (!names.contains(nameIn(repeated)))
                words.push_back(repeated.substr(repeated[0] == '+' ? 1 : 0));
        }
    }
    return words;
}

/// A property as a word of the table.
std::string wordOf(core::CimProperty& property) {
    std::string kind(core::typeName(property.getType()));
    kind[0] = static_cast<char>(std::toupper(kind[0]));
    if (property.getType() == core::CimType::Reference)
        kind = std::string(">") + property.getReferenceClass();
    return property.getName() + (":" + kind) + (property.isArray() ? "_arr" : "") +
           (property.isKey() ? "*" : "");
}

TEST(SchemaTest, HasTheClassesOfTheTableWithTheirMembersInOrder) {
    const test::ProviderLibrary inventory(QUENX_INVENTORY_LIBRARY);
    const test::ProviderLibrary update(QUENX_UPDATE_LIBRARY);
    const auto classes = allClasses();
    EXPECT_EQ(classes.size(), std::size(kSchemaTable));
    for (const SchemaRow& row : kSchemaTable) {
        SCOPED_TRACE(row.name);
        ASSERT_TRUE(classes.contains(row.name));
        const core::CimClassInfo& info = *classes.at(row.name);
        EXPECT_STREQ(info.superclass == nullptr ? "" : info.superclass->name, row.superclass);
        EXPECT_EQ(info.isAssociation, std::string(row.properties).find(":>") != std::string::npos);

        const std::unique_ptr<core::CimInstance> instance = info.makeSample();
        EXPECT_EQ(instance->getClassName(), row.name);
        const auto& all = instance->getAllProperties();
        const std::size_t inherited =
            info.superclass == nullptr ? 0 : info.superclass->makeSample()->getAllProperties().size();
        const auto& declared = core::declarationsOf(info).front()->properties;
        std::size_t next = 0;
        std::vector<std::string> own;
        for (std::size_t i = inherited; i < all.size(); i++) {
            const std::string word = wordOf(*all[i]);
            const bool isDeclared = next < declared.size() && declared[next].name == all[i]->getName();
            next += isDeclared ? 1 : 0;
            own.push_back((isDeclared ? "+" : "") + word);
            EXPECT_TRUE(all[i]->IsNull()) << word;
            EXPECT_EQ(instance->getPropertyByName(all[i]->getName()), all[i]) << "the last one is served";
        }
        EXPECT_EQ(own, wordsOf(row));
        EXPECT_EQ(next, declared.size());
        // One property a name is served, however many levels declare it.
        std::set<std::string> names;
        for (const core::CimProperty* property : all)
            names.insert(property->getName());
        EXPECT_EQ(instance->getProperties().size(), names.size());
    }
}

TEST(SchemaTest, DeclaresTheMethodsOfTheService) {
    std::string text;
    const core::ClassChain chain = core::declarationsOf(CIM_SoftwareInstallationService::classInfo);
    for (const core::MethodDeclaration& method : chain.front()->methods) {
        text += std::string(core::typeName(method.returnType)) + " " + method.name + "\n";
        for (const core::ParameterDeclaration& parameter : method.parameters) {
            const bool isReference = parameter.type == core::CimType::Reference;
            text += parameter.direction == core::CimDirection::In ? "  in" : "  out";
            text += parameter.optional ? " optional " : " ";
            text += isReference ? parameter.referenceClass : core::typeName(parameter.type);
            text += (parameter.isArray ? "[] " : " ") + parameter.name + "\n";
        }
    }
    EXPECT_EQ(text,
              "uint32 CheckSoftwareIdentity\n"
              "  in CIM_SoftwareIdentity Source\n"
              "  in optional CIM_ManagedElement Target\n"
              "  in optional CIM_Collection Collection\n"
              "  out uint16[] InstallCharacteristics\n"
              "uint32 InstallFromSoftwareIdentity\n"
              "  out CIM_ConcreteJob Job\n"
              "  in uint16[] InstallOptions\n"
              "  in optional string[] InstallOptionsValues\n"
              "  in CIM_SoftwareIdentity Source\n"
              "  in optional CIM_ManagedElement Target\n"
              "  in optional CIM_Collection Collection\n"
              "uint32 InstallFromURI\n"
              "  out CIM_ConcreteJob Job\n"
              "  in string URI\n"
              "  in CIM_ManagedElement Target\n"
              "  in uint16[] InstallOptions\n"
              "  in optional string[] InstallOptionsValues\n");
}

/// A text for an element that the class does not declare would reach no client.
TEST(SchemaTest, DescribesOnlyWhatItsClassesDeclare) {
    const test::ProviderLibrary inventory(QUENX_INVENTORY_LIBRARY);
    const test::ProviderLibrary update(QUENX_UPDATE_LIBRARY);
    for (const auto& [name, info] : allClasses()) {
        const auto declaration = core::declarationsOf(*info).front();
        std::set<std::string> described;
        const auto add = [&](const std::string& element, const std::vector<core::Qualifier>& qualifiers) {
            if (core::findQualifier(qualifiers, "Description") != nullptr) described.insert(element);
        };
        add("", declaration->qualifiers);
        for (const core::PropertyDeclaration& property : declaration->properties)
            add(property.name, property.qualifiers);
        for (const core::MethodDeclaration& method : declaration->methods) {
            add(method.name, method.qualifiers);
            for (const core::ParameterDeclaration& parameter : method.parameters)
                add(method.name + "." + parameter.name, parameter.qualifiers);
        }
        for (const core::CimElementText& text : info->texts)
            EXPECT_TRUE(described.contains(text.element)) << name << "." << text.element;
        EXPECT_EQ(described.size(), info->texts.size()) << name;
    }
}

}  // namespace
