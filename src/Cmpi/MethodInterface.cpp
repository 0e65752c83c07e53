// SPDX-License-Identifier: Apache-2.0
// Method calls.
#include "Cmpi/EntryPoints.h"
#include "Cmpi/Request.h"
#include "Cmpi/Slots.h"
#include "Framework/Requests/Audit.h"

namespace cmpi {

namespace {

using core::Argument;
using core::CimError;
using core::CimStatus;

/// The argument of that name, if it was sent. Object managers say in two ways that it was not.
std::optional<Argument> argumentNamed(const Request& request, const Args* in, const std::string& name) try {
    Status status{};
    const Data data = call(in, &ArgsTable::getArg, name.c_str(), &status);
    if (status.rc != ReturnCode::Ok || (data.state & (kNotFound | kBadValue)) != 0) return std::nullopt;
    // A text may be what the object manager makes of a value whose type the client did not give.
    return Argument{name, valueFrom(request.place(), data), true};
} catch (const CimError& error) {
    throw CimError(error.status(), "parameter " + name + ": " + error.what());
}

/// One that the method does not declare, to be refused as such; nothing when there is none.
std::optional<Argument> findUndeclared(const Args* in,
                                       const std::vector<core::ParameterDeclaration>& declared) {
    const Count count = call(in, &ArgsTable::getArgCount, nullptr);
    for (Count i = 0; i < count; ++i) {
        String* given = nullptr;
        call(in, &ArgsTable::getArgAt, i, &given, nullptr);
        const std::string name = textOf(given);
        if (!name.empty() && core::findByName(declared, name) == nullptr)
            return Argument{name, core::CimValue::null(core::CimType::String)};
    }
    return std::nullopt;
}

/// By name, since that is what all object managers do alike.
std::vector<Argument> argumentsFrom(const Request& request, const std::string& method, const Args* in) {
    std::vector<Argument> arguments;
    const core::ClassChain chain = request.operations().getClass(request.object().getClassName());
    const core::MethodDeclaration* declared = core::findMethod(chain, method);
    if (declared == nullptr) return arguments;  // the request layer says so
    for (const core::ParameterDeclaration& parameter : declared->parameters) {
        if (auto argument = argumentNamed(request, in, parameter.name))
            arguments.push_back(std::move(*argument));
    }
    if (auto undeclared = findUndeclared(in, declared->parameters))
        arguments.push_back(std::move(*undeclared));
    return arguments;
}

void giveOutputs(const Request& request, const core::MethodResult& result, const Args* out) {
    for (const Argument& output : result.outputs) {
        const Given given(request.place(), output.value);
        const Status status = call(out, &ArgsTable::addArg, output.name.c_str(), given.value(), given.type());
        if (status.rc != ReturnCode::Ok)
            throw CimError(CimStatus::Failed, "the object manager did not take the output " + output.name);
    }
}

Status invokeMethod(MethodMI*, const Context* context, const Result* result, const ObjectPath* object,
                    const char* method, const Args* in, Args* out) {
    return answer({Interface::Method, context, result, object}, [&](Request& request) {
        const std::string name = textOf(method);
        const std::vector<Argument> arguments = argumentsFrom(request, name, in);
        core::MethodResult answered;
        request.audited(name, arguments, [&] {
            answered = request.operations().invokeMethod(request.object(), name, arguments);
            return core::outcomeOf(answered);
        });
        giveOutputs(request, answered, out);
        request.give(answered.returnType, core::CimScalar(std::uint64_t{answered.returnValue}));
    });
}

Status cleanup(MethodMI*, const Context*, Boolean) {
    return cleanUp(Interface::Method);
}

constexpr MethodMITable kTable{kLevel, kLevel, kProviderName, cleanup, invokeMethod};

MethodMI theInterface{{nullptr, &kTable}};

}  // namespace

}  // namespace cmpi

cmpi::MethodMI* Quenx_Create_MethodMI(const cmpi::Broker* broker, const cmpi::Context*,
                                      cmpi::Status* status) {
    return cmpi::create(cmpi::Interface::Method, cmpi::theInterface, broker, status);
}
