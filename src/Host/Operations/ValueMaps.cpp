#include "Host/Operations/ValueMaps.h"

#include "Framework/Model/SchemaQualifiers.h"

namespace host {

namespace {

cimxml::Qualifier textsQualifier(std::string name, std::vector<core::CimScalar> texts) {
    return {std::move(name), core::CimValue::arrayOf(core::CimType::String, std::move(texts)), true};
}

/// From the nearest class that the schema has them for: a subclass repeats properties without their values.
core::SchemaQualifiers findQualifiers(const core::ClassChain& chain, const std::string& property) {
    for (const auto& declaration : chain) {
        core::SchemaQualifiers found = core::elementQualifiers(declaration->name, property);
        if (!found.values.empty()) return found;
    }
    return {};
}

}  // namespace

std::vector<cimxml::Qualifier> valueMapOf(const core::ClassChain& chain, const std::string& property) {
    std::vector<core::CimScalar> values;
    std::vector<core::CimScalar> texts;
    for (const core::ValueMeaning& one : findQualifiers(chain, property).values) {
        values.emplace_back(std::string(one.value));
        texts.emplace_back(std::string(one.meaning));
    }
    if (values.empty()) return {};
    return {textsQualifier("ValueMap", std::move(values)), textsQualifier("Values", std::move(texts))};
}

}  // namespace host
