#include "Host/Operations/Handlers.h"
#include "Host/Operations/InstanceTools.h"

namespace host {

namespace {

using cimxml::IntrinsicResult;
using cimxml::ResultKind;

/// The object is called InstanceName by the operations that open an enumeration.
core::CimPath sourceOf(const OperationContext& context, const Parameters& parameters) {
    const std::string_view name = parameters.isGiven("ObjectName") ? "ObjectName" : "InstanceName";
    if (parameters.isClassName(name)) {
        context.model.requireClass(parameters.className(name));
        throw core::CimError(core::CimStatus::NotSupported, "associations of classes are not served");
    }
    return instancePath(context, parameters.path(name));
}

core::AssociationFilter filterOf(const OperationContext& context, const Parameters& parameters) {
    core::AssociationFilter filter{parameters.className("AssocClass"), parameters.className("ResultClass"),
                                   parameters.text("Role"), parameters.text("ResultRole")};
    for (const std::string& name : {filter.associationClass, filter.resultClass}) {
        if (!name.empty() && !context.model.knowsClass(name)) {
            throw core::CimError(core::CimStatus::InvalidParameter, "no class \"" + name + "\"");
        }
    }
    return filter;
}

IntrinsicResult objects(const OperationContext& context, const Parameters& parameters,
                        std::vector<core::InstanceValue> instances) {
    IntrinsicResult result;
    result.kind = ResultKind::ObjectsWithPath;
    result.instances = std::move(instances);
    if (parameters.flag("IncludeClassOrigin", false)) addOrigins(context.model, result);
    return result;
}

IntrinsicResult objectPaths(std::vector<core::CimPath> paths) {
    IntrinsicResult result;
    result.kind = ResultKind::ObjectPaths;
    result.paths = std::move(paths);
    return result;
}

}  // namespace

IntrinsicResult associators(const OperationContext& context, const Parameters& parameters) {
    const core::CimPath source = sourceOf(context, parameters);
    return objects(
        context, parameters,
        context.model.associators(source, filterOf(context, parameters), parameters.list("PropertyList")));
}

IntrinsicResult associatorNames(const OperationContext& context, const Parameters& parameters) {
    const core::CimPath source = sourceOf(context, parameters);
    return objectPaths(context.model.associatorNames(source, filterOf(context, parameters)));
}

IntrinsicResult references(const OperationContext& context, const Parameters& parameters) {
    const core::CimPath source = sourceOf(context, parameters);
    return objects(
        context, parameters,
        context.model.references(source, filterOf(context, parameters), parameters.list("PropertyList")));
}

IntrinsicResult referenceNames(const OperationContext& context, const Parameters& parameters) {
    const core::CimPath source = sourceOf(context, parameters);
    return objectPaths(context.model.referenceNames(source, filterOf(context, parameters)));
}

}  // namespace host
