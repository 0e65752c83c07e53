#pragma once

#include <string_view>

#include "CimXml/Response.h"
#include "CimXml/XmlWriter.h"

namespace cimxml {

/// INSTANCE. Null properties are written as elements without a value; class origins where they are known.
void writeInstance(XmlWriter& writer, const core::InstanceValue& instance, const Origins* origins);

}  // namespace cimxml
