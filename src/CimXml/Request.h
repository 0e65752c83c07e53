// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <optional>
#include <string>
#include <string_view>
#include <variant>
#include <vector>

#include "Framework/Requests/CimOperations.h"

namespace cimxml {

/// The Unix socket on which the object manager of this machine serves root, unless told otherwise.
inline constexpr const char* kDefaultSocket = "/run/quenx-cimd/socket";

/// A class, named where an operation takes a class or an instance.
struct ClassName {
    std::string name;
};

/// The instance that a client sends in order to create or modify one.
struct InstanceBody {
    std::string className;
    std::optional<core::CimPath> path;  ///< given with a modification
    /// As the message types them; keys in references are texts.
    std::vector<core::PropertyValue> properties = {};
    /// The first property whose value is not of the type that it states; empty when there is none. Such an
    /// instance can be read but not made, and its property is null.
    std::string mistypedProperty = {};
};

/// What an intrinsic operation's parameter holds. Null is the same as a parameter that is not there.
using ParameterValue = std::variant<std::monostate, std::string, std::vector<std::string>, ClassName,
                                    core::CimPath, InstanceBody>;

struct Parameter {
    std::string name;
    ParameterValue value;
};

/// A call of one of the operations of DSP0200 5.4.
struct IntrinsicCall {
    std::string operation;      ///< as the client wrote it
    std::string namespaceName;  ///< without slashes at its ends
    std::vector<Parameter> parameters;
};

/// A call of a method of a class. The object is an instance or, without keys, a class; its namespace is set.
struct MethodCall {
    std::string method;  ///< as the client wrote it
    core::CimPath object;
    std::vector<core::Argument> arguments;
    /// The first argument whose value is not of the type that it states; empty when there is none. Such a
    /// call can be read but not carried out, and its argument is null.
    std::string mistypedArgument = {};
};

struct Request {
    std::string messageId;  ///< any text; goes back in the response
    std::variant<IntrinsicCall, MethodCall> call;

    /// The name of the operation or method, as the client wrote it.
    const std::string& name() const;
};

/// Reads a request message (DSP0201). Keys of paths are left as texts, and a namespace that a path lacks is
/// taken from the call. Throws WireError for bytes that are no such message; whether operation, parameters,
/// classes and values exist is not looked at. Thread-safe, no state.
Request readRequest(std::string_view bytes);

/// The request message of a call. Thread-safe, no state.
std::string writeRequest(const Request& request);

/// The CIM headers of an HTTP request (DSP0200 6.2); those that it does not have are empty.
struct RequestHeaders {
    std::optional<std::string> operation;        ///< CIMOperation
    std::optional<std::string> method;           ///< CIMMethod
    std::optional<std::string> object;           ///< CIMObject
    std::optional<std::string> protocolVersion;  ///< CIMProtocolVersion
    bool batch = false;                          ///< CIMBatch is there
};

/// Checks the headers alone, before there is a body. Throws WireError.
void checkHeaders(const RequestHeaders& headers);

/// Checks that the headers name the call that the body holds: CIMMethod its name, CIMObject its namespace or
/// object. Throws WireError (header mismatch).
void checkHeadersAgainst(const RequestHeaders& headers, const Request& request);

}  // namespace cimxml
