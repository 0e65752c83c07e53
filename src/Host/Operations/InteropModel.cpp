// SPDX-License-Identifier: Apache-2.0
#include "Host/Operations/InteropModel.h"

#include <algorithm>

namespace host {

namespace {

using core::CimType;
using core::CimValue;
using core::ClassDeclaration;
using core::PropertyDeclaration;

constexpr const char* kManager = "CIM_ObjectManager";
constexpr const char* kNamespace = "CIM_Namespace";
constexpr const char* kManagerName = "quenx-cimd";

PropertyDeclaration text(const char* name) {
    return {name, CimType::String, false, false, ""};
}
PropertyDeclaration key(const char* name) {
    return {name, CimType::String, false, true, ""};
}
PropertyDeclaration number(const char* name) {
    return {name, CimType::Uint16, false, false, ""};
}

std::vector<ClassDeclaration> declarations() {
    const PropertyDeclaration started{"Started", CimType::Boolean, false, false, ""};
    const PropertyDeclaration states{"OperationalStatus", CimType::Uint16, true, false, ""};
    return {
        {"CIM_ManagedElement", "", false, {text("Caption"), text("Description"), text("ElementName")}, {}},
        {"CIM_ManagedSystemElement", "CIM_ManagedElement", false, {text("Name"), states}, {}},
        {"CIM_LogicalElement", "CIM_ManagedSystemElement", false, {}, {}},
        {"CIM_EnabledLogicalElement", "CIM_LogicalElement", false, {number("EnabledState")}, {}},
        {"CIM_Service",
         "CIM_EnabledLogicalElement",
         false,
         {key("SystemCreationClassName"), key("SystemName"), key("CreationClassName"), key("Name"), started},
         {}},
        {"CIM_WBEMService", "CIM_Service", false, {}, {}},
        {kManager, "CIM_WBEMService", false, {text("Version")}, {}},
        {kNamespace,
         "CIM_ManagedElement",
         false,
         {key("SystemCreationClassName"), key("SystemName"), key("ObjectManagerCreationClassName"),
          key("ObjectManagerName"), key("CreationClassName"), key("Name"), number("ClassInfo")},
         {}}};
}

/// Builds an instance row by row; what is a key also goes into the path.
class InstanceBuilder {
  public:
    explicit InstanceBuilder(std::string className) : m_className(std::move(className)) {}

    InstanceBuilder& key(const char* name, const std::string& value) {
        m_keys.push_back({name, value});
        m_instance.properties.push_back({name, CimValue::of(CimType::String, value), true, ""});
        return *this;
    }
    InstanceBuilder& text(const char* name, const std::string& value) {
        return add(name, CimValue::of(CimType::String, value));
    }
    InstanceBuilder& add(const char* name, CimValue value) {
        m_instance.properties.push_back({name, std::move(value), false, ""});
        return *this;
    }
    core::InstanceValue build() {
        m_instance.path = core::CimPath(m_className, std::move(m_keys));
        return std::move(m_instance);
    }

  private:
    std::string m_className;
    std::vector<core::CimKey> m_keys;
    core::InstanceValue m_instance;
};

std::vector<ClassDeclaration> qualifiedDeclarations() {
    std::vector<ClassDeclaration> all = declarations();
    for (ClassDeclaration& each : all)
        core::addImpliedQualifiers(each);
    return all;
}

}  // namespace

InteropModel::InteropModel(std::vector<std::string> namespaces, std::string systemName)
    : m_namespaces(std::move(namespaces)),
      m_systemName(std::move(systemName)),
      m_classes(core::chainsOf(qualifiedDeclarations())) {}

core::ClassChain InteropModel::findClass(const std::string& className) const {
    const auto found = std::find_if(m_classes.begin(), m_classes.end(), [&](const core::ClassChain& chain) {
        return core::sameName(chain.front()->name, className);
    });
    return found == m_classes.end() ? core::ClassChain() : *found;
}

std::vector<core::InstanceValue> InteropModel::instances(const std::string& namespaceName) const {
    std::vector<core::InstanceValue> result{objectManager()};
    for (const std::string& name : m_namespaces)
        result.push_back(namespaceInstance(name));
    for (core::InstanceValue& instance : result)
        instance.path.setNamespace(namespaceName);
    return result;
}

core::InstanceValue InteropModel::objectManager() const {
    return InstanceBuilder(kManager)
        .key("SystemCreationClassName", "CIM_ComputerSystem")
        .key("SystemName", m_systemName)
        .key("CreationClassName", kManager)
        .key("Name", kManagerName)
        .text("ElementName", "Quenx object manager")
        .text("Description", "Serves firmware updates of Ethernet adapters over CIM-XML")
        .text("Version", QUENX_VERSION)
        .add("Started", CimValue::of(CimType::Boolean, true))
        .add("EnabledState", CimValue::of(CimType::Uint16, std::uint64_t{2}))
        .add("OperationalStatus", CimValue::arrayOf(CimType::Uint16, {std::uint64_t{2}}))
        .build();
}

core::InstanceValue InteropModel::namespaceInstance(const std::string& name) const {
    return InstanceBuilder(kNamespace)
        .key("SystemCreationClassName", "CIM_ComputerSystem")
        .key("SystemName", m_systemName)
        .key("ObjectManagerCreationClassName", kManager)
        .key("ObjectManagerName", kManagerName)
        .key("CreationClassName", kNamespace)
        .key("Name", name)
        .add("ClassInfo", CimValue::of(CimType::Uint16, std::uint64_t{0}))
        .build();
}

}  // namespace host
