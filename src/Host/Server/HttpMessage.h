// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "CimXml/Request.h"
#include "CimXml/WireError.h"

namespace host {

/// What of a request's head is looked at.
struct HttpHead {
    std::string method;
    std::string address;  ///< the client's
    std::string host;     ///< header Host
    std::optional<std::string> authorization;
    std::optional<std::string> contentType;
    std::optional<std::string> contentEncoding;
    std::vector<std::string> contentLengths;  ///< more than one where the client repeats the header
    bool isChunked = false;
    cimxml::RequestHeaders cim;
};

struct HttpAnswer {
    unsigned int status = 200;
    std::vector<std::pair<std::string, std::string>> headers;
    std::string body;

    /// Without a body, here and below.
    static HttpAnswer plain(unsigned int status) { return {status, {}, ""}; }
    static HttpAnswer withHeader(unsigned int status, std::string name, std::string value) {
        return {status, {{std::move(name), std::move(value)}}, ""};
    }
    static HttpAnswer refusal(const cimxml::WireError& error);
};

/// The announced length of the body; nothing when no header says it in one number, or two differ.
std::optional<std::uint64_t> contentLengthOf(const HttpHead& head);

/// What the head of a request alone is refused for: method, length, encoding, content type, CIM headers.
/// Nothing when the body may be read.
std::optional<HttpAnswer> checkHead(const HttpHead& head, std::size_t bodyLimit);

}  // namespace host
