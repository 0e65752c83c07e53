// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <functional>

#include "Framework/Model/CimType.h"
#include "Host/Server/HttpRequest.h"
#include "Utils/Utils.h"

namespace host {

namespace {

/// Whether the body is XML in UTF-8, by its media type and character set.
bool isXml(std::string_view contentType) {
    const std::string folded = utils::lowerCase(contentType);
    const std::string type = folded.substr(0, folded.find_first_of("; "));
    if (type != "application/xml" && type != "text/xml") return false;
    const std::size_t charset = folded.find("charset=");
    if (charset == std::string::npos) return true;
    // Some clients write the character set in quotes.
    std::string name = folded.substr(folded.find('=', charset) + 1);
    std::erase_if(name, [](char c) { return c == '"' || c == ' '; });
    return name == "utf-8" || name == "us-ascii";
}

/// Whether the header can be taken for a name and port (RFC 9112 3.2): it goes into each path of an answer,
/// where an odd or a long one would be repeated a thousand times.
bool isHostAndPort(std::string_view host) {
    constexpr std::size_t kLongestName = 255;
    const std::size_t end = host.starts_with('[') ? host.find(']') : host.find(':');
    const std::string_view name = host.substr(0, end);
    const std::string_view rest = end == std::string_view::npos ? "" : host.substr(end);
    const std::string_view port = rest.substr(rest.starts_with(']') ? 1 : 0);
    const auto isOf = [](std::string_view text, std::string_view marks) {
        return std::all_of(text.begin(), text.end(), [&](char c) {
            return utils::isLetter(c) || utils::isDigit(c) || marks.find(c) != std::string_view::npos;
        });
    };
    const bool isNumber = std::all_of(port.begin() + (port.empty() ? 0 : 1), port.end(), utils::isDigit);
    const bool isName =
        name.starts_with('[') ? rest.starts_with(']') && isOf(name.substr(1), ":.%-_~") : isOf(name, ".-_~%");
    return isName && name.size() <= kLongestName && isNumber && port.size() <= sizeof ":65535" - 1 &&
           (port.empty() || port.front() == ':');
}

}  // namespace

HttpAnswer HttpAnswer::refusal(const cimxml::WireError& error) {
    return withHeader(static_cast<unsigned int>(error.fault().httpStatus), "CIMError",
                      error.fault().cimError);
}

std::optional<std::uint64_t> contentLengthOf(const HttpHead& head) {
    const std::vector<std::string>& texts = head.contentLengths;
    // Where a proxy and the server believe different lengths, one request hides inside another (RFC
    // 9112 11.2).
    if (texts.empty() || std::adjacent_find(texts.begin(), texts.end(), std::not_equal_to<>()) != texts.end())
        return std::nullopt;
    return utils::parseNumber<std::uint64_t>(texts.front());
}

std::optional<HttpAnswer> checkHead(const HttpHead& head, std::size_t bodyLimit) {
    // Cheap checks first, and all of them before the password: they take no memory and tell nothing secret.
    if (head.isAmbiguous || !isHostAndPort(head.host)) return HttpAnswer::plain(400);
    if (head.method == "M-POST") return HttpAnswer::plain(501);
    if (head.method != "POST") return HttpAnswer::withHeader(405, "Allow", "POST");
    // No client of this protocol sends chunks, and with a length the refusal comes before the body.
    if (head.isChunked || head.contentLengths.empty()) return HttpAnswer::plain(411);
    const std::optional<std::uint64_t> length = contentLengthOf(head);
    if (!length) return HttpAnswer::plain(400);
    if (*length > bodyLimit) return HttpAnswer::plain(413);
    // Nothing here unpacks a body, and one that is small when packed may be huge.
    if (head.contentEncoding && !core::sameName(*head.contentEncoding, "identity"))
        return HttpAnswer::plain(415);
    if (head.contentType && !isXml(*head.contentType)) return HttpAnswer::plain(415);
    try {
        cimxml::checkHeaders(head.cim);
    } catch (const cimxml::WireError& error) {
        return HttpAnswer::refusal(error);
    }
    return std::nullopt;
}

}  // namespace host
