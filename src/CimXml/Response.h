// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <array>
#include <cstddef>
#include <functional>
#include <map>
#include <memory>
#include <string>
#include <string_view>
#include <variant>
#include <vector>

#include "Framework/Model/CimError.h"
#include "Framework/Model/ClassDeclaration.h"
#include "Framework/Requests/CimOperations.h"

namespace cimxml {

/// A CIM error: the operation was understood and did not succeed.
struct ErrorResult {
    core::CimStatus status = core::CimStatus::Failed;
    std::string description;
};

/// Where each property was first declared, by folded class name and folded property name.
using Origins = std::map<std::string, std::map<std::string, std::string>>;

/// What IRETURNVALUE holds (DSP0200 5.4.2): any number of one element, see resultElement().
enum class ResultKind {
    Nothing,  ///< a void operation
    Instance,
    NamedInstances,
    InstanceNames,
    ObjectsWithPath,
    ObjectPaths,
    InstancesWithPath,
    InstancePaths,
    Classes,
    ClassNames,
    Qualifiers
};

/// The elements, in the order of the kinds.
inline constexpr std::array<std::string_view, 11> kResultElements{"",
                                                                  "INSTANCE",
                                                                  "VALUE.NAMEDINSTANCE",
                                                                  "INSTANCENAME",
                                                                  "VALUE.OBJECTWITHPATH",
                                                                  "OBJECTPATH",
                                                                  "VALUE.INSTANCEWITHPATH",
                                                                  "INSTANCEPATH",
                                                                  "CLASS",
                                                                  "CLASSNAME",
                                                                  "QUALIFIER.DECLARATION"};

inline std::string_view resultElement(ResultKind kind) {
    return kResultElements[static_cast<std::size_t>(kind)];
}

/// The result of an intrinsic operation: the list that goes with the kind, the others empty.
struct IntrinsicResult {
    ResultKind kind = ResultKind::Nothing;
    std::vector<core::InstanceValue> instances = {};
    std::vector<core::CimPath> paths = {};
    std::vector<core::ClassDeclaration> classes = {};
    std::vector<std::string> classNames = {};
    std::vector<core::QualifierDeclaration> qualifiers = {};
    std::vector<core::Argument> outputs = {};
    std::shared_ptr<const Origins> origins = {};  ///< null when class origins are not asked for
    bool isStreamed = false;                      ///< the instances went to a stream instead
};
/// What its instances and paths take, as their buffers have it: a small element may become a large value.
std::size_t bytesOf(const IntrinsicResult& result);

struct Response {
    std::string messageId;
    std::string name;  ///< of the operation or method, as the request has it
    bool isMethod = false;
    std::string host;  ///< goes into paths that need one; host or host:port
    std::variant<ErrorResult, IntrinsicResult, core::MethodResult> content;
};

/// Reads a response message, as a client. Values and keys are typed by what the message says of them. The
/// instance of GetInstance comes without the keys in its path, since the message has none; an empty
/// IRETURNVALUE tells no kind. Qualifier declarations and names of classes are passed over. Throws WireError
/// for bytes that are no response. Thread-safe, no state.
Response readResponse(std::string_view bytes);

/// A message, or another body, in pieces that go out one after the other. What is written of a long one is
/// not moved while it grows, and the memory of a piece soon serves another.
using Pieces = std::vector<std::string>;
std::size_t sizeOf(const Pieces& pieces);

/// The response message, in the forms that the common clients read. Thread-safe, no state. The second lets go
/// of each object once it is written, so that values and text are never both whole.
/// @param grows  told after each object what the text takes; what it throws ends the writing
std::string writeResponse(const Response& response);
std::string writeResponse(Response&& response, const std::function<void(std::size_t)>& grows = {});

}  // namespace cimxml
