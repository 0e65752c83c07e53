#pragma once

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "Framework/CimRequests.h"
#include "Framework/InstanceRange.h"
#include "Framework/RequestScope.h"
#include "Support/ProviderLibrary.h"

/// The inventory's library, loaded, and the request layer on top of it.
class InventoryTest : public ::testing::Test {
  protected:
    /// The instances of a class as the broker hands them out; good while the test runs.
    template <class Interface>
    std::vector<Interface*> find(const std::string& className) const {
        std::vector<Interface*> found;
        for (core::CimInstance* instance :
             core::InstanceRange(core::GetCimBroker()->getInstances(className, ""))) {
            found.push_back(dynamic_cast<Interface*>(instance));
            EXPECT_NE(found.back(), nullptr) << "the interface must be reachable from another library";
        }
        return found;
    }

    /// A property as text; "-" when it is null or not there. Elements of an array are joined by ", ".
    static std::string text(const core::InstanceValue& instance, const char* property) {
        const core::PropertyValue* const found = instance.find(property);
        if (found == nullptr || found->value.isNull()) return "-";
        if (!found->value.isArray) return core::scalarText(found->value.type, *found->value.scalar());
        std::string joined;
        for (const core::CimScalar& element : *found->value.elements()) {
            joined += (joined.empty() ? "" : ", ") + core::scalarText(found->value.type, element);
        }
        return joined;
    }

    /// For each instance of the class, the properties' texts, separated by "; ".
    std::vector<std::string> table(const std::string& className,
                                   const std::vector<const char*>& properties) const {
        std::vector<std::string> rows;
        for (const core::InstanceValue& instance : requests.enumerateInstances(className)) {
            std::string row;
            for (const char* property : properties)
                row += (row.empty() ? "" : "; ") + text(instance, property);
            rows.push_back(row);
        }
        return rows;
    }

    const core::CimRequests requests{"root/cimv2"};

  private:
    const test::ProviderLibrary m_library{QUENX_SOFTWARE_INVENTORY};
};
