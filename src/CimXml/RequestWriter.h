#pragma once

#include <string>

#include "CimXml/Request.h"

namespace cimxml {

/// The request message of a call. Thread-safe, no state.
std::string writeRequest(const Request& request);

}  // namespace cimxml
