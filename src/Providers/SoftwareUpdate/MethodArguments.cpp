// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareUpdate/MethodArguments.h"

#include "Framework/Classes/CimBroker.h"
#include "Framework/Classes/InstanceList.h"
#include "Framework/Model/CimInstance.h"
#include "Framework/Model/CimProperties.h"
#include "Framework/Model/CimPropertyRef.h"
#include "Providers/Schema/InventoryInterfaces.h"
#include "Utils/Log.h"
#include "Utils/Utils.h"

namespace {

template <class Kind = core::CimProperty>
Kind& require(const core::CimPropertyList& arguments, const char* name) {
    auto* argument = dynamic_cast<Kind*>(arguments.getPropertyByName(name));
    if (argument == nullptr) throw utils::EUnspecifiedError(utils::formatStr("Expected %s argument", name));
    return *argument;
}

/// The instance that the path names; null when there is none, also when the look-up throws.
core::CimInstance* findInstance(core::CimPath path) noexcept {
    try {
        return core::GetCimBroker()->getInstanceByPath(path);
    } catch (...) {
        return nullptr;
    }
}

/// The class's instances, of any provider; none when the look-up throws.
core::InstanceRange findInstances(const char* className) {
    try {
        return core::InstanceRange(core::GetCimBroker()->getInstances(className, ""));
    } catch (...) {
        return core::InstanceRange(core::InstanceList().getElements(false));
    }
}

/// The first port of the controller; empty when it has none.
std::string firstPortOf(const core::CimInstance& controllerInstance) {
    const auto* controller = dynamic_cast<const inventory::PortController*>(&controllerInstance);
    // Somebody else may serve the class without the interface.
    if (controller == nullptr) return {};
    for (const core::CimInstance* each : findInstances("Quenx_EthernetPort")) {
        const auto* port = dynamic_cast<const inventory::EthernetPort*>(each);
        if (port != nullptr && controller->holds(port->getPCIAddress())) return port->getAdapterName();
    }
    return {};
}

/// The URI of the file that the resources serve under the identifier. Where several have it, the last one
/// counts: clients have come to rely on it.
std::string findUri(const std::string& identifier) {
    std::string uri;
    try {
        for (const core::CimInstance* each : findInstances("Quenx_SoftwareIdentityResource")) {
            const auto* resource = dynamic_cast<const inventory::SoftwareIdentityResource*>(each);
            if (resource != nullptr && resource->getFirmwareFileID() == identifier)
                uri = resource->getAccessInfo();
        }
    } catch (...) {
        // To a client, a resource that cannot say where its file is has no file.
        return {};
    }
    return uri;
}

std::string join(const utils::StringArray& names) {
    std::string text;
    for (const std::string& name : names) {
        if (&name != &names.front()) text += InstallOption::kTargetTypeSeparator;
        text += name;
    }
    return text;
}

/// The identity, if it is one of a firmware image; null, with a line in the log, if not.
const inventory::SoftwareIdentity* imageIdentity(const MethodTraits& method, const core::CimPath& source) {
    const core::CimInstance* instance = findInstance(source);
    if (instance == nullptr) {
        QUENX_DEBUG("%s cannot find instance '%s'", method.subject, source.toString().c_str());
        return nullptr;
    }
    const auto* identity = dynamic_cast<const inventory::SoftwareIdentity*>(instance);
    // A class that derives from the identity, or only borrows its name, may mean something else by it.
    if (instance->getClassName() != "Quenx_SoftwareIdentity" || identity == nullptr) {
        QUENX_DEBUG("%s does not support source '%s'", method.subject, source.toString().c_str());
        return nullptr;
    }
    if (identity->getTypeCode() != inventory::SoftwareIdentity::FirmwareImage) {
        QUENX_DEBUG("%s does not support source '%s'. It is not a proper Firmware Image.", method.subject,
                    source.toString().c_str());
        return nullptr;
    }
    return identity;
}

}  // namespace

void MethodArguments::requirePresent(std::initializer_list<const char*> names) const {
    for (const char* name : names)
        require(m_arguments, name);
}

void MethodArguments::requireNotNull(std::initializer_list<const char*> names) const {
    for (const char* name : names) {
        if (!isNull(name)) continue;
        throw utils::EUnspecifiedError(
            utils::formatStr("%s argument is set to NULL. It is not allowed", name));
    }
}

bool MethodArguments::isNull(const char* name) const {
    return require(m_arguments, name).IsNull();
}

std::string MethodArguments::text(const char* name) const {
    return require<core::CimPropertyString>(m_arguments, name).get();
}

std::vector<std::uint16_t> MethodArguments::codes(const char* name) const {
    return require<core::CimPropertyUint16_arr>(m_arguments, name).get();
}

std::vector<std::string> MethodArguments::texts(const char* name) const {
    return require<core::CimPropertyString_arr>(m_arguments, name).get();
}

core::CimPath MethodArguments::path(const char* name) const {
    return require<core::CimPropertyRef>(m_arguments, name).getPath();
}

void MethodArguments::setCodes(const char* name, std::vector<std::uint16_t> codes) const {
    require<core::CimPropertyUint16_arr>(m_arguments, name) = std::move(codes);
}

ResolvedTarget resolveTarget(const MethodTraits& method, const core::CimPath& target) {
    const core::CimInstance* instance = findInstance(target);
    if (instance == nullptr) {
        QUENX_DEBUG("%s cannot find instance '%s'", method.subject, target.toString().c_str());
        return {MethodReturn::InvalidParameter, {}};
    }
    std::string adapterName;
    const std::string className = instance->getClassName();
    if (className == "Quenx_PortController") {
        adapterName = firstPortOf(*instance);
    } else if (className == "Quenx_EthernetPort") {
        const auto* port = dynamic_cast<const inventory::EthernetPort*>(instance);
        if (port != nullptr) adapterName = port->getAdapterName();
    } else {
        QUENX_DEBUG("Firmware Update does not support target '%s'", target.toString().c_str());
        return {MethodReturn::NotApplicable, {}};
    }
    if (adapterName.empty()) {
        QUENX_DEBUG("Firmware Update does not support instance '%s'", target.toString().c_str());
        return {MethodReturn::InvalidParameter, {}};
    }
    return {0, std::move(adapterName)};
}

ResolvedSource resolveSource(const MethodTraits& method, const core::CimPath& source) {
    const inventory::SoftwareIdentity* identity = imageIdentity(method, source);
    if (identity == nullptr) return {MethodReturn::InvalidParameter, {}, {}};
    const std::string identifier = identity->getIdentifier();
    std::string uri = findUri(identifier);
    if (uri.empty()) {
        QUENX_DEBUG("Could not obtain URI from the SoftwareIdentityResource (%s)", identifier.c_str());
        return {MethodReturn::InvalidParameter, {}, {}};
    }
    QUENX_DEBUG("URI is: %s", uri.c_str());
    std::string targetTypes = join(identity->getTargetTypes());
    if (targetTypes.empty()) {
        QUENX_DEBUG("Source '%s' does not contain any TargetTypes", source.toString().c_str());
        return {MethodReturn::InvalidParameter, {}, {}};
    }
    QUENX_DEBUG("TargetTypes are: %s", targetTypes.c_str());
    return {0, std::move(uri), std::move(targetTypes)};
}
