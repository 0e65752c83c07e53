#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "Host/Authentication/Identity.h"

namespace host {

/// The bytes of a base64 text (RFC 4648 4), with or without padding; nothing for any other text.
std::optional<std::string> decodeBase64(std::string_view text);

/// The credentials in an Authorization header (RFC 7617), split at the first colon. Nothing for another
/// scheme, a broken text, or one with a NUL byte, which the password files of a system cannot hold.
std::optional<Credentials> readBasicHeader(std::string_view header);

}  // namespace host
