#pragma once

#include <string>

#include "CimXml/Response.h"

namespace cimxml {

/// The response message, in the forms that the common clients read. Thread-safe, no state.
std::string writeResponse(const Response& response);

}  // namespace cimxml
