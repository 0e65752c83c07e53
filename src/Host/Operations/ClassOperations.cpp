// SPDX-License-Identifier: Apache-2.0
#include "Host/Operations/ClassAnswer.h"
#include "Host/Operations/Operations.h"

namespace host {

namespace {

using cimxml::IntrinsicResult;
using cimxml::ResultKind;

ClassOptions optionsOf(const Parameters& parameters) {
    return {parameters.flag("LocalOnly", true), parameters.flag("IncludeQualifiers", true),
            parameters.flag("IncludeClassOrigin", false), parameters.list("PropertyList")};
}

std::vector<core::ClassChain> wantedClasses(const OperationContext& context, const Parameters& parameters) {
    return context.target.enumerateClasses(parameters.className("ClassName"),
                                           parameters.flag("DeepInheritance", false));
}

}  // namespace

core::ClassChain requireClass(core::CimOperations& target, const std::string& className,
                              core::CimStatus otherwise) {
    core::ClassChain chain = target.getClass(className);
    if (!chain.empty()) return chain;
    throw core::CimError(otherwise, "no class \"" + className + "\" in " + target.getNamespace());
}

IntrinsicResult getClass(const OperationContext& context, const Parameters& parameters) {
    IntrinsicResult result;
    result.kind = ResultKind::Classes;
    const core::ClassChain chain =
        requireClass(context.target, parameters.className("ClassName"), core::CimStatus::NotFound);
    result.classes.push_back(classAnswer(chain, optionsOf(parameters)));
    return result;
}

IntrinsicResult enumerateClasses(const OperationContext& context, const Parameters& parameters) {
    IntrinsicResult result;
    result.kind = ResultKind::Classes;
    const ClassOptions options = optionsOf(parameters);
    for (const core::ClassChain& chain : wantedClasses(context, parameters)) {
        result.classes.push_back(classAnswer(chain, options));
    }
    return result;
}

IntrinsicResult enumerateClassNames(const OperationContext& context, const Parameters& parameters) {
    IntrinsicResult result;
    result.kind = ResultKind::ClassNames;
    for (const core::ClassChain& chain : wantedClasses(context, parameters)) {
        result.classNames.push_back(chain.front()->name);
    }
    return result;
}

IntrinsicResult getQualifier(const OperationContext&, const Parameters& parameters) {
    const std::string name = parameters.text("QualifierName");
    const core::QualifierDeclaration* declaration = core::findQualifierDeclaration(name);
    if (declaration == nullptr) {
        throw core::CimError(core::CimStatus::NotFound, "no qualifier \"" + name + "\"");
    }
    IntrinsicResult result;
    result.kind = ResultKind::Qualifiers;
    result.qualifiers = {*declaration};
    return result;
}

IntrinsicResult enumerateQualifiers(const OperationContext&, const Parameters&) {
    IntrinsicResult result;
    result.kind = ResultKind::Qualifiers;
    result.qualifiers = core::qualifierDeclarations();
    return result;
}

}  // namespace host
