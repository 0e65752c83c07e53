#pragma once

#include "Host/CimXml/Response.h"
#include "Host/CimXml/XmlWriter.h"

namespace cimxml {

/// CLASS.
void writeClass(XmlWriter& writer, const ClassElement& element);

/// QUALIFIER.DECLARATION.
void writeQualifierDeclaration(XmlWriter& writer, const QualifierDeclaration& declaration);

}  // namespace cimxml
