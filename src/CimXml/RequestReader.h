#pragma once

#include <string_view>

#include "CimXml/Request.h"

namespace cimxml {

/// Reads a request message (DSP0201). Keys of paths are left as texts, and a namespace that a path lacks is
/// taken from the call. Throws WireError for bytes that are no such message; whether operation, parameters,
/// classes and values exist is not looked at. Thread-safe, no state.
Request readRequest(std::string_view bytes);

}  // namespace cimxml
