#include "Providers/SoftwareUpdate/InstanceLookup.h"

#include "Framework/Classes/CimBroker.h"
#include "Framework/Classes/InstanceList.h"
#include "Framework/Model/CimInstance.h"
#include "Providers/InventoryInterfaces.h"
#include "Providers/SoftwareUpdate/InstallOptions.h"
#include "Utils/Log.h"

namespace {

constexpr const char* kAnyProvider = "";

/// The first port of the controller; empty when it has none.
std::string firstPortOf(const core::CimInstance& controllerInstance) {
    const auto* controller = dynamic_cast<const inventory::PortController*>(&controllerInstance);
    if (controller == nullptr) return {};
    for (const core::CimInstance* each :
         core::InstanceRange(core::GetCimBroker()->getInstances("Quenx_EthernetPort", kAnyProvider))) {
        const auto* port = dynamic_cast<const inventory::EthernetPort*>(each);
        if (port != nullptr && controller->holds(port->getPCIAddress())) return port->getAdapterName();
    }
    return {};
}

/// The URI of the file that the resources serve under the identifier. The last match wins (intended).
std::string findUri(const std::string& identifier) {
    std::string uri;
    for (const core::CimInstance* each : core::InstanceRange(
             core::GetCimBroker()->getInstances("Quenx_SoftwareIdentityResource", kAnyProvider))) {
        const auto* resource = dynamic_cast<const inventory::SoftwareIdentityResource*>(each);
        if (resource != nullptr && resource->getFirmwareFileID() == identifier)
            uri = resource->getAccessInfo();
    }
    return uri;
}

/// What the look-up finds; nothing where it throws, for what cannot be looked up is not found.
template <class LookUp>
std::string found(LookUp&& lookUp) {
    try {
        return lookUp();
    } catch (...) {
        return {};
    }
}

std::string joined(const utils::StringArray& names) {
    std::string text;
    for (const std::string& name : names) {
        if (&name != &names.front()) text += InstallOption::TargetTypeSeparator;
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
    if (instance->getClassName() != "Quenx_SoftwareIdentity" || identity == nullptr) {
        QUENX_DEBUG("%s does not support source '%s'", method.subject, source.toString().c_str());
        return nullptr;
    }
    if (identity->getTypeCode() != inventory::SoftwareIdentity::FIRMWARE_IMAGE) {
        QUENX_DEBUG("%s does not support source '%s'. It is not a proper Firmware Image.", method.subject,
                    source.toString().c_str());
        return nullptr;
    }
    return identity;
}

}  // namespace

core::CimInstance* findInstance(core::CimPath path) noexcept {
    try {
        return core::GetCimBroker()->getInstanceByPath(path);
    } catch (...) {
        return nullptr;
    }
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
        adapterName = found([&] { return firstPortOf(*instance); });
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
    std::string uri = found([&] { return findUri(identifier); });
    if (uri.empty()) {
        QUENX_DEBUG("Could not obtain URI from the SoftwareIdentityResource (%s)", identifier.c_str());
        return {MethodReturn::InvalidParameter, {}, {}};
    }
    QUENX_DEBUG("URI is: %s", uri.c_str());
    std::string targetTypes = joined(identity->getTargetTypes());
    if (targetTypes.empty()) {
        QUENX_DEBUG("Source '%s' does not contain any TargetTypes", source.toString().c_str());
        return {MethodReturn::InvalidParameter, {}, {}};
    }
    QUENX_DEBUG("TargetTypes are: %s", targetTypes.c_str());
    return {0, std::move(uri), std::move(targetTypes)};
}
