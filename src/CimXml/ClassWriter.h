#pragma once

#include "CimXml/Response.h"
#include "CimXml/XmlWriter.h"

namespace cimxml {

/// CLASS.
void writeClass(XmlWriter& writer, const ClassElement& element);

/// QUALIFIER.DECLARATION.
void writeQualifierDeclaration(XmlWriter& writer, const QualifierDeclaration& declaration);

}  // namespace cimxml
