// SPDX-License-Identifier: Apache-2.0
#include "CimXml/InstanceStream.h"

#include <utility>

#include "CimXml/ElementCodec.h"
#include "Framework/Model/CimInstance.h"
#include "Framework/Model/CimProperty.h"

namespace cimxml {

namespace {

/// As writeValue() writes a value that is not null.
void writeCells(XmlWriter& writer, const core::CimProperty& property) {
    if (property.isArray()) writer.raw("<VALUE.ARRAY>");
    for (std::size_t i = 0; i < property.cellCount(); ++i)
        writeCell(writer, property.cell(i));
    if (property.isArray()) writer.raw("</VALUE.ARRAY>");
}

void startElement(XmlWriter& writer, core::CimProperty& property) {
    startProperty(writer, property.getName(), property.getType(), property.isArray());
    writer.content();
}

std::string_view elementOf(core::CimProperty& property) {
    return propertyElement(property.getType(), property.isArray());
}

/// INSTANCENAME, which has to name every key: one that is null by an empty text.
void writePath(XmlWriter& writer, const core::CimInstance& instance, const std::string& className) {
    writer.start("INSTANCENAME").attribute("CLASSNAME", className).content();
    for (const core::CimProperty* key : instance.getKeys()) {
        writer.start("KEYBINDING").attribute("NAME", key->getName()).content();
        const bool isEmpty = key->isNull() || key->isArray();
        writeKeyValue(writer, isEmpty ? core::CimCell(std::string_view()) : key->cell(0));
        writer.end("KEYBINDING");
    }
    writer.end("INSTANCENAME");
}

/// One alone of its shape.
void writeFirst(XmlWriter& writer, const core::InstanceCells& cells) {
    for (const std::size_t index : cells.wanted) {
        core::CimProperty& property = *cells.instance.getAllProperties()[index];
        startElement(writer, property);
        if (!property.isNull()) writeCells(writer, property);
        writer.end(elementOf(property));
    }
}

}  // namespace

InstanceStream::ShapeMarkup InstanceStream::markupOf(const core::InstanceCells& cells) {
    ShapeMarkup markup;
    for (const std::size_t index : cells.wanted) {
        core::CimProperty& property = *cells.instance.getAllProperties()[index];
        Markup& made = markup.emplace_back();
        XmlWriter head(made.head);
        startElement(head, property);
        XmlWriter(made.tail).end(elementOf(property));
        made.null = made.head + made.tail;
    }
    return markup;
}

void InstanceStream::writeInstance(const core::InstanceCells& cells, const ShapeMarkup& markup) {
    for (std::size_t i = 0; i < markup.size(); ++i) {
        const core::CimProperty& property = *cells.instance.getAllProperties()[cells.wanted[i]];
        if (property.isNull()) {
            m_writer.raw(markup[i].null);
            continue;
        }
        m_writer.raw(markup[i].head);
        writeCells(m_writer, property);
        m_writer.raw(markup[i].tail);
    }
}

std::size_t InstanceStream::take(const core::InstanceCells& cells) {
    begin();
    const std::string className = cells.instance.getCreationClassName();
    m_writer.open("VALUE.NAMEDINSTANCE");
    writePath(m_writer, cells.instance, className);
    m_writer.start("INSTANCE").attribute("CLASSNAME", className).content();
    const auto [entry, isFirst] = m_shapes.try_emplace(&cells.wanted);
    if (isFirst) {
        writeFirst(m_writer, cells);
    } else {
        if (entry->second.empty()) entry->second = markupOf(cells);
        writeInstance(cells, entry->second);
    }
    m_writer.end("INSTANCE").end("VALUE.NAMEDINSTANCE");
    return grown();
}

std::size_t InstanceStream::take(const core::InstanceValue& instance) {
    begin();
    writeNamedInstance(m_writer, instance);
    return grown();
}

std::string InstanceStream::finish() {
    begin();
    endResult(m_writer);
    m_told = 0;
    return std::exchange(m_text, {});
}

void InstanceStream::begin() {
    makeRoom();
    if (m_text.empty()) startResult(m_writer, m_messageId, m_operation);
}

void InstanceStream::makeRoom() {
    constexpr std::size_t kOneInstance = std::size_t{8} << 10;
    constexpr std::size_t kFew = std::size_t{128} << 10;
    constexpr std::size_t kMany = std::size_t{8} << 20;
    const std::size_t room = m_text.capacity();
    if (room - m_text.size() >= kOneInstance) return;
    // A long answer is not copied again and again while it grows: the system gives large pieces page by page
    // as they are written, so room to spare is no memory.
    m_text.reserve(room < kOneInstance ? 2 * kOneInstance
                   : room < kFew       ? kFew
                   : room < kMany      ? kMany
                                       : 2 * room);
}

std::size_t InstanceStream::grown() {
    return m_text.size() - std::exchange(m_told, m_text.size());
}

}  // namespace cimxml
