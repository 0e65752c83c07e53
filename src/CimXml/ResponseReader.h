#pragma once

#include <string_view>

#include "CimXml/Response.h"

namespace cimxml {

/// Reads a response message, as a client. Values and keys are typed by what the message says of them. The
/// instance of GetInstance comes without the keys in its path, since the message has none; an empty
/// IRETURNVALUE tells no kind. Qualifier declarations are passed over. Throws WireError for bytes that are
/// no response. Thread-safe, no state.
Response readResponse(std::string_view bytes);

}  // namespace cimxml
