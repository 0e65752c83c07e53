#include "CimXml/Headers.h"

#include <charconv>

#include "CimXml/WireError.h"
#include "Framework/Model/CimType.h"

namespace cimxml {

std::string percentDecoded(std::string_view text) {
    std::string decoded;
    for (std::size_t i = 0; i < text.size(); ++i) {
        unsigned int byte = 0;
        if (text[i] == '%' && text.size() - i > 2) {
            const char* end = text.data() + i + 3;
            if (std::from_chars(text.data() + i + 1, end, byte, 16).ptr == end) {
                decoded += static_cast<char>(byte);
                i += 2;
                continue;
            }
        }
        decoded += text[i];
    }
    return decoded;
}

void checkHeaders(const RequestHeaders& headers) {
    if (headers.batch) throw WireError(WireFault::MultipleRequests, "several requests in one message");
    if (headers.operation && !core::sameName(*headers.operation, "MethodCall")) {
        throw WireError(WireFault::UnsupportedOperation, "CIMOperation is not MethodCall");
    }
    if (headers.protocolVersion && !headers.protocolVersion->starts_with("1.")) {
        throw WireError(WireFault::UnsupportedProtocol, "CIMProtocolVersion is not 1.x");
    }
}

void checkHeadersAgainst(const RequestHeaders& headers, const Request& request) {
    if (headers.method && !core::sameName(percentDecoded(*headers.method), request.name())) {
        throw WireError(WireFault::HeaderMismatch, "CIMMethod is not the method that the message calls");
    }
}

}  // namespace cimxml
