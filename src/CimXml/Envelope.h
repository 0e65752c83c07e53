#pragma once

#include <pugixml.hpp>
#include <string>
#include <string_view>

#include "CimXml/XmlWriter.h"

namespace cimxml {

/// What a message carries, with the wrapping taken off.
struct Envelope {
    std::string messageId;
    pugi::xml_node content;  ///< the call or the response; lives as long as the document
};

/// Reads the bytes into the document and opens CIM, MESSAGE and SIMPLEREQ or SIMPLERSP, as named. Any minor
/// version is taken. Throws WireError.
Envelope openEnvelope(pugi::xml_document& document, std::string_view bytes, std::string_view wrapper);

/// Writes the same in front of a message's content, and behind it.
void startEnvelope(XmlWriter& writer, std::string_view messageId, std::string_view wrapper);
void endEnvelope(XmlWriter& writer, std::string_view wrapper);

}  // namespace cimxml
