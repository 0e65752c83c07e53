// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>
#include <string_view>

#include "CimXml/Request.h"
#include "CimXml/XmlText.h"
#include "Framework/Requests/RequestValues.h"

namespace cimxml {

/// LOCALNAMESPACEPATH of the namespace's parts.
void writeNamespace(XmlWriter& writer, std::string_view namespaceName);

/// INSTANCENAME, with references among the keys as LOCALINSTANCEPATH.
void writeInstanceName(XmlWriter& writer, const core::CimPath& path);

/// LOCALINSTANCEPATH or LOCALCLASSPATH, whichever the path is.
void writeLocalPath(XmlWriter& writer, const core::CimPath& path);

/// INSTANCEPATH; the host stands in for one that the path does not have.
void writeInstancePath(XmlWriter& writer, const core::CimPath& path, std::string_view host);

/// VALUE.REFERENCE.
void writeReference(XmlWriter& writer, const core::CimPath& path);

/// VALUE, VALUE.ARRAY, VALUE.REFERENCE or VALUE.REFARRAY; nothing for null.
void writeValue(XmlWriter& writer, const core::CimValue& value);

/// PARAMVALUE with its type.
void writeParamValue(XmlWriter& writer, const core::Argument& argument);

/// VALUE.ARRAY of texts.
void writeTexts(XmlWriter& writer, const std::vector<std::string>& texts);

}  // namespace cimxml
