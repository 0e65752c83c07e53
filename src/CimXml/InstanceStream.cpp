// SPDX-License-Identifier: Apache-2.0
#include "CimXml/InstanceStream.h"

#include <utility>

#include "CimXml/ElementCodec.h"
#include "CimXml/ShapeMarkup.h"
#include "Framework/Model/CimInstance.h"
#include "Framework/Model/CimProperty.h"

namespace cimxml {

// Every property of a long answer comes here, and an append costs more than what it appends.
void InstanceStream::writeProperty(const core::CimProperty& property, const ShapeMarkup& markup,
                                   std::size_t index) {
    if (property.isNull()) {
        m_writer.raw(markup.nullHead(index)).raw(property.isArray() ? "</PROPERTY.ARRAY>" : "</PROPERTY>");
        return;
    }
    m_writer.raw(markup.head(index));
    if (!property.isArray()) {
        writeCellText(m_writer, property.cell(0));
        m_writer.raw("</VALUE></PROPERTY>");
        return;
    }
    for (std::size_t i = 0; i < property.cellCount(); ++i)
        writeCell(m_writer, property.cell(i));
    m_writer.raw("</VALUE.ARRAY></PROPERTY.ARRAY>");
}

/// INSTANCENAME, which has to name every key: one that is null by an empty text. Like markupOf(), it is
/// called under the instance's lock.
void InstanceStream::writePath(const core::CimInstance& instance, const std::string& className,
                               const ShapeMarkup& markup) QUENX_NO_THREAD_SAFETY_ANALYSIS {
    m_writer.start("INSTANCENAME").attribute("CLASSNAME", className).content();
    for (const std::size_t index : instance.keyIndices()) {
        core::CimProperty& key = *instance.getAllProperties()[index];
        if (key.isNull() || key.isArray()) {
            m_writer.start("KEYBINDING").attribute("NAME", key.getName()).content();
            writeKeyValue(m_writer, core::CimCell(std::string_view()));
            m_writer.raw("</KEYBINDING>");
        } else {
            m_writer.raw(markup.keyHead(index));
            writeCellText(m_writer, key.cell(0));
            m_writer.raw("</KEYVALUE></KEYBINDING>");
        }
    }
    m_writer.raw("</INSTANCENAME>");
}

const ShapeMarkup& InstanceStream::markupOf(const core::CimInstance& instance)
    QUENX_NO_THREAD_SAFETY_ANALYSIS {
    const void* shape = &instance.shape();
    if (shape != m_shape) m_markup = &ShapeMarkup::of(shape, instance.getAllProperties());
    m_shape = shape;
    return *m_markup;
}

std::size_t InstanceStream::take(const core::InstanceCells& cells) {
    begin();
    const ShapeMarkup& markup = markupOf(cells.instance);
    const std::string className = cells.instance.getCreationClassName();
    if (m_hasPaths) {
        m_writer.raw("<VALUE.NAMEDINSTANCE>");
        writePath(cells.instance, className, markup);
    }
    m_writer.start("INSTANCE").attribute("CLASSNAME", className).content();
    for (const std::size_t index : cells.wanted)
        writeProperty(*cells.instance.getAllProperties()[index], markup, index);
    m_writer.raw(m_hasPaths ? "</INSTANCE></VALUE.NAMEDINSTANCE>" : "</INSTANCE>");
    return grown();
}

std::size_t InstanceStream::take(const core::InstanceValue& instance) {
    begin();
    if (m_hasPaths) {
        writeNamedInstance(m_writer, instance);
    } else {
        writeInstance(m_writer, instance);
    }
    return grown();
}

Pieces InstanceStream::finish() {
    begin();
    endResult(m_writer);
    m_told = 0;
    m_inFullPieces = 0;
    m_full.push_back(std::exchange(m_text, {}));
    return std::exchange(m_full, {});
}

void InstanceStream::begin() {
    makeRoom();
    if (size() == 0) startResult(m_writer, m_messageId, m_operation);
}

void InstanceStream::makeRoom() {
    constexpr std::size_t kOneInstance = std::size_t{8} << 10;
    // Small enough for the C library to keep: the system would clear each page of a larger one for each
    // answer.
    constexpr std::size_t kPiece = std::size_t{128} << 10;
    const std::size_t room = m_text.capacity();
    if (room - m_text.size() >= kOneInstance) return;
    if (room >= kPiece) {
        m_inFullPieces += m_text.size();
        m_full.push_back(std::exchange(m_text, {}));
    }
    m_text.reserve(room < kOneInstance ? 2 * kOneInstance : kPiece);
}

std::size_t InstanceStream::grown() {
    return size() - std::exchange(m_told, size());
}

}  // namespace cimxml
