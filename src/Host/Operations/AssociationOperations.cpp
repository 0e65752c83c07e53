// SPDX-License-Identifier: Apache-2.0
#include "Host/Operations/Operations.h"

namespace host {

namespace {

using cimxml::IntrinsicResult;
using cimxml::ResultKind;

/// The object is called InstanceName by the operations that open an enumeration.
core::CimPath sourceOf(const OperationContext& context, const Parameters& parameters) {
    const std::string_view name = parameters.isGiven("ObjectName") ? "ObjectName" : "InstanceName";
    if (parameters.isClassName(name)) {
        requireClass(context.target, parameters.className(name), core::CimStatus::InvalidClass);
        throw core::CimError(core::CimStatus::NotSupported, "associations of classes are not served");
    }
    return parameters.path(name);
}

core::AssociationFilter filterOf(const Parameters& parameters) {
    return {parameters.className("AssocClass"), parameters.className("ResultClass"), parameters.text("Role"),
            parameters.text("ResultRole")};
}

IntrinsicResult objects(const OperationContext& context, const Parameters& parameters,
                        std::vector<core::InstanceValue> instances) {
    IntrinsicResult result;
    result.kind = ResultKind::ObjectsWithPath;
    result.instances = std::move(instances);
    if (parameters.flag("IncludeClassOrigin", false)) addOrigins(context.target, result);
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
    return objects(context, parameters,
                   context.target.associators(source, filterOf(parameters), parameters.list("PropertyList")));
}

IntrinsicResult associatorNames(const OperationContext& context, const Parameters& parameters) {
    const core::CimPath source = sourceOf(context, parameters);
    return objectPaths(context.target.associatorNames(source, filterOf(parameters)));
}

IntrinsicResult references(const OperationContext& context, const Parameters& parameters) {
    const core::CimPath source = sourceOf(context, parameters);
    return objects(context, parameters,
                   context.target.references(source, filterOf(parameters), parameters.list("PropertyList")));
}

IntrinsicResult referenceNames(const OperationContext& context, const Parameters& parameters) {
    const core::CimPath source = sourceOf(context, parameters);
    return objectPaths(context.target.referenceNames(source, filterOf(parameters)));
}

}  // namespace host
