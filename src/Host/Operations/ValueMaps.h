#pragma once

#include <string>
#include <vector>

#include "CimXml/Response.h"

namespace host {

/// The qualifiers ValueMap and Values of a property, where clients show the texts in place of the numbers;
/// none for all others.
std::vector<cimxml::Qualifier> valueMapOf(const core::ClassChain& chain, const std::string& property);

}  // namespace host
