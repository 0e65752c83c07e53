// SPDX-License-Identifier: Apache-2.0
#include "CimXml/ValueWriter.h"

#include <algorithm>

namespace cimxml {

namespace {

struct KeyType {
    std::string_view valueType;
    std::string_view type;  ///< empty where the width of a number is not known
    core::CimType cimType;
};

/// The attributes of a key. Old clients know VALUETYPE alone, and TYPE tells apart what it throws together; a
/// wrong width in TYPE would be worse than none.
struct KeyTypes {
    KeyType operator()(bool) const { return {"boolean", "boolean", core::CimType::Boolean}; }
    KeyType operator()(std::uint64_t) const { return {"numeric", "", core::CimType::Uint64}; }
    KeyType operator()(std::int64_t) const { return {"numeric", "", core::CimType::Sint64}; }
    KeyType operator()(double) const { return {"numeric", "", core::CimType::Real64}; }
    KeyType operator()(const std::string&) const { return {"string", "string", core::CimType::String}; }
    KeyType operator()(const utils::Time&) const { return {"string", "datetime", core::CimType::Datetime}; }
    KeyType operator()(const core::CimPath&) const {
        return {"string", "reference", core::CimType::Reference};
    }
};

void writeText(XmlWriter& writer, core::CimType type, const core::CimScalar& value) {
    // Most values are texts, and copying one only to escape it costs as much again.
    if (const auto* text = std::get_if<std::string>(&value)) {
        writer.text(*text);
    } else {
        writer.text(core::scalarText(type, value));
    }
}

void writeKeyValue(XmlWriter& writer, const core::CimScalar& value) {
    if (const auto* path = std::get_if<core::CimPath>(&value)) {
        writeReference(writer, *path);
        return;
    }
    const KeyType type = std::visit(KeyTypes(), value);
    writer.start("KEYVALUE").attribute("VALUETYPE", type.valueType);
    if (!type.type.empty()) writer.attribute("TYPE", type.type);
    writer.content();
    writeText(writer, type.cimType, value);
    writer.end("KEYVALUE");
}

void writeScalar(XmlWriter& writer, core::CimType type, const core::CimScalar& value) {
    if (const auto* path = std::get_if<core::CimPath>(&value)) {
        writeReference(writer, *path);
        return;
    }
    writer.open("VALUE");
    writeText(writer, type, value);
    writer.end("VALUE");
}

}  // namespace

void writeNamespace(XmlWriter& writer, std::string_view namespaceName) {
    writer.open("LOCALNAMESPACEPATH");
    while (!namespaceName.empty()) {
        const std::string_view part = namespaceName.substr(0, namespaceName.find('/'));
        if (!part.empty()) writer.start("NAMESPACE").attribute("NAME", part).empty();
        namespaceName.remove_prefix(std::min(part.size() + 1, namespaceName.size()));
    }
    writer.end("LOCALNAMESPACEPATH");
}

void writeInstanceName(XmlWriter& writer, const core::CimPath& path) {
    writer.start("INSTANCENAME").attribute("CLASSNAME", path.getClassName()).content();
    for (const core::CimKey& key : path.getKeys()) {
        writer.start("KEYBINDING").attribute("NAME", key.name).content();
        writeKeyValue(writer, key.value);
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
        writer.start("CLASSNAME").attribute("NAME", path.getClassName()).empty();
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

void writeReference(XmlWriter& writer, const core::CimPath& path) {
    writer.open("VALUE.REFERENCE");
    // Both common clients read a local path in any place; a bare name would leave them without a namespace.
    if (path.getNamespace().empty() && path.isInstancePath()) {
        writeInstanceName(writer, path);
    } else {
        writeLocalPath(writer, path);
    }
    writer.end("VALUE.REFERENCE");
}

void writeValue(XmlWriter& writer, const core::CimValue& value) {
    if (const core::CimScalar* scalar = value.scalar()) {
        writeScalar(writer, value.type, *scalar);
    } else if (const std::vector<core::CimScalar>* elements = value.elements()) {
        const std::string_view array =
            value.type == core::CimType::Reference ? "VALUE.REFARRAY" : "VALUE.ARRAY";
        writer.open(array);
        for (const core::CimScalar& element : *elements)
            writeScalar(writer, value.type, element);
        writer.end(array);
    }
}

void writeParamValue(XmlWriter& writer, const core::Argument& argument) {
    writer.start("PARAMVALUE").attribute("NAME", argument.name);
    writer.attribute("PARAMTYPE", core::typeName(argument.value.type)).content();
    writeValue(writer, argument.value);
    writer.end("PARAMVALUE");
}

void writeTexts(XmlWriter& writer, const std::vector<std::string>& texts) {
    writer.open("VALUE.ARRAY");
    for (const std::string& text : texts)
        writer.open("VALUE").text(text).end("VALUE");
    writer.end("VALUE.ARRAY");
}

}  // namespace cimxml
