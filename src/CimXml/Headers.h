#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "CimXml/Request.h"

namespace cimxml {

/// The CIM headers of an HTTP request (DSP0200 6.2); those that it does not have are empty.
struct RequestHeaders {
    std::optional<std::string> operation;        ///< CIMOperation
    std::optional<std::string> method;           ///< CIMMethod
    std::optional<std::string> protocolVersion;  ///< CIMProtocolVersion
    bool batch = false;                          ///< CIMBatch is there
};

/// Checks the headers alone, before there is a body. Throws WireError.
void checkHeaders(const RequestHeaders& headers);

/// Checks that the headers name the call that the body holds. CIMObject is not looked at, since clients
/// encode it in too many ways. Throws WireError (header mismatch).
void checkHeadersAgainst(const RequestHeaders& headers, const Request& request);

/// The text with every %XX replaced by its byte; what is no such sequence stays.
std::string percentDecoded(std::string_view text);

}  // namespace cimxml
