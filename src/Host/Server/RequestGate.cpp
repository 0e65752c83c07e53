#include "Host/Server/RequestGate.h"

#include <charconv>

#include "CimXml/WireError.h"
#include "Framework/Model/CimType.h"

namespace host {

namespace {

/// The media type and the character set of a request's body.
bool isXml(const std::string& contentType) {
    const std::string folded = core::foldName(contentType);
    const auto startsWith = [&](std::string_view type) {
        return core::sameName(std::string_view(contentType).substr(0, type.size()), type) &&
               (contentType.size() == type.size() || contentType[type.size()] == ';' ||
                contentType[type.size()] == ' ');
    };
    if (!startsWith("application/xml") && !startsWith("text/xml")) return false;
    const std::string charset = core::foldName("charset=");
    const std::size_t at = folded.find(charset);
    if (at == std::string::npos) return true;
    std::string name = contentType.substr(at + charset.size());
    std::erase_if(name, [](char c) { return c == '"' || c == ' '; });
    return core::sameName(name, "utf-8") || core::sameName(name, "us-ascii");
}

}  // namespace

std::optional<std::uint64_t> contentLengthOf(const HttpHead& head) {
    if (!head.contentLength) return std::nullopt;
    std::uint64_t length = 0;
    const char* end = head.contentLength->data() + head.contentLength->size();
    const auto result = std::from_chars(head.contentLength->data(), end, length);
    if (result.ec != std::errc() || result.ptr != end) return std::nullopt;
    return length;
}

std::optional<HttpAnswer> refuseByHead(const HttpHead& head, std::size_t bodyLimit) {
    if (head.method == "M-POST") return HttpAnswer::plain(501);
    if (head.method != "POST") return HttpAnswer::withHeader(405, "Allow", "POST");
    // No client of this protocol sends chunks, and with a length the refusal comes before the body.
    if (head.chunked || !head.contentLength) return HttpAnswer::plain(411);
    const std::optional<std::uint64_t> length = contentLengthOf(head);
    if (!length) return HttpAnswer::plain(400);
    if (*length > bodyLimit) return HttpAnswer::plain(413);
    if (head.contentType && !isXml(*head.contentType)) return HttpAnswer::plain(415);
    try {
        cimxml::checkHeaders(head.cim);
    } catch (const cimxml::WireError& error) {
        return HttpAnswer::withHeader(static_cast<unsigned int>(cimxml::httpStatus(error.fault())),
                                      "CIMError", cimxml::cimErrorHeader(error.fault()));
    }
    return std::nullopt;
}

}  // namespace host
