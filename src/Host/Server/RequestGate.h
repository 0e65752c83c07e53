#pragma once

#include <optional>

#include "Host/Server/HttpMessage.h"

namespace host {

/// What the head of a request alone is refused for: method, length, content type, CIM headers. Nothing when
/// the body may be read.
std::optional<HttpAnswer> refuseByHead(const HttpHead& head, std::size_t bodyLimit);

}  // namespace host
