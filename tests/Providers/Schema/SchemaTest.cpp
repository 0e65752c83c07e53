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

/// The classes that the providers' own classes are built on, by name.
std::map<std::string, const core::CimClassInfo*> allClasses() {
    std::map<std::string, const core::CimClassInfo*> classes;
    for (const core::AgentUse& use : core::GetCimBroker()->useAgents()) {
        for (const core::ServedClass* served : use.agent().getClasses().getAll()) {
            EXPECT_EQ(served->info->isAssociation, served->info->superclass->isAssociation) << served->name;
            for (const auto* info = served->info->superclass; info != nullptr; info = info->superclass)
                classes[info->name] = info;
        }
    }
    EXPECT_FALSE(classes.empty());
    return classes;
}

/// The name, with the kind.
std::string wordOf(core::CimProperty& property) {
    return property.getName() + std::string(":") + std::string(core::typeName(property.getType())) +
           (property.isArray() ? "[]" : "") + (property.isKey() ? "*" : "");
}

TEST(SchemaTest, RepeatsAllPropertiesOfASuperclassOrNoneAndServesTheLast) {
    const test::ProviderLibrary inventory(QUENX_INVENTORY_LIBRARY);
    const test::ProviderLibrary update(QUENX_UPDATE_LIBRARY);
    for (const auto& [name, info] : allClasses()) {
        SCOPED_TRACE(name);
        const auto instance = info->makeSample();
        EXPECT_EQ(instance->getClassName(), name);
        const auto& all = instance->getAllProperties();
        EXPECT_EQ(info->isAssociation,
                  std::ranges::count(all, core::CimType::Reference, &core::CimProperty::getType) != 0);
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

}  // namespace
