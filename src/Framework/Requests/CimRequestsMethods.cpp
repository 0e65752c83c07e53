// Calling methods: the arguments are checked against the declaration and completed here, once for all fronts.
#include <algorithm>

#include "Framework/Classes/RequestScope.h"
#include "Framework/Requests/CimRequests.h"
#include "Framework/Requests/RequestTools.h"
#include "Framework/Requests/ServedModel.h"

namespace core {

namespace {

/// The output parameter under which an instance handed back by a method is served.
constexpr std::string_view kJobParameter = "Job";

struct CallLists {
    CimPropertyList in;
    CimPropertyList out;
};

const Argument* findArgument(const std::vector<Argument>& arguments, std::string_view name) {
    const auto found = std::find_if(arguments.begin(), arguments.end(),
                                    [&](const Argument& argument) { return sameName(argument.name, name); });
    return found == arguments.end() ? nullptr : &*found;
}

void checkNames(const MethodDeclaration& method, const std::vector<Argument>& arguments) {
    for (const Argument& argument : arguments) {
        const bool known = std::any_of(
            method.parameters.begin(), method.parameters.end(),
            [&](const ParameterDeclaration& parameter) { return sameName(parameter.name, argument.name); });
        if (!known) {
            throw CimError(CimStatus::InvalidParameter, method.name + " has no parameter " + argument.name);
        }
        if (findArgument(arguments, argument.name) != &argument) {
            throw CimError(CimStatus::InvalidParameter, argument.name + " is given twice");
        }
    }
}

/// A value that the client gives for an output parameter goes to the method with the outputs: it decides.
CallLists listsFor(const MethodDeclaration& method, const std::vector<Argument>& arguments) {
    checkNames(method, arguments);
    CallLists lists;
    for (const ParameterDeclaration& parameter : method.parameters) {
        const Argument* given = findArgument(arguments, parameter.name);
        const bool isOutput = parameter.direction == CimDirection::Out;
        if (given == nullptr && !isOutput && !parameter.optional) continue;
        CimPropertyList& list = isOutput ? lists.out : lists.in;
        CimProperty& property = list.add(parameter.name, CimValue::null(parameter.type, parameter.isArray));
        if (given != nullptr && !given->value.isNull()) property.setValue(given->value);
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
MethodResult resultOf(unsigned int returnValue, const CallLists& lists,
                      const std::vector<Argument>& arguments, const CimInstance* handedBack,
                      const std::string& namespaceName) {
    MethodResult result{returnValue, {}};
    for (const auto& property : lists.out.getProperties()) {
        if (sameName(property->getName(), kJobParameter)) continue;  // an instance, handed back
        CimValue value = property->getValue();
        const Argument* given = findArgument(arguments, property->getName());
        if (given != nullptr && sameValues(given->value, value)) continue;
        if (!value.isNull()) result.outputs.push_back({property->getName(), std::move(value)});
    }
    if (handedBack != nullptr) {
        CimPath path = CimPath::of(*handedBack);
        path.completeNamespace(namespaceName);
        result.outputs.push_back(
            {std::string(kJobParameter), CimValue::of(CimType::Reference, CimScalar(std::move(path)))});
    }
    return result;
}

}  // namespace

MethodResult CimRequests::invokeMethod(CimPath path, const std::string& method,
                                       const std::vector<Argument>& arguments) const {
    const RequestScope scope;
    return answering([&] {
        CimInstance& instance = requireInstance(*m_broker, path);
        const ClassChain chain = ServedModel(*m_broker).chainOf(instance.getClassName());
        const MethodDeclaration* declared = findMethod(chain, method);
        if (declared == nullptr) {
            throw CimError(CimStatus::MethodNotFound, instance.getClassName() + " has no method " + method);
        }
        CallLists lists = listsFor(*declared, arguments);
        CimInstance* handedBack = nullptr;
        const unsigned int returnValue =
            instance.invokeMethod(declared->name, lists.in, lists.out, handedBack);
        return resultOf(returnValue, lists, arguments, handedBack, m_namespace);
    });
}

}  // namespace core
