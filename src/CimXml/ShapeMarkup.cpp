// SPDX-License-Identifier: Apache-2.0
#include "CimXml/ShapeMarkup.h"

#include <memory>
#include <unordered_map>

#include "CimXml/ElementCodec.h"
#include "Framework/Model/CimProperty.h"
#include "Utils/Os/Linux/Mutex.h"

namespace cimxml {

const ShapeMarkup& ShapeMarkup::of(const void* shape, const std::vector<core::CimProperty*>& properties) {
    static utils::Mutex mutex;
    static std::unordered_map<const void*, std::unique_ptr<const ShapeMarkup>> known;
    const utils::Mutex::AutoLocker lock(mutex);
    auto& markup = known[shape];
    if (markup == nullptr) markup = std::make_unique<const ShapeMarkup>(properties);
    return *markup;
}

ShapeMarkup::ShapeMarkup(const std::vector<core::CimProperty*>& properties) {
    XmlWriter writer(m_text);
    const auto position = [&] { return static_cast<std::uint32_t>(m_text.size()); };
    for (core::CimProperty* property : properties) {
        Parts& parts = m_parts.emplace_back();
        parts.head.start = parts.nullHead.start = position();
        startProperty(writer, property->getName(), property->getType(), property->isArray());
        writer.content();
        parts.nullHead.length = position() - parts.nullHead.start;
        writer.open(property->isArray() ? "VALUE.ARRAY" : "VALUE");
        parts.head.length = position() - parts.head.start;
        if (!property->isKey() || property->isArray()) continue;
        parts.keyHead.start = position();
        writer.start("KEYBINDING").attribute("NAME", property->getName()).content();
        startKeyValue(writer, property->getType());
        parts.keyHead.length = position() - parts.keyHead.start;
    }
    m_text.shrink_to_fit();
}

}  // namespace cimxml
