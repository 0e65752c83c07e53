#include "CimXml/InstanceWriter.h"

#include "CimXml/ValueWriter.h"

namespace cimxml {

namespace {

using ClassOrigins = std::map<std::string, std::string>;

const ClassOrigins* originsOf(const Origins* origins, const std::string& className) {
    if (origins == nullptr) return nullptr;
    const auto found = origins->find(core::foldName(className));
    return found == origins->end() ? nullptr : &found->second;
}

std::string_view elementOf(const core::CimValue& value) {
    if (value.isArray) return "PROPERTY.ARRAY";
    return value.type == core::CimType::Reference ? "PROPERTY.REFERENCE" : "PROPERTY";
}

void writeProperty(XmlWriter& writer, const core::PropertyValue& property, const ClassOrigins* origins) {
    const std::string_view element = elementOf(property.value);
    writer.start(element).attribute("NAME", property.name);
    if (element == "PROPERTY.REFERENCE") {
        if (!property.referenceClass.empty()) writer.attribute("REFERENCECLASS", property.referenceClass);
    } else {
        writer.attribute("TYPE", core::typeName(property.value.type));
    }
    if (origins != nullptr) {
        const auto found = origins->find(core::foldName(property.name));
        if (found != origins->end()) writer.attribute("CLASSORIGIN", found->second);
    }
    writer.content();
    writeValue(writer, property.value);
    writer.end(element);
}

}  // namespace

void writeInstance(XmlWriter& writer, const core::InstanceValue& instance, const Origins* origins) {
    const std::string& className = instance.path.getClassName();
    const ClassOrigins* known = originsOf(origins, className);
    writer.start("INSTANCE").attribute("CLASSNAME", className).content();
    for (const core::PropertyValue& property : instance.properties)
        writeProperty(writer, property, known);
    writer.end("INSTANCE");
}

}  // namespace cimxml
