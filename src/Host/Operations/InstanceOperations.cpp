#include <algorithm>

#include "Host/Operations/ClassElements.h"
#include "Host/Operations/Handlers.h"
#include "Host/Operations/InstanceTools.h"
#include "Host/Operations/PathTyping.h"

namespace host {

namespace {

using cimxml::IntrinsicResult;
using cimxml::ResultKind;

/// The properties of the named class only, narrowed by the client's list.
core::PropertyFilter shallowFilter(const core::ClassChain& chain, const core::PropertyFilter& wanted) {
    std::vector<std::string> names = propertyNames(chain);
    if (!wanted) return names;
    std::erase_if(names, [&](const std::string& name) {
        return std::none_of(wanted->begin(), wanted->end(),
                            [&](const std::string& each) { return core::sameName(each, name); });
    });
    return names;
}

}  // namespace

core::CimPath instancePath(const OperationContext& context, const core::CimPath& path) {
    return typedPath(context.model, context.model.requireClass(path.getClassName()), path);
}

void addOrigins(const NamespaceModel& model, IntrinsicResult& result) {
    auto origins = std::make_shared<cimxml::Origins>();
    for (const core::InstanceValue& instance : result.instances) {
        const std::string& name = instance.path.getClassName();
        const auto [entry, isNew] = origins->try_emplace(core::foldName(name));
        if (isNew) entry->second = originsOf(model.findClass(name));
    }
    result.origins = std::move(origins);
}

IntrinsicResult getInstance(const OperationContext& context, const Parameters& parameters) {
    IntrinsicResult result;
    result.kind = ResultKind::Instance;
    const core::CimPath path = instancePath(context, parameters.path("InstanceName"));
    result.instances.push_back(context.model.getInstance(path, parameters.list("PropertyList")));
    if (parameters.flag("IncludeClassOrigin", false)) addOrigins(context.model, result);
    return result;
}

IntrinsicResult enumerateInstances(const OperationContext& context, const Parameters& parameters) {
    IntrinsicResult result;
    result.kind = ResultKind::NamedInstances;
    const std::string className = parameters.className("ClassName");
    const core::ClassChain chain = context.model.requireClass(className);
    core::PropertyFilter filter = parameters.list("PropertyList");
    if (!parameters.flag("DeepInheritance", true)) filter = shallowFilter(chain, filter);
    result.instances = context.model.enumerateInstances(className, filter);
    if (parameters.flag("IncludeClassOrigin", false)) addOrigins(context.model, result);
    return result;
}

IntrinsicResult enumerateInstanceNames(const OperationContext& context, const Parameters& parameters) {
    IntrinsicResult result;
    result.kind = ResultKind::InstanceNames;
    const std::string className = parameters.className("ClassName");
    context.model.requireClass(className);
    result.paths = context.model.enumerateInstanceNames(className);
    return result;
}

IntrinsicResult deleteInstance(const OperationContext& context, const Parameters& parameters) {
    context.model.deleteInstance(instancePath(context, parameters.path("InstanceName")));
    return {};
}

IntrinsicResult createInstance(const OperationContext& context, const Parameters& parameters) {
    const std::string& className = parameters.instance("NewInstance")->className;
    context.model.requireClass(className);
    throw core::CimError(core::CimStatus::NotSupported, "instances of " + className + " cannot be created");
}

IntrinsicResult modifyInstance(const OperationContext& context, const Parameters& parameters) {
    const cimxml::InstanceBody& body = *parameters.instance("ModifiedInstance");
    if (!body.path) {
        throw core::CimError(core::CimStatus::InvalidParameter, "ModifiedInstance names no instance");
    }
    const core::CimPath path = instancePath(context, *body.path);
    context.model.getInstance(path, core::PropertyFilter(std::vector<std::string>()));
    throw core::CimError(core::CimStatus::NotSupported,
                         "instances of " + path.getClassName() + " cannot be modified");
}

}  // namespace host
