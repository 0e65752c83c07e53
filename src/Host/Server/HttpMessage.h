#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "CimXml/Request.h"

namespace host {

/// What of a request's head is looked at.
struct HttpHead {
    std::string method;
    std::string address;  ///< the client's
    std::string host;     ///< header Host
    std::optional<std::string> authorization;
    std::optional<std::string> contentType;
    std::optional<std::string> contentLength;
    bool chunked = false;
    cimxml::RequestHeaders cim;
};

struct HttpAnswer {
    unsigned int status = 200;
    std::vector<std::pair<std::string, std::string>> headers;
    std::string body;

    /// One without a body.
    static HttpAnswer plain(unsigned int status) { return {status, {}, ""}; }
    static HttpAnswer withHeader(unsigned int status, std::string name, std::string value) {
        return {status, {{std::move(name), std::move(value)}}, ""};
    }
};

/// The announced length of the body; nothing for a header that is no number.
std::optional<std::uint64_t> contentLengthOf(const HttpHead& head);

}  // namespace host
