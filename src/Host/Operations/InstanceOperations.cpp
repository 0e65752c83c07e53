// SPDX-License-Identifier: Apache-2.0
#include "CimXml/InstanceStream.h"
#include "Host/Operations/Operations.h"
#include "Indications/Subscriptions/Subscriptions.h"

namespace host {

namespace {

using cimxml::IntrinsicResult;
using cimxml::ResultKind;
using core::CimError;
using core::CimStatus;

/// The properties of the named class only, narrowed by the client's list. Instances of subclasses are
/// answered too, without the properties that the subclasses add (DSP0200 5.4.2.4).
core::PropertyFilter shallowFilter(const core::ClassChain& chain, const core::PropertyFilter& wanted) {
    const core::WantedProperties filter(wanted);
    std::vector<std::string> names;
    for (const auto& declaration : chain) {
        for (const core::PropertyDeclaration& property : declaration->properties) {
            if (filter.includes(property.name)) names.push_back(property.name);
        }
    }
    return names;
}

/// The class that first declared each property. A chain ends with the root, so the last one named is the
/// first.
std::map<std::string, std::string> originsOf(const core::ClassChain& chain) {
    std::map<std::string, std::string> origins;
    for (const auto& declaration : chain) {
        for (const core::PropertyDeclaration& property : declaration->properties)
            origins[core::foldName(property.name)] = declaration->name;
    }
    return origins;
}

// LocalOnly and IncludeQualifiers are accepted and change nothing: DSP0200 5.4.2.2 deprecates them for
// instances, and lets a server return all properties, and none of the qualifiers.

IntrinsicResult instancesResult(const OperationContext& context, const Parameters& parameters,
                                ResultKind kind, std::vector<core::InstanceValue> instances) {
    IntrinsicResult result{.kind = kind, .instances = std::move(instances)};
    if (!parameters.flag("IncludeClassOrigin", false)) return result;
    // By class, since a list may hold thousands of instances of a few classes.
    auto origins = std::make_shared<cimxml::Origins>();
    for (const core::InstanceValue& instance : result.instances) {
        const std::string& name = instance.path.getClassName();
        const auto [entry, isNew] = origins->try_emplace(core::foldName(name));
        if (isNew) entry->second = originsOf(context.target.getClass(name));
    }
    result.origins = std::move(origins);
    return result;
}

/// The object whose neighbours are asked for; the operations that open an enumeration call it InstanceName.
core::CimPath sourceOf(const OperationContext& context, const Parameters& parameters) {
    const std::string_view name = parameters.isGiven("ObjectName") ? "ObjectName" : "InstanceName";
    if (parameters.isClassName(name)) {
        requireClass(context.target, parameters.className(name), CimStatus::InvalidClass);
        throw CimError(CimStatus::NotSupported, "associations of classes are not served");
    }
    return parameters.path(name);
}

core::InstanceValue valueOf(const cimxml::InstanceBody& body, core::CimPath path) {
    if (!body.mistypedProperty.empty()) {
        throw CimError(CimStatus::TypeMismatch,
                       "property " + body.mistypedProperty + " does not hold a value of its stated type");
    }
    return {std::move(path), body.properties};
}

core::AssociationFilter filterOf(const Parameters& parameters) {
    return {parameters.className("AssocClass"), parameters.className("ResultClass"), parameters.text("Role"),
            parameters.text("ResultRole")};
}

}  // namespace

IntrinsicResult getInstance(const OperationContext& context, const Parameters& parameters) {
    const core::CimPath path = parameters.path("InstanceName");
    const core::PropertyFilter filter = parameters.list("PropertyList");
    if (context.stream != nullptr && !parameters.flag("IncludeClassOrigin", false)) {
        context.stream->setKind(ResultKind::Instance);
        context.target.streamInstance(path, filter, *context.stream);
        return {.kind = ResultKind::Instance, .isStreamed = true};
    }
    return instancesResult(context, parameters, ResultKind::Instance,
                           {context.target.getInstance(path, filter)});
}

IntrinsicResult enumerateInstances(const OperationContext& context, const Parameters& parameters) {
    const std::string className = parameters.className("ClassName");
    core::PropertyFilter filter = parameters.list("PropertyList");
    if (!parameters.flag("DeepInheritance", true))
        filter = shallowFilter(context.target.getClass(className), filter);
    if (context.stream != nullptr && !parameters.flag("IncludeClassOrigin", false)) {
        context.target.streamInstances(className, filter, *context.stream);
        return {.kind = ResultKind::NamedInstances, .isStreamed = true};
    }
    return instancesResult(context, parameters, ResultKind::NamedInstances,
                           context.target.enumerateInstances(className, filter));
}

IntrinsicResult enumerateInstanceNames(const OperationContext& context, const Parameters& parameters) {
    return {.kind = ResultKind::InstanceNames,
            .paths = context.target.enumerateInstanceNames(parameters.className("ClassName"))};
}

IntrinsicResult deleteInstance(const OperationContext& context, const Parameters& parameters) {
    context.target.deleteInstance(parameters.path("InstanceName"));
    return {};
}

IntrinsicResult createInstance(const OperationContext& context, const Parameters& parameters) {
    const cimxml::InstanceBody& body = parameters.instance("NewInstance");
    if (indications::Subscriptions::serves(body.className) &&
        context.target.getClass(body.className).empty()) {
        throw CimError(CimStatus::NotSupported,
                       "subscriptions are not made in " + context.target.getNamespace() + ", but in interop");
    }
    return {.kind = ResultKind::InstanceNames,
            .paths = {context.target.createInstance(valueOf(body, core::CimPath(body.className, {})))}};
}

IntrinsicResult modifyInstance(const OperationContext& context, const Parameters& parameters) {
    const cimxml::InstanceBody& body = parameters.instance("ModifiedInstance");
    if (!body.path) throw CimError(CimStatus::InvalidParameter, "ModifiedInstance names no instance");
    context.target.modifyInstance(valueOf(body, *body.path), parameters.list("PropertyList"));
    return {};
}

IntrinsicResult associators(const OperationContext& context, const Parameters& parameters) {
    const core::CimPath source = sourceOf(context, parameters);
    return instancesResult(
        context, parameters, ResultKind::ObjectsWithPath,
        context.target.associators(source, filterOf(parameters), parameters.list("PropertyList")));
}

IntrinsicResult associatorNames(const OperationContext& context, const Parameters& parameters) {
    const core::CimPath source = sourceOf(context, parameters);
    return {.kind = ResultKind::ObjectPaths,
            .paths = context.target.associatorNames(source, filterOf(parameters))};
}

IntrinsicResult references(const OperationContext& context, const Parameters& parameters) {
    const core::CimPath source = sourceOf(context, parameters);
    return instancesResult(
        context, parameters, ResultKind::ObjectsWithPath,
        context.target.references(source, filterOf(parameters), parameters.list("PropertyList")));
}

IntrinsicResult referenceNames(const OperationContext& context, const Parameters& parameters) {
    const core::CimPath source = sourceOf(context, parameters);
    return {.kind = ResultKind::ObjectPaths,
            .paths = context.target.referenceNames(source, filterOf(parameters))};
}

}  // namespace host
