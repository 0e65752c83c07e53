// SPDX-License-Identifier: Apache-2.0
// What the object manager serves of itself: CIM_ObjectManager, and one CIM_Namespace for each namespace. No
// provider has these classes, so they are declared here, with the properties that are filled in alone.
#include "Host/Operations/InteropNamespace.h"
#include "Indications/Subscriptions/Classes.h"

namespace host {

namespace {

using core::CimType;
using core::CimValue;
using core::PropertyDeclaration;

constexpr const char* kManager = "CIM_ObjectManager";
constexpr const char* kNamespace = "CIM_Namespace";
// Part of the path of CIM_ObjectManager, so it stays what it is.
constexpr const char* kManagerName = "quenx-cimd";

PropertyDeclaration property(const char* name, CimType type) {
    return {name, type, false, false, ""};
}
PropertyDeclaration text(const char* name) {
    return property(name, CimType::String);
}
PropertyDeclaration key(const char* name) {
    return {name, CimType::String, false, true, ""};
}

core::ClassDeclaration declare(const char* name, const char* superclass,
                               std::vector<PropertyDeclaration> properties = {}) {
    return {name, superclass, false, std::move(properties), {}};
}

std::vector<core::ClassDeclaration> declarations() {
    const PropertyDeclaration states{"OperationalStatus", CimType::Uint16, true, false, ""};
    std::vector<core::ClassDeclaration> all{
        declare("CIM_ManagedElement", "", {text("Caption"), text("Description"), text("ElementName")}),
        declare("CIM_ManagedSystemElement", "CIM_ManagedElement", {text("Name"), states}),
        declare("CIM_LogicalElement", "CIM_ManagedSystemElement"),
        declare("CIM_EnabledLogicalElement", "CIM_LogicalElement",
                {property("EnabledState", CimType::Uint16)}),
        declare("CIM_Service", "CIM_EnabledLogicalElement",
                {key("SystemCreationClassName"), key("SystemName"), key("CreationClassName"), key("Name"),
                 property("Started", CimType::Boolean)}),
        declare("CIM_WBEMService", "CIM_Service"),
        declare(kManager, "CIM_WBEMService", {text("Version")}),
        declare(kNamespace, "CIM_ManagedElement",
                {key("SystemCreationClassName"), key("SystemName"), key("ObjectManagerCreationClassName"),
                 key("ObjectManagerName"), key("CreationClassName"), key("Name"),
                 property("ClassInfo", CimType::Uint16)})};
    for (core::ClassDeclaration& each : indications::subscriptionClasses())
        all.push_back(std::move(each));
    for (core::ClassDeclaration& each : all)
        core::addImpliedQualifiers(each);
    return all;
}

using Texts = std::vector<std::pair<const char*, std::string>>;
using Values = std::vector<std::pair<const char*, CimValue>>;

/// An instance whose keys are texts.
core::InstanceValue makeInstance(const char* className, const Texts& keys, const Values& others) {
    core::InstanceValue instance;
    std::vector<core::CimKey> pathKeys;
    for (const auto& [name, value] : keys) {
        pathKeys.push_back({name, value});
        instance.properties.push_back({name, CimValue::of(CimType::String, value), true, ""});
    }
    for (const auto& [name, value] : others)
        instance.properties.push_back({name, value, false, ""});
    instance.path = core::CimPath(className, std::move(pathKeys));
    return instance;
}

core::InstanceValue objectManager(const std::string& systemName) {
    const auto textOf = [](const char* value) { return CimValue::of(CimType::String, std::string(value)); };
    constexpr std::uint64_t kEnabled = 2;
    constexpr std::uint64_t kOk = 2;
    return makeInstance(kManager,
                        {{"SystemCreationClassName", "CIM_ComputerSystem"},
                         {"SystemName", systemName},
                         {"CreationClassName", kManager},
                         {"Name", kManagerName}},
                        {{"ElementName", textOf("Quenx object manager")},
                         {"Description", textOf("Serves firmware updates of Ethernet adapters over CIM-XML")},
                         {"Version", textOf(QUENX_VERSION)},
                         {"Started", CimValue::of(CimType::Boolean, true)},
                         {"EnabledState", CimValue::of(CimType::Uint16, kEnabled)},
                         {"OperationalStatus", CimValue::arrayOf(CimType::Uint16, {kOk})}});
}

core::InstanceValue namespaceInstance(const std::string& systemName, const std::string& name) {
    constexpr std::uint64_t kUnknownClasses = 0;  // deprecated in the schema, but still required
    return makeInstance(kNamespace,
                        {{"SystemCreationClassName", "CIM_ComputerSystem"},
                         {"SystemName", systemName},
                         {"ObjectManagerCreationClassName", kManager},
                         {"ObjectManagerName", kManagerName},
                         {"CreationClassName", kNamespace},
                         {"Name", name}},
                        {{"ClassInfo", CimValue::of(CimType::Uint16, kUnknownClasses)}});
}

}  // namespace

InteropModel::InteropModel(const std::vector<std::string>& namespaces, const std::string& systemName)
    : classes(core::chainsOf(declarations())), instances{objectManager(systemName)} {
    for (const std::string& name : namespaces)
        instances.push_back(namespaceInstance(systemName, name));
}

}  // namespace host
