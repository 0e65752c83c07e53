// SPDX-License-Identifier: Apache-2.0
#include <algorithm>

#include "Host/Operations/ClassAnswer.h"
#include "Host/Operations/Operations.h"

namespace host {

namespace {

using cimxml::IntrinsicResult;
using cimxml::ResultKind;

const core::PropertyFilter kNoProperties{std::vector<std::string>()};

/// The properties of the named class only, narrowed by the client's list.
core::PropertyFilter shallowFilter(const core::ClassChain& chain, const core::PropertyFilter& wanted) {
    std::vector<std::string> names = propertyNames(chain);
    std::erase_if(names, [&](const std::string& name) { return !core::isWanted(wanted, name); });
    return names;
}

}  // namespace

void addOrigins(core::CimOperations& target, IntrinsicResult& result) {
    auto origins = std::make_shared<cimxml::Origins>();
    for (const core::InstanceValue& instance : result.instances) {
        const std::string& name = instance.path.getClassName();
        const auto [entry, isNew] = origins->try_emplace(core::foldName(name));
        if (isNew) entry->second = originsOf(target.getClass(name));
    }
    result.origins = std::move(origins);
}

IntrinsicResult getInstance(const OperationContext& context, const Parameters& parameters) {
    IntrinsicResult result;
    result.kind = ResultKind::Instance;
    result.instances.push_back(
        context.target.getInstance(parameters.path("InstanceName"), parameters.list("PropertyList")));
    if (parameters.flag("IncludeClassOrigin", false)) addOrigins(context.target, result);
    return result;
}

IntrinsicResult enumerateInstances(const OperationContext& context, const Parameters& parameters) {
    IntrinsicResult result;
    result.kind = ResultKind::NamedInstances;
    const std::string className = parameters.className("ClassName");
    core::PropertyFilter filter = parameters.list("PropertyList");
    if (!parameters.flag("DeepInheritance", true))
        filter = shallowFilter(context.target.getClass(className), filter);
    result.instances = context.target.enumerateInstances(className, filter);
    if (parameters.flag("IncludeClassOrigin", false)) addOrigins(context.target, result);
    return result;
}

IntrinsicResult enumerateInstanceNames(const OperationContext& context, const Parameters& parameters) {
    IntrinsicResult result;
    result.kind = ResultKind::InstanceNames;
    result.paths = context.target.enumerateInstanceNames(parameters.className("ClassName"));
    return result;
}

IntrinsicResult deleteInstance(const OperationContext& context, const Parameters& parameters) {
    context.target.deleteInstance(parameters.path("InstanceName"));
    return {};
}

IntrinsicResult createInstance(const OperationContext& context, const Parameters& parameters) {
    const std::string& className = parameters.instance("NewInstance")->className;
    requireClass(context.target, className, core::CimStatus::InvalidClass);
    throw core::CimError(core::CimStatus::NotSupported, "instances of " + className + " cannot be created");
}

IntrinsicResult modifyInstance(const OperationContext& context, const Parameters& parameters) {
    const cimxml::InstanceBody& body = *parameters.instance("ModifiedInstance");
    if (!body.path) {
        throw core::CimError(core::CimStatus::InvalidParameter, "ModifiedInstance names no instance");
    }
    // A client that is wrong about the instance hears that first.
    context.target.getInstance(*body.path, kNoProperties);
    throw core::CimError(core::CimStatus::NotSupported,
                         "instances of " + body.path->getClassName() + " cannot be modified");
}

}  // namespace host
