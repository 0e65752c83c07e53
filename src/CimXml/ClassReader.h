#pragma once

#include <pugixml.hpp>

#include "CimXml/Response.h"

namespace cimxml {

/// CLASS, as a client reads it. WireError (not valid) for anything else.
ClassElement readClass(const pugi::xml_node& element);

}  // namespace cimxml
