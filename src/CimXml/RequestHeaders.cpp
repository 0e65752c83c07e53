// SPDX-License-Identifier: Apache-2.0
// The HTTP headers of a request, and whether they say what its body says. A firewall or proxy may decide by
// the headers alone (DSP0200 6.2), so they must not claim another call than the one that is carried out.
#include <algorithm>

#include "CimXml/ElementCodec.h"
#include "CimXml/Request.h"
#include "CimXml/WireError.h"
#include "Utils/Utils.h"

namespace cimxml {

namespace {

/// Clients encode as much of these headers as they like: some nothing, some the slashes and colons, some all.
/// The text with every %XX replaced by its byte; anything else stays.
std::string percentDecoded(std::string_view text) {
    std::string decoded;
    while (!text.empty()) {
        std::optional<unsigned char> byte;
        if (text.starts_with('%') && text.size() > 2)
            byte = utils::parseNumber<unsigned char>(text.substr(1, 2), 16);
        decoded += byte ? static_cast<char>(*byte) : text.front();
        text.remove_prefix(byte ? 3 : 1);
    }
    return decoded;
}

bool isSameNamespace(std::string_view header, const std::string& body) {
    // The host that may stand in front is not compared: a proxy or a second name may change it.
    if (header.starts_with("//")) header.remove_prefix(std::min(header.find('/', 2), header.size()));
    return core::sameName(utils::trimOf(header, "/"), body);
}

std::string withoutEscapes(std::string text) {
    std::erase(text, '\\');
    return text;
}

/// The body's keys are texts, the header's are typed by how they are written.
bool isSameKey(const core::CimScalar& header, const core::CimScalar& body) {
    const auto* text = std::get_if<std::string>(&body);
    if (text == nullptr) return true;  // a reference: the class and the other keys have to do
    // There are clients that escape nothing in the header.
    if (const auto* quoted = std::get_if<std::string>(&header))
        return withoutEscapes(*quoted) == withoutEscapes(*text);
    const auto typed = core::parseScalar(typeOfScalar(header), *text);
    return typed && core::sameValue(header, *typed);
}

bool isSameObject(const core::CimPath& header, const core::CimPath& body) {
    const auto isInBody = [&](const core::CimKey& key) {
        const core::CimKey* other = core::findByName(body.getKeys(), key.name);
        return other != nullptr && isSameKey(key.value, other->value);
    };
    return isSameNamespace(header.getNamespace(), body.getNamespace()) &&
           core::sameName(header.getClassName(), body.getClassName()) &&
           header.getKeys().size() == body.getKeys().size() &&
           std::all_of(header.getKeys().begin(), header.getKeys().end(), isInBody);
}

/// Whether CIMObject names what the body calls: a namespace for an intrinsic operation, else an object.
struct ObjectMatcher {
    const std::string& header;

    bool operator()(const IntrinsicCall& call) const { return isSameNamespace(header, call.namespaceName); }

    bool operator()(const MethodCall& call) const {
        const core::CimPath path(header);
        if (path.isValid()) return isSameObject(path, call.object);
        // A key that holds quotes, unescaped, is not a path; what stands before the keys still counts.
        const core::CimPath named(header.substr(0, header.find('.')));
        return named.isValid() && isSameNamespace(named.getNamespace(), call.object.getNamespace()) &&
               core::sameName(named.getClassName(), call.object.getClassName());
    }
};

}  // namespace

void checkHeaders(const RequestHeaders& headers) {
    if (headers.batch) throw WireError(faults::kMultipleRequests, "several requests in one message");
    if (headers.operation && !core::sameName(*headers.operation, "MethodCall")) {
        throw WireError(faults::kUnsupportedOperation, "CIMOperation is not MethodCall");
    }
    // Without the header it is 1.0 (DSP0200 6.2).
    if (headers.protocolVersion && !headers.protocolVersion->starts_with("1.")) {
        throw WireError(faults::kUnsupportedProtocol, "CIMProtocolVersion is not 1.x");
    }
}

void checkHeadersAgainst(const RequestHeaders& headers, const Request& request) {
    if (headers.method && !core::sameName(percentDecoded(*headers.method), request.name())) {
        throw WireError(faults::kHeaderMismatch, "CIMMethod is not the method that the message calls");
    }
    if (!headers.object) return;
    const std::string object = percentDecoded(*headers.object);
    if (!std::visit(ObjectMatcher{object}, request.call)) {
        throw WireError(faults::kHeaderMismatch, "CIMObject is not the object that the message names");
    }
}

}  // namespace cimxml
