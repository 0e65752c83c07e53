// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <array>

#include "CimXml/ElementCodec.h"

namespace cimxml {

namespace {

using core::CimType;

/// In the order of the types of a scalar. A cell has the same, but for the last.
constexpr std::array kHeldTypes{CimType::Boolean, CimType::Uint64,   CimType::Sint64,   CimType::Real64,
                                CimType::String,  CimType::Datetime, CimType::Reference};
static_assert(kHeldTypes.size() == std::variant_size_v<core::CimScalar>);
static_assert(kHeldTypes.size() - 1 == std::variant_size_v<core::CimCell>);

/// VALUE.REFERENCE.
void writeReference(XmlWriter& writer, const core::CimPath& path) {
    writer.open("VALUE.REFERENCE");
    // Common clients read a local path in any place; a bare name would leave them without a namespace.
    if (path.getNamespace().empty() && path.isInstancePath()) {
        writeInstanceName(writer, path);
    } else {
        writeLocalPath(writer, path);
    }
    writer.end("VALUE.REFERENCE");
}

void writeScalar(XmlWriter& writer, CimType type, const core::CimScalar& value) {
    if (const auto* path = std::get_if<core::CimPath>(&value)) {
        writeReference(writer, *path);
    } else if (type == CimType::Reference) {
        // Held as the text that somebody typed.
        writeReference(writer, core::CimPath(core::scalarText(value)));
    } else {
        writeCell(writer, core::cellOf(value));
    }
}

}  // namespace

CimType typeOfScalar(const core::CimScalar& value) {
    return kHeldTypes[value.index()];
}

void writeCellText(XmlWriter& writer, const core::CimCell& cell) {
    core::CellBuffer buffer;
    const std::string_view text = core::cellText(cell, buffer);
    // Only texts can hold what has to be escaped.
    if (std::holds_alternative<std::string_view>(cell)) {
        writer.text(text);
    } else {
        writer.raw(text);
    }
}

void writeCell(XmlWriter& writer, const core::CimCell& cell) {
    writer.raw("<VALUE>");
    writeCellText(writer, cell);
    writer.raw("</VALUE>");
}

// Old clients know VALUETYPE alone, and TYPE tells apart what it throws together. A number is held without
// its width, and a wrong TYPE would be worse than none.
void startKeyValue(XmlWriter& writer, CimType type) {
    const bool isNumber = core::isUnsigned(type) || core::isSigned(type) || core::isReal(type);
    const bool isText = !isNumber && type != CimType::Boolean && type != CimType::Datetime;
    writer.start("KEYVALUE");
    writer.attribute("VALUETYPE", type == CimType::Boolean ? "boolean" : isNumber ? "numeric" : "string");
    if (!isNumber) writer.attribute("TYPE", core::typeName(isText ? CimType::String : type));
    writer.content();
}

void writeKeyValue(XmlWriter& writer, const core::CimCell& cell) {
    startKeyValue(writer, kHeldTypes[cell.index()]);
    writeCellText(writer, cell);
    writer.end("KEYVALUE");
}

void writeNamespace(XmlWriter& writer, std::string_view namespaceName) {
    writer.open("LOCALNAMESPACEPATH");
    while (!namespaceName.empty()) {
        const std::string_view part = namespaceName.substr(0, namespaceName.find('/'));
        if (!part.empty()) writer.start("NAMESPACE").attribute("NAME", part).empty();
        namespaceName.remove_prefix(std::min(part.size() + 1, namespaceName.size()));
    }
    writer.end("LOCALNAMESPACEPATH");
}

void writeClassName(XmlWriter& writer, std::string_view name) {
    writer.start("CLASSNAME").attribute("NAME", name).empty();
}

void writeInstanceName(XmlWriter& writer, const core::CimPath& path) {
    writer.start("INSTANCENAME").attribute("CLASSNAME", path.getClassName()).content();
    for (const core::CimKey& key : path.getKeys()) {
        writer.start("KEYBINDING").attribute("NAME", key.name).content();
        if (const auto* reference = std::get_if<core::CimPath>(&key.value)) {
            writeReference(writer, *reference);
        } else {
            writeKeyValue(writer, core::cellOf(key.value));
        }
        writer.end("KEYBINDING");
    }
    writer.end("INSTANCENAME");
}

void writeLocalPath(XmlWriter& writer, const core::CimPath& path) {
    const std::string_view element = path.isInstancePath() ? "LOCALINSTANCEPATH" : "LOCALCLASSPATH";
    writer.open(element);
    writeNamespace(writer, path.getNamespace());
    if (path.isInstancePath()) {
        writeInstanceName(writer, path);
    } else {
        writeClassName(writer, path.getClassName());
    }
    writer.end(element);
}

void writeInstancePath(XmlWriter& writer, const core::CimPath& path, std::string_view host) {
    writer.open("INSTANCEPATH").open("NAMESPACEPATH").open("HOST");
    // With host and port in it, a client can put a scheme in front of the path and come back with it.
    writer.text(path.getHost().empty() ? host : std::string_view(path.getHost())).end("HOST");
    writeNamespace(writer, path.getNamespace());
    writer.end("NAMESPACEPATH");
    writeInstanceName(writer, path);
    writer.end("INSTANCEPATH");
}

void writeValue(XmlWriter& writer, const core::CimValue& value) {
    if (const core::CimScalar* scalar = value.scalar()) {
        writeScalar(writer, value.type, *scalar);
    } else if (const std::vector<core::CimScalar>* elements = value.elements()) {
        const std::string_view array = value.type == CimType::Reference ? "VALUE.REFARRAY" : "VALUE.ARRAY";
        writer.open(array);
        for (const core::CimScalar& element : *elements)
            writeScalar(writer, value.type, element);
        writer.end(array);
    }
}

void writeText(XmlWriter& writer, std::string_view text) {
    writer.open("VALUE").text(text).end("VALUE");
}

void writeArgument(XmlWriter& writer, const core::Argument& argument) {
    writer.start("PARAMVALUE").attribute("NAME", argument.name);
    if (!argument.isUntyped) writer.attribute("PARAMTYPE", core::typeName(argument.value.type));
    writer.content();
    writeValue(writer, argument.value);
    writer.end("PARAMVALUE");
}

std::string_view propertyElement(CimType type, bool isArray) {
    if (isArray) return "PROPERTY.ARRAY";
    return type == CimType::Reference ? "PROPERTY.REFERENCE" : "PROPERTY";
}

}  // namespace cimxml
