// SPDX-License-Identifier: Apache-2.0
// Calling methods: the arguments are checked against the declaration and completed here, once for all fronts.
#include <algorithm>

#include "Framework/Model/CimError.h"
#include "Framework/Model/CimInstance.h"
#include "Framework/Requests/CimRequests.h"
#include "Framework/Requests/DeclaredTypes.h"
#include "Framework/Requests/ServedClasses.h"
#include "Utils/Exception.h"

namespace core {

namespace {

/// The output parameter under which an instance handed back by a method is served.
constexpr std::string_view kJobParameter = "Job";

struct CallLists {
    CimPropertyList in;
    CimPropertyList out;
};

/// A value that the client gives for an output parameter goes to the method with the outputs: it decides.
CallLists listsFor(const MethodDeclaration& method, const std::vector<Argument>& arguments) {
    CallLists lists;
    for (const ParameterDeclaration& parameter : method.parameters) {
        const Argument* given = findArgument(arguments, parameter.name);
        const bool isOutput = parameter.direction == CimDirection::Out;
        // What is required and missing stays absent: the provider says so in its own words.
        if (given == nullptr && !isOutput && !parameter.optional) continue;
        CimPropertyList& list = isOutput ? lists.out : lists.in;
        list.add(parameter.name,
                 given == nullptr ? CimValue::null(parameter.type, parameter.isArray) : given->value);
    }
    return lists;
}

bool sameValues(const CimValue& left, const CimValue& right) {
    if (const CimScalar* scalar = left.scalar())
        return right.scalar() != nullptr && sameValue(*scalar, *right.scalar());
    const auto* elements = left.elements();
    const auto* others = right.elements();
    if (elements == nullptr || others == nullptr) return left.isNull() && right.isNull();
    return std::equal(elements->begin(), elements->end(), others->begin(), others->end(), sameValue);
}

/// What the method has put out: of its outputs, not those that still are what the client gave for them.
std::vector<Argument> outputsOf(const CallLists& lists, const std::vector<Argument>& arguments,
                                const CimInstance* handedBack, const std::string& namespaceName) {
    std::vector<Argument> outputs;
    for (const auto& property : lists.out.getProperties()) {
        if (sameName(property->getName(), kJobParameter)) continue;  // an instance, handed back
        CimValue value = property->getValue();
        const Argument* given = findArgument(arguments, property->getName());
        if (given != nullptr && sameValues(given->value, value)) continue;
        if (!value.isNull()) outputs.push_back({property->getName(), std::move(value)});
    }
    if (handedBack != nullptr) {
        CimPath path = CimPath::of(*handedBack);
        path.completeNamespace(namespaceName);
        outputs.push_back(
            {std::string(kJobParameter), CimValue::of(CimType::Reference, CimScalar(std::move(path)))});
    }
    return outputs;
}

/// A method reports a wrong argument by an exception, anything else by its return value.
unsigned int call(CimInstance& instance, const std::string& method, CallLists& lists,
                  CimInstance*& handedBack) {
    try {
        return instance.invokeMethod(method, lists.in, lists.out, handedBack);
    } catch (const utils::EUnspecifiedError& refusal) {
        throw CimError(CimStatus::InvalidParameter, refusal.what());
    }
}

}  // namespace

MethodResult CimRequests::invokeMethod(const CimPath& path, const std::string& method,
                                       const std::vector<Argument>& arguments) {
    const ServedClasses classes(m_broker);
    return withCimErrors([&]() -> MethodResult {
        const ClassChain chain = classes.chainOf(path.getClassName());
        if (chain.empty()) {
            throw CimError(CimStatus::NotFound, "no class \"" + path.getClassName() + "\" is served");
        }
        const MethodDeclaration* declared = findMethod(chain, method);
        if (declared == nullptr) {
            throw CimError(CimStatus::MethodNotFound, chain.front()->name + " has no method " + method);
        }
        if (!path.isInstancePath()) {
            throw CimError(CimStatus::MethodNotAvailable, declared->name + " is called on an instance");
        }
        CimPath typed = classes.typed(path);
        const std::vector<Argument> given = typedArguments(
            *declared, arguments, [&](const std::string& name) { return classes.chainOf(name); });
        CimInstance& instance = classes.requireInstance(typed);
        CallLists lists = listsFor(*declared, given);
        CimInstance* handedBack = nullptr;
        const unsigned int returnValue = call(instance, declared->name, lists, handedBack);
        return {returnValue, outputsOf(lists, given, handedBack, m_namespace), declared->returnType};
    });
}

}  // namespace core
