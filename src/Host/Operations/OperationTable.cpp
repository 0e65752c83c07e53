// SPDX-License-Identifier: Apache-2.0
#include "Host/Operations/Operations.h"

namespace host {

namespace {

using cimxml::IntrinsicResult;
using cimxml::ResultKind;
using core::CimError;
using core::CimStatus;
using Kind = ParameterKind;

constexpr auto kRead = Privilege::Read;
constexpr auto kAdminister = Privilege::Administer;
constexpr auto kInstances = ResultKind::InstancesWithPath;
constexpr auto kPaths = ResultKind::InstancePaths;

constexpr ParameterSpec kClass{"ClassName", Kind::ClassName};
constexpr ParameterSpec kRequiredClass{"ClassName", Kind::ClassName, true};
constexpr ParameterSpec kInstance{"InstanceName", Kind::InstanceName, true};
constexpr ParameterSpec kObject{"ObjectName", Kind::ObjectName, true};
constexpr ParameterSpec kLocalOnly{"LocalOnly", Kind::Boolean};
constexpr ParameterSpec kDeep{"DeepInheritance", Kind::Boolean};
constexpr ParameterSpec kQualifiers{"IncludeQualifiers", Kind::Boolean};
constexpr ParameterSpec kOrigin{"IncludeClassOrigin", Kind::Boolean};
constexpr ParameterSpec kProperties{"PropertyList", Kind::TextList};
constexpr ParameterSpec kAssociation{"AssocClass", Kind::ClassName};
constexpr ParameterSpec kResult{"ResultClass", Kind::ClassName};
constexpr ParameterSpec kRole{"Role", Kind::Text};
constexpr ParameterSpec kResultRole{"ResultRole", Kind::Text};
constexpr ParameterSpec kContext{"EnumerationContext", Kind::Text, true};
constexpr ParameterSpec kCount{"MaxObjectCount", Kind::Number};

/// The parameters of an operation that opens an enumeration: its own, and those that all of them share.
std::vector<ParameterSpec> opening(std::vector<ParameterSpec> own) {
    own.insert(own.end(), {{"FilterQueryLanguage", Kind::Text},
                           {"FilterQuery", Kind::Text},
                           {"OperationTimeout", Kind::Number},
                           {"ContinueOnError", Kind::Boolean},
                           kCount});
    return own;
}

EnumerationOwner ownerOf(const OperationContext& context) {
    return {core::foldName(context.target.getNamespace()), context.caller.user};
}

std::size_t countOf(const Parameters& parameters) {
    return parameters.number(kCount.name).value_or(0);
}

/// Enumerates as the handler does; the objects go out in pieces, in the form of the kind.
template <OperationHandler Handler, ResultKind Form>
IntrinsicResult open(const OperationContext& context, const Parameters& parameters) {
    if (parameters.isGiven("FilterQueryLanguage") || parameters.isGiven("FilterQuery"))
        throw CimError(CimStatus::FilteredEnumerationNotSupported, "enumerations are not filtered");
    if (parameters.flag("ContinueOnError", false)) {
        throw CimError(CimStatus::ContinuationOnErrorNotSupported,
                       "an enumeration ends with its first error");
    }
    OperationContext whole = context;
    whole.stream = nullptr;
    IntrinsicResult result = Handler(whole, parameters);
    result.kind = Form;
    return context.enumerations.open(ownerOf(context), std::move(result), countOf(parameters),
                                     parameters.number("OperationTimeout"), context.charge);
}

template <ResultKind Form>
IntrinsicResult pull(const OperationContext& context, const Parameters& parameters) {
    return context.enumerations.pull(ownerOf(context), Form, parameters.text(kContext.name),
                                     countOf(parameters), context.charge);
}

IntrinsicResult close(const OperationContext& context, const Parameters& parameters) {
    context.enumerations.close(ownerOf(context), parameters.text(kContext.name));
    return {};
}

/// Served only to be refused: its own status tells a client more than "not supported" would.
IntrinsicResult refuseQuery(const OperationContext&, const Parameters& parameters) {
    throw CimError(CimStatus::QueryLanguageNotSupported,
                   "queries in " + parameters.text("QueryLanguage") + " are not supported");
}

/// Every operation that is served (DSP0200 5.4), with what a caller must be allowed; handlers do not ask
/// again. Whatever is not here, such as changing classes, qualifiers or single properties, is not supported.
const std::vector<Operation> kOperations{
    {"GetClass", kRead, getClass, {kRequiredClass, kLocalOnly, kQualifiers, kOrigin, kProperties}},
    {"EnumerateClasses", kRead, enumerateClasses, {kClass, kDeep, kLocalOnly, kQualifiers, kOrigin}},
    {"EnumerateClassNames", kRead, enumerateClassNames, {kClass, kDeep}},
    {"GetInstance", kRead, getInstance, {kInstance, kLocalOnly, kQualifiers, kOrigin, kProperties}},
    {"EnumerateInstances",
     kRead,
     enumerateInstances,
     {kRequiredClass, kLocalOnly, kDeep, kQualifiers, kOrigin, kProperties}},
    {"EnumerateInstanceNames", kRead, enumerateInstanceNames, {kRequiredClass}},
    {"DeleteInstance", kAdminister, deleteInstance, {kInstance}},
    {"CreateInstance", kAdminister, createInstance, {{"NewInstance", Kind::Instance, true}}},
    {"ModifyInstance",
     kAdminister,
     modifyInstance,
     {{"ModifiedInstance", Kind::Instance, true}, kQualifiers, kProperties}},
    {"Associators",
     kRead,
     associators,
     {kObject, kAssociation, kResult, kRole, kResultRole, kQualifiers, kOrigin, kProperties}},
    {"AssociatorNames", kRead, associatorNames, {kObject, kAssociation, kResult, kRole, kResultRole}},
    {"References", kRead, references, {kObject, kResult, kRole, kQualifiers, kOrigin, kProperties}},
    {"ReferenceNames", kRead, referenceNames, {kObject, kResult, kRole}},
    {"GetQualifier", kRead, getQualifier, {{"QualifierName", Kind::Text, true}}},
    {"EnumerateQualifiers", kRead, enumerateQualifiers, {}},
    {"ExecQuery", kRead, refuseQuery, {{"QueryLanguage", Kind::Text, true}, {"Query", Kind::Text, true}}},
    {"OpenEnumerateInstances", kRead, open<enumerateInstances, kInstances>,
     opening({kRequiredClass, kDeep, kOrigin, kProperties})},
    {"OpenEnumerateInstancePaths", kRead, open<enumerateInstanceNames, kPaths>, opening({kRequiredClass})},
    {"OpenAssociatorInstances", kRead, open<associators, kInstances>,
     opening({kInstance, kAssociation, kResult, kRole, kResultRole, kOrigin, kProperties})},
    {"OpenAssociatorInstancePaths", kRead, open<associatorNames, kPaths>,
     opening({kInstance, kAssociation, kResult, kRole, kResultRole})},
    {"OpenReferenceInstances", kRead, open<references, kInstances>,
     opening({kInstance, kResult, kRole, kOrigin, kProperties})},
    {"OpenReferenceInstancePaths", kRead, open<referenceNames, kPaths>, opening({kInstance, kResult, kRole})},
    {"PullInstancesWithPath", kRead, pull<kInstances>, {kContext, kCount}},
    {"PullInstancePaths", kRead, pull<kPaths>, {kContext, kCount}},
    // Only a query's enumeration is pulled by this one, and none can be opened.
    {"PullInstances", kRead, pull<ResultKind::Nothing>, {kContext, kCount}},
    {"CloseEnumeration", kRead, close, {kContext}},
};

}  // namespace

const Operation* findOperation(std::string_view name) {
    return core::findByName(kOperations, name);
}

}  // namespace host
