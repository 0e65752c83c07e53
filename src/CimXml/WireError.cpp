// SPDX-License-Identifier: Apache-2.0
#include "CimXml/WireError.h"

#include <algorithm>
#include <iterator>

namespace cimxml {

namespace {

struct FaultRow {
    WireFault fault;
    int status;
    const char* name;
};

constexpr FaultRow kFaults[] = {
    {WireFault::NotWellFormed, 400, "request-not-well-formed"},
    {WireFault::NotValid, 400, "request-not-valid"},
    {WireFault::HeaderMismatch, 400, "header-mismatch"},
    {WireFault::UnsupportedOperation, 400, "unsupported-operation"},
    {WireFault::UnsupportedProtocol, 501, "unsupported-protocol-version"},
    {WireFault::UnsupportedCimVersion, 501, "unsupported-cim-version"},
    {WireFault::UnsupportedDtdVersion, 501, "unsupported-dtd-version"},
    {WireFault::MultipleRequests, 501, "multiple-requests-unsupported"},
};

const FaultRow& rowOf(WireFault fault) {
    return *std::find_if(std::begin(kFaults), std::end(kFaults),
                         [&](const FaultRow& row) { return row.fault == fault; });
}

}  // namespace

int httpStatus(WireFault fault) {
    return rowOf(fault).status;
}

const char* cimErrorHeader(WireFault fault) {
    return rowOf(fault).name;
}

}  // namespace cimxml
