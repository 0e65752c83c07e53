// SPDX-License-Identifier: Apache-2.0
// The rules that the bindings of the schema keep, whatever properties they have.
#include <gtest/gtest.h>

#include <algorithm>
#include <map>
#include <set>

#include "Framework/Classes/CimBroker.h"
#include "Framework/Model/CimInstance.h"
#include "Framework/Model/CimProperty.h"
#include "Framework/Model/ClassDeclaration.h"
#include "Support/ProviderLibrary.h"

namespace {

using Names = std::set<std::string>;

class SchemaTest : public ::testing::Test {
  protected:
    /// The classes that the providers' own classes are built on, by name.
    static std::map<std::string, const core::CimClassInfo*> allClasses() {
        std::map<std::string, const core::CimClassInfo*> classes;
        for (const core::AgentUse& use : core::GetCimBroker()->useAgents()) {
            for (const core::ServedClass* served : use.agent().getClasses().getAll()) {
                EXPECT_EQ(served->info->isAssociation, served->info->superclass->isAssociation)
                    << served->name;
                for (const auto* info = served->info->superclass; info != nullptr; info = info->superclass)
                    classes[info->name] = info;
            }
        }
        EXPECT_EQ(classes.size(), 31U);
        return classes;
    }

    const test::ProviderLibrary m_inventory{QUENX_INVENTORY_LIBRARY};
    const test::ProviderLibrary m_update{QUENX_UPDATE_LIBRARY};
};

bool isReference(core::CimProperty* property) {
    return property->getType() == core::CimType::Reference;
}

/// The name, with the kind.
std::string wordOf(core::CimProperty& property) {
    return property.getName() + std::string(":") + std::string(core::typeName(property.getType())) +
           (property.isArray() ? "[]" : "") + (property.isKey() ? "*" : "");
}

TEST_F(SchemaTest, RepeatsAllPropertiesOfASuperclassOrNoneAndServesTheLast) {
    for (const auto& [name, info] : allClasses()) {
        SCOPED_TRACE(name);
        const auto instance = info->makeSample();
        EXPECT_EQ(instance->getClassName(), name);
        const auto& all = instance->getAllProperties();
        EXPECT_EQ(info->isAssociation, std::any_of(all.begin(), all.end(), isReference));
        Names declared;
        for (const core::PropertyDeclaration& property : core::declarationsOf(*info).front()->properties)
            declared.insert(property.name);

        std::size_t inherited = 0;
        Names repeatable;
        if (info->superclass != nullptr) {
            const auto before = info->superclass->makeSample();
            inherited = before->getAllProperties().size();
            for (core::CimProperty* property : before->getProperties())
                if (!declared.contains(property->getName())) repeatable.insert(wordOf(*property));
        }
        Names own;
        Names repeated;
        for (std::size_t i = inherited; i < all.size(); ++i) {
            const std::string property = all[i]->getName();
            EXPECT_TRUE(own.insert(property).second) << property << " is there twice";
            EXPECT_TRUE(all[i]->IsNull()) << property;
            EXPECT_EQ(instance->getPropertyByName(property), all[i]) << property;
            if (!declared.contains(property)) repeated.insert(wordOf(*all[i]));
        }
        EXPECT_TRUE(std::includes(own.begin(), own.end(), declared.begin(), declared.end()));
        EXPECT_TRUE(repeated.empty() || repeated == repeatable);
    }
}

/// What may have qualifiers, by its name in the schema's texts.
struct Element {
    std::string name;
    std::string_view scope;
    const std::vector<core::Qualifier>& qualifiers;
};

std::vector<Element> elementsOf(const core::ClassDeclaration& declaration) {
    std::vector<Element> all{
        {"", declaration.isAssociation ? "ASSOCIATION" : "CLASS", declaration.qualifiers}};
    for (const core::PropertyDeclaration& property : declaration.properties)
        all.push_back(
            {property.name, property.referenceClass.empty() ? "PROPERTY" : "REFERENCE", property.qualifiers});
    for (const core::MethodDeclaration& method : declaration.methods) {
        all.push_back({method.name, "METHOD", method.qualifiers});
        for (const core::ParameterDeclaration& parameter : method.parameters)
            all.push_back({method.name + "." + parameter.name, "PARAMETER", parameter.qualifiers});
    }
    return all;
}

TEST_F(SchemaTest, DescribesAndQualifiesWhatItDeclaresByWhatIsDeclared) {
    const auto& declarations = core::qualifierDeclarations();
    Names used;
    for (const auto& [name, info] : allClasses()) {
        const auto declaration = core::declarationsOf(*info).front();
        Names elements;
        for (const Element& element : elementsOf(*declaration)) {
            elements.insert(element.name);
            for (const core::Qualifier& one : element.qualifiers) {
                SCOPED_TRACE(one.name + " of " + name + "." + element.name);
                const auto* declared = core::findByName(declarations, one.name);
                ASSERT_NE(declared, nullptr);
                EXPECT_EQ(one.value.type, declared->defaultValue.type);
                EXPECT_EQ(one.value.isArray, declared->defaultValue.isArray);
                EXPECT_EQ(std::ranges::count(declared->scopes, element.scope), 1);
                used.insert(one.name);
            }
        }
        // A text for anything else would reach no client.
        for (const core::CimElementText& text : info->texts)
            EXPECT_TRUE(elements.contains(text.element)) << name << "." << text.element;
    }
    std::string table;
    for (const core::QualifierDeclaration& one : declarations) {
        EXPECT_TRUE(used.contains(one.name)) << one.name;
        table += one.name + " " + core::valueText(one.defaultValue) + (one.isOverridable ? "" : "!") +
                 (one.isInherited ? "" : "-") + (one.isTranslatable ? "~, " : ", ");
    }
    EXPECT_EQ(table,
              "Association FALSE!, Description ~, In TRUE!, Key FALSE!, Out FALSE!, Override -, ValueMap , "
              "Values ~, ");
}

}  // namespace
