// SPDX-License-Identifier: Apache-2.0
#include "Cli/RemoteManagement.h"

#include "CimXml/Request.h"
#include "CimXml/Response.h"
#include "CimXml/WireError.h"
#include "Cli/Failure.h"
#include "Utils/Utils.h"

namespace cli {

namespace {

using cimxml::ClassName;
using cimxml::Parameter;
using cimxml::ParameterValue;

std::string percentEncoded(const std::string& text) {
    std::string result;
    for (const char c : text) {
        const bool isPlain = utils::isLetter(c) || utils::isDigit(c) || c == '.' || c == '_' || c == '-' ||
                             c == '=' || c == ',';
        if (isPlain)
            result += c;
        else
            result += utils::formatStr("%%%02X", static_cast<unsigned char>(c));
    }
    return result;
}

std::vector<Parameter> associationParameters(const core::CimPath& path, const core::AssociationFilter& by) {
    std::vector<Parameter> parameters = {{"ObjectName", path}};
    if (!by.associationClass.empty()) parameters.push_back({"AssocClass", ClassName{by.associationClass}});
    if (!by.resultClass.empty()) parameters.push_back({"ResultClass", ClassName{by.resultClass}});
    if (!by.role.empty()) parameters.push_back({"Role", by.role});
    if (!by.resultRole.empty()) parameters.push_back({"ResultRole", by.resultRole});
    return parameters;
}

void requireOk(const HttpReply& reply) {
    const std::string wait = reply.retryAfter.empty() ? "a while" : reply.retryAfter + " seconds";
    const std::string why = reply.cimError.empty() ? "" : " (" + reply.cimError + ")";
    switch (reply.status) {
        case 200:
            return;
        case 401:
            throw Failure(ExitStatus::Failed, "The server does not accept the user name and password.",
                          "Check --user or QUENXCTL_USER, and QUENXCTL_PASSWORD or what was typed.");
        case 403:
            throw Failure(
                ExitStatus::Failed, "This user may not use the server.",
                "On quenx-cimd, log in as root, as a member of the group quenx-admin, or as a user whom "
                "its setting auth.readers names.");
        case 503:
            throw Failure(
                ExitStatus::Failed,
                "The server is busy, or it blocks log-ins from this address for a while after wrong "
                "passwords.",
                "Try again in " + wait + ".");
        default:
            throw Failure(ExitStatus::Failed,
                          "The server answered with HTTP status " + std::to_string(reply.status) + why + ".",
                          "Check that --server names a CIM-XML server; its log has the details.");
    }
}

}  // namespace

RemoteManagement::RemoteManagement(const ServerUrl& url, const ServerSettings& settings)
    : client_(url, settings), namespace_(settings.namespaceName), isLoopback_(url.isLoopback()) {}

cimxml::Response RemoteManagement::send(cimxml::Request request, const std::string& object) {
    request.messageId = std::to_string(++messages_);
    const HttpReply reply =
        client_.post({"Content-Type: application/xml; charset=\"utf-8\"",
                      "Expect:", "CIMProtocolVersion: 1.0", "CIMOperation: MethodCall",
                      "CIMMethod: " + percentEncoded(request.name()), "CIMObject: " + percentEncoded(object)},
                     cimxml::writeRequest(request));
    requireOk(reply);
    try {
        cimxml::Response response = cimxml::readResponse(reply.body);
        if (const auto* error = std::get_if<cimxml::ErrorResult>(&response.content)) {
            throw core::CimError(error->status, error->description);
        }
        return response;
    } catch (const cimxml::WireError& error) {
        throw Failure(ExitStatus::Failed,
                      std::string("The server's answer cannot be read: ") + error.what() + ".",
                      "Check that --server names a CIM-XML server.");
    }
}

cimxml::IntrinsicResult RemoteManagement::callIntrinsic(const std::string& operation,
                                                        std::vector<Parameter> parameters) {
    cimxml::Request request;
    request.call = cimxml::IntrinsicCall{operation, namespace_, std::move(parameters)};
    cimxml::Response response = send(std::move(request), namespace_);
    auto* result = std::get_if<cimxml::IntrinsicResult>(&response.content);
    if (result == nullptr) return {};
    for (core::InstanceValue& instance : result->instances)
        complete(instance.path);
    for (core::CimPath& path : result->paths)
        complete(path);
    return std::move(*result);
}

void RemoteManagement::complete(core::CimPath& path) const {
    if (!path.isValid()) return;
    path.setHost("");
    path.completeNamespace(namespace_);
}

std::vector<core::InstanceValue> RemoteManagement::enumerateInstances(const std::string& className) {
    return callIntrinsic("EnumerateInstances",
                         {{"ClassName", ClassName{className}}, {"LocalOnly", std::string("FALSE")}})
        .instances;
}

std::vector<core::CimPath> RemoteManagement::enumerateInstanceNames(const std::string& className) {
    return callIntrinsic("EnumerateInstanceNames", {{"ClassName", ClassName{className}}}).paths;
}

core::InstanceValue RemoteManagement::getInstance(const core::CimPath& path) {
    auto instances =
        callIntrinsic("GetInstance", {{"InstanceName", path}, {"LocalOnly", std::string("FALSE")}}).instances;
    if (instances.empty()) throw core::CimError(core::CimStatus::NotFound, path.toString());
    // The answer does not repeat the path.
    instances.front().path = path;
    return std::move(instances.front());
}

std::vector<core::InstanceValue> RemoteManagement::associators(const core::CimPath& path,
                                                               const core::AssociationFilter& by) {
    return callIntrinsic("Associators", associationParameters(path, by)).instances;
}

std::vector<core::CimPath> RemoteManagement::associatorNames(const core::CimPath& path,
                                                             const core::AssociationFilter& by) {
    return callIntrinsic("AssociatorNames", associationParameters(path, by)).paths;
}

core::MethodResult RemoteManagement::invokeMethod(const core::CimPath& path, const std::string& method,
                                                  const std::vector<core::Argument>& arguments) {
    core::CimPath object = path;
    object.completeNamespace(namespace_);
    cimxml::Request request;
    request.call = cimxml::MethodCall{method, object, arguments};
    cimxml::Response response = send(std::move(request), object.toString());
    auto* result = std::get_if<core::MethodResult>(&response.content);
    return result == nullptr ? core::MethodResult{} : std::move(*result);
}

void RemoteManagement::deleteInstance(const core::CimPath& path) {
    callIntrinsic("DeleteInstance", {{"InstanceName", path}});
}

std::vector<core::ClassDeclaration> RemoteManagement::classes() {
    return callIntrinsic("EnumerateClasses",
                         {{"DeepInheritance", std::string("TRUE")}, {"LocalOnly", std::string("TRUE")}})
        .classes;
}

}  // namespace cli
