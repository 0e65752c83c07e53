// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareUpdate/MethodArguments.h"

#include "Framework/Model/CimProperty.h"
#include "Providers/ClassObjects.h"
#include "Providers/Schema/ProviderInterfaces.h"
#include "Providers/SoftwareUpdate/UpdateReport.h"
#include "Utils/Utils.h"

void refuseArguments(const std::string& text) {
    core::NotedCall::noteReason(core::ReasonId::ArgumentsWrong);
    throw utils::EUnspecifiedError(text);
}

namespace {

using Id = core::ReasonId;

template <class Kind = core::CimProperty>
Kind& require(const core::CimPropertyList& arguments, const char* name) {
    auto* argument = dynamic_cast<Kind*>(arguments.getPropertyByName(name));
    if (argument == nullptr) refuseArguments(utils::formatStr("Expected %s argument", name));
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

/// The class's instances, of any provider; none when the look-up throws. The request's scope holds them.
template <class T>
std::vector<const T*> findInstances(const char* className) {
    try {
        const InstancesOf<const T> found(className);
        return std::vector<const T*>(found.begin(), found.end());
    } catch (...) {
        return {};
    }
}

/// The first port of the controller; empty when it has none.
std::string firstPortOf(const core::CimInstance& controllerInstance) {
    const auto* controller = dynamic_cast<const inventory::PortController*>(&controllerInstance);
    // Somebody else may serve the class without the interface.
    if (controller == nullptr) return {};
    for (const auto* port : findInstances<inventory::EthernetPort>("Quenx_EthernetPort"))
        if (controller->holds(port->getPCIAddress())) return port->getAdapterName();
    return {};
}

/// The URI of the file that the resources serve under the identifier. Where several have it, the last one
/// counts: clients have come to rely on it.
std::string findUri(const std::string& identifier) {
    std::string uri;
    try {
        const char* className = "Quenx_SoftwareIdentityResource";
        for (const auto* resource : findInstances<inventory::SoftwareIdentityResource>(className))
            if (resource->getFirmwareFileID() == identifier) uri = resource->getAccessInfo();
    } catch (...) {
        // To a client, a resource that cannot say where its file is has no file.
        return {};
    }
    return uri;
}

/// The identity, if it is one of a firmware image; null, with a line in the log, if not.
const inventory::SoftwareIdentity* imageIdentity(const MethodKind& kind, const core::CimPath& source) {
    const core::CimInstance* instance = findInstance(source);
    const std::string path = source.toString();
    if (instance == nullptr) {
        QUENX_DEBUG("%s cannot find instance '%s'", kind.subject, path.c_str());
        UpdateReport::noteReason(Id::SourceUnknown, "There is no image " + path);
        return nullptr;
    }
    const auto* identity = dynamic_cast<const inventory::SoftwareIdentity*>(instance);
    // A class that derives from the identity, or only borrows its name, may mean something else by it.
    if (instance->getClassName() != "Quenx_SoftwareIdentity" || identity == nullptr) {
        QUENX_DEBUG("%s does not support source '%s'", kind.subject, path.c_str());
        UpdateReport::noteReason(Id::SourceNoIdentity, "This is no software identity: " + path);
        return nullptr;
    }
    if (identity->getTypeCode() != inventory::SoftwareIdentity::FirmwareImage) {
        QUENX_DEBUG("%s does not support source '%s'. It is not a proper Firmware Image.", kind.subject,
                    path.c_str());
        UpdateReport::noteReason(Id::SourceNoImage, "This identity is no image to install: " + path);
        return nullptr;
    }
    return identity;
}

/// These two complete the order; they return what the method returns at once, if anything.
std::optional<unsigned int> resolveSource(const MethodKind& kind, const core::CimPath& source,
                                          UpdateOrder& order) {
    const inventory::SoftwareIdentity* identity = imageIdentity(kind, source);
    if (identity == nullptr) return MethodReturn::InvalidParameter;
    const std::string identifier = identity->getIdentifier();
    order.uri = findUri(identifier);
    if (order.uri.empty()) {
        QUENX_DEBUG("Could not obtain URI from the SoftwareIdentityResource (%s)", identifier.c_str());
        UpdateReport::noteReason(Id::SourceWithoutFile, "There is no file of the identity " + identifier);
        return MethodReturn::InvalidParameter;
    }
    QUENX_DEBUG("URI is: %s", order.uri.c_str());
    const std::string targetTypes =
        utils::joined(identity->getTargetTypes(), {&InstallOption::kTargetTypeSeparator, 1});
    if (targetTypes.empty()) {
        QUENX_DEBUG("Source '%s' does not contain any TargetTypes", source.toString().c_str());
        UpdateReport::noteReason(Id::SourceWithoutTypes, "The identity has no image types");
        return MethodReturn::InvalidParameter;
    }
    QUENX_DEBUG("TargetTypes are: %s", targetTypes.c_str());
    order.options.insert(order.options.begin(), InstallOption::TargetTypes);
    order.values.insert(order.values.begin(), targetTypes);
    return std::nullopt;
}

std::optional<unsigned int> resolveTarget(const MethodKind& kind, const core::CimPath& target,
                                          UpdateOrder& order) {
    const core::CimInstance* instance = findInstance(target);
    const std::string path = target.toString();
    if (instance == nullptr) {
        QUENX_DEBUG("%s cannot find instance '%s'", kind.subject, path.c_str());
        UpdateReport::noteReason(Id::TargetUnknown, "There is no target " + path);
        return MethodReturn::InvalidParameter;
    }
    const std::string className = instance->getClassName();
    if (className == "Quenx_PortController") {
        order.adapterName = firstPortOf(*instance);
    } else if (className == "Quenx_EthernetPort") {
        const auto* port = dynamic_cast<const inventory::EthernetPort*>(instance);
        if (port != nullptr) order.adapterName = port->getAdapterName();
    } else {
        QUENX_DEBUG("Firmware Update does not support target '%s'", path.c_str());
        UpdateReport::noteReason(Id::TargetOfOtherKind, "The target is neither a port nor a card: " + path);
        return MethodReturn::NotApplicable;
    }
    if (order.adapterName.empty()) {
        QUENX_DEBUG("Firmware Update does not support instance '%s'", path.c_str());
        UpdateReport::noteReason(Id::TargetWithoutAdapter, "The target has no adapter: " + path);
        return MethodReturn::InvalidParameter;
    }
    return std::nullopt;
}

}  // namespace

void MethodArguments::requirePresent(std::initializer_list<const char*> names) const {
    for (const char* name : names)
        require(m_arguments, name);
}

void MethodArguments::requireNotNull(std::initializer_list<const char*> names) const {
    for (const char* name : names) {
        if (!isNull(name)) continue;
        refuseArguments(utils::formatStr("%s argument is set to NULL. It is not allowed", name));
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

std::optional<unsigned int> resolve(const MethodKind& kind, const core::CimPath* source,
                                    const core::CimPath& target, UpdateOrder& order) {
    try {
        if (source != nullptr)
            if (const auto refused = resolveSource(kind, *source, order)) return refused;
        return resolveTarget(kind, target, order);
    } catch (...) {
        // The failures of other providers never leave a method.
        QUENX_DEBUG("Unspecified Error for '%s'", target.toString().c_str());
        UpdateReport::noteReason(Id::LookUpFailed, "Source or target could not be looked up");
        return MethodReturn::UnspecifiedError;
    }
}
