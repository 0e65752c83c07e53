// SPDX-License-Identifier: Apache-2.0
#include <algorithm>

#include "Host/Operations/Operations.h"

namespace host {

namespace {

using cimxml::IntrinsicResult;
using cimxml::ResultKind;

/// An operation that opens an enumeration: what it enumerates, and in which form the objects go out.
struct Opening {
    std::string_view name;
    OperationHandler handler;
    ResultKind kind;
};

constexpr Opening kOpenings[] = {
    {"OpenEnumerateInstances", enumerateInstances, ResultKind::InstancesWithPath},
    {"OpenEnumerateInstancePaths", enumerateInstanceNames, ResultKind::InstancePaths},
    {"OpenAssociatorInstances", associators, ResultKind::InstancesWithPath},
    {"OpenAssociatorInstancePaths", associatorNames, ResultKind::InstancePaths},
    {"OpenReferenceInstances", references, ResultKind::InstancesWithPath},
    {"OpenReferenceInstancePaths", referenceNames, ResultKind::InstancePaths}};

PullOwner ownerOf(const OperationContext& context, ResultKind kind) {
    return {core::foldName(context.target.getNamespace()), context.caller.user, kind};
}

void refuseFilters(const Parameters& parameters) {
    if (parameters.isGiven("FilterQueryLanguage") || parameters.isGiven("FilterQuery")) {
        throw core::CimError(core::CimStatus::FilteredEnumerationNotSupported,
                             "enumerations are not filtered");
    }
    if (parameters.flag("ContinueOnError", false)) {
        throw core::CimError(core::CimStatus::ContinuationOnErrorNotSupported,
                             "an enumeration ends with its first error");
    }
}

std::size_t countOf(const Parameters& parameters) {
    return parameters.number("MaxObjectCount").value_or(0);
}

}  // namespace

IntrinsicResult openEnumeration(const OperationContext& context, const Parameters& parameters) {
    refuseFilters(parameters);
    const auto* opening = std::find_if(std::begin(kOpenings), std::end(kOpenings),
                                       [&](const Opening& each) { return each.name == context.operation; });
    IntrinsicResult result = opening->handler(context, parameters);
    result.kind = opening->kind;
    return context.pulls.open(ownerOf(context, opening->kind), std::move(result), countOf(parameters),
                              parameters.number("OperationTimeout"));
}

IntrinsicResult pullEnumeration(const OperationContext& context, const Parameters& parameters) {
    // Only a query's enumeration is pulled by PullInstances, and none can be opened.
    const ResultKind kind = context.operation == "PullInstancesWithPath" ? ResultKind::InstancesWithPath
                            : context.operation == "PullInstancePaths"   ? ResultKind::InstancePaths
                                                                         : ResultKind::Nothing;
    return context.pulls.pull(ownerOf(context, kind), parameters.text("EnumerationContext"),
                              countOf(parameters));
}

IntrinsicResult closeEnumeration(const OperationContext& context, const Parameters& parameters) {
    context.pulls.close(ownerOf(context, ResultKind::Nothing), parameters.text("EnumerationContext"));
    return {};
}

}  // namespace host
