#include "CimXml/WireError.h"

namespace cimxml {

int httpStatus(WireFault fault) {
    switch (fault) {
        case WireFault::NotWellFormed:
        case WireFault::NotValid:
        case WireFault::HeaderMismatch:
        case WireFault::UnsupportedOperation:
            return 400;
        default:
            return 501;
    }
}

const char* cimErrorHeader(WireFault fault) {
    switch (fault) {
        case WireFault::NotWellFormed:
            return "request-not-well-formed";
        case WireFault::NotValid:
            return "request-not-valid";
        case WireFault::HeaderMismatch:
            return "header-mismatch";
        case WireFault::UnsupportedOperation:
            return "unsupported-operation";
        case WireFault::UnsupportedProtocol:
            return "unsupported-protocol-version";
        case WireFault::UnsupportedCimVersion:
            return "unsupported-cim-version";
        case WireFault::UnsupportedDtdVersion:
            return "unsupported-dtd-version";
        case WireFault::MultipleRequests:
            return "multiple-requests-unsupported";
    }
    return "request-not-valid";
}

}  // namespace cimxml
