// SPDX-License-Identifier: Apache-2.0
#include "CimXml/Request.h"
#include "CimXml/Response.h"
#include "CimXml/WireError.h"
#include "CimXml/Xml.h"
#include "Fuzz/Fuzz.h"

namespace {

/// A request that can be read can be written, and reads back as what was written.
void checkRequest(std::string_view bytes) {
    cimxml::Request request;
    try {
        request = cimxml::readRequest(bytes);
    } catch (const cimxml::WireError&) {
        return;
    }
    const std::string once = cimxml::writeRequest(request);
    require(cimxml::writeRequest(cimxml::readRequest(once)) == once);
}

void checkResponse(std::string_view bytes) {
    try {
        const cimxml::Response response = cimxml::readResponse(bytes);
        cimxml::checkWellFormed(cimxml::writeResponse(response));
    } catch (const cimxml::WireError&) {
    }
}

/// Whatever a provider says, the answer is well-formed. An identifier has a bound of its own,
/// 1024 bytes, and each byte that is no character becomes three.
void checkText(const std::string& text) {
    const cimxml::Response response{text.substr(0, 1024 / 3), text, true, text,
                                    cimxml::ErrorResult{core::CimStatus::Failed, text}};
    cimxml::readResponse(cimxml::writeResponse(response));
}

}  // namespace

void fuzz(const std::string& bytes) {
    checkRequest(bytes);
    checkResponse(bytes);
    checkText(bytes);
}
