// SPDX-License-Identifier: Apache-2.0
#include "CimXml/Export.h"

#include "CimXml/ElementCodec.h"
#include "Utils/Utils.h"

namespace cimxml {

namespace {

/// Without the attribute, clients take the instance for a text.
void writeEmbedded(XmlWriter& writer, const EmbeddedInstance& property) {
    std::string instance;
    XmlWriter inner(instance);
    writeInstance(inner, *property.instance);
    writer.start("PROPERTY").attribute("NAME", property.name).attribute("TYPE", "string");
    writer.attribute("EmbeddedObject", "object").content();
    writeText(writer, instance);
    writer.end("PROPERTY");
}

}  // namespace

std::string writeExport(const ExportedIndication& indication, std::string_view messageId) {
    std::string out;
    XmlWriter writer(out);
    startEnvelope(writer, messageId, "SIMPLEEXPREQ");
    writer.start("EXPMETHODCALL").attribute("NAME", "ExportIndication").content();
    writer.start("EXPPARAMVALUE").attribute("NAME", "NewIndication").content();
    writer.start("INSTANCE").attribute("CLASSNAME", indication.className).content();
    for (const core::PropertyValue& property : indication.properties) {
        startProperty(writer, property.name, property.value.type, property.value.isArray);
        writer.content();
        writeValue(writer, property.value);
        writer.end(propertyElement(property.value.type, property.value.isArray));
    }
    for (const EmbeddedInstance& property : indication.embedded)
        writeEmbedded(writer, property);
    writer.end("INSTANCE").end("EXPPARAMVALUE").end("EXPMETHODCALL");
    endEnvelope(writer, "SIMPLEEXPREQ");
    return out;
}

ReceivedIndication readExport(std::string_view bytes) {
    pugi::xml_document document;
    const Envelope envelope = openEnvelope(document, bytes, "SIMPLEEXPREQ");
    expectElement(envelope.content, "EXPMETHODCALL");
    const pugi::xml_node parameter = onlyChild(envelope.content);
    expectElement(parameter, "EXPPARAMVALUE");
    ReceivedIndication received{envelope.messageId, readInstance(onlyChild(parameter)), {}};
    const std::string source = received.indication.text("SourceInstance");
    if (source.empty()) return received;
    pugi::xml_document embedded;
    if (!embedded.load_buffer(source.data(), source.size(),
                              pugi::parse_default | pugi::parse_ws_pcdata_single))
        refuseElement(parameter, "embeds an instance that cannot be read");
    received.source = readInstance(embedded.document_element());
    return received;
}

std::string writeExportAnswer(std::string_view messageId) {
    std::string out;
    XmlWriter writer(out);
    startEnvelope(writer, messageId, "SIMPLEEXPRSP");
    writer.start("EXPMETHODRESPONSE").attribute("NAME", "ExportIndication").content();
    writer.end("EXPMETHODRESPONSE");
    endEnvelope(writer, "SIMPLEEXPRSP");
    return out;
}

std::optional<ErrorResult> readExportAnswer(std::string_view bytes) {
    pugi::xml_document document;
    const Envelope envelope = openEnvelope(document, bytes, "SIMPLEEXPRSP");
    expectElement(envelope.content, "EXPMETHODRESPONSE");
    const std::vector<pugi::xml_node> parts = childElements(envelope.content);
    if (parts.empty() || !isElement(parts.front(), "ERROR")) return std::nullopt;
    const std::string code = requiredAttribute(parts.front(), "CODE");
    const auto status = utils::parseNumber<std::uint32_t>(code);
    if (!status) refuseElement(parts.front(), "has a CODE that is no number");
    return ErrorResult{static_cast<core::CimStatus>(*status), parts.front().attribute("DESCRIPTION").value()};
}

}  // namespace cimxml
