// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <pugixml.hpp>

#include "CimXml/XmlText.h"
#include "Framework/Model/ClassDeclaration.h"

namespace cimxml {

/// CLASS, as a client reads it: what is a key, an output and an association is taken from the qualifiers.
/// WireError (not valid) for anything else.
core::ClassDeclaration readClass(const pugi::xml_node& element);

/// CLASS. The flavors of its qualifiers are those of their declarations.
void writeClass(XmlWriter& writer, const core::ClassDeclaration& declaration);

/// QUALIFIER.DECLARATION.
void writeQualifierDeclaration(XmlWriter& writer, const core::QualifierDeclaration& declaration);

}  // namespace cimxml
