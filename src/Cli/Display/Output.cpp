// SPDX-License-Identifier: Apache-2.0
#include "Cli/Display/Output.h"

#include <algorithm>

#include "Cli/Display/Messages.h"
#include "Cli/Display/Terminal.h"
#include "Utils/Utils.h"

namespace cli {

namespace {

struct ScalarToJson {
    Json operator()(const utils::Time& value) const { return core::datetimeText(value); }
    template <class T>
    Json operator()(const T& value) const {
        return value;
    }
};

std::string displayScalar(core::CimType type, const core::CimScalar& value) {
    const std::string text = core::scalarText(value);
    const bool isText = type == core::CimType::String || type == core::CimType::Char16;
    return printable(isText ? utils::quoted(text) : text);
}

}  // namespace

void printJson(std::ostream& out, const Json& document) {
    out << document.dump(2, ' ', true, Json::error_handler_t::replace) << '\n';
}

std::string jsonLine(const Json& document) {
    return document.dump(-1, ' ', true, Json::error_handler_t::replace);
}

void printTable(std::ostream& out, const std::vector<std::vector<std::string>>& rows) {
    // A longer cell does not widen its column: it would take as many spaces in each of the other rows.
    constexpr std::size_t kWidest = 200;
    // Measured as printed: a control character takes four columns.
    std::vector<std::size_t> widths;
    for (const auto& row : rows) {
        widths.resize(std::max(widths.size(), row.size()));
        for (std::size_t i = 0; i < row.size(); ++i)
            widths[i] = std::max(widths[i], std::min(columnsOf(printable(row[i])), kWidest));
    }
    for (const auto& row : rows) {
        for (std::size_t i = 0; i < row.size(); ++i) {
            const std::string cell = printable(row[i]);
            out << cell;
            // Nothing follows the last cell, so no spaces either.
            if (i + 1 < row.size())
                out << std::string(widths[i] + 2 - std::min(columnsOf(cell), widths[i]), ' ');
        }
        out << '\n';
    }
}

std::string displayText(const core::CimValue& value) {
    if (const core::CimScalar* scalar = value.scalar()) return displayScalar(value.type, *scalar);
    if (value.elements() == nullptr) return "NULL";
    std::vector<std::string> texts;
    for (const core::CimScalar& element : *value.elements())
        texts.push_back(displayScalar(value.type, element));
    return "{" + joined(texts) + "}";
}

}  // namespace cli

namespace nlohmann {

void adl_serializer<core::CimValue>::to_json(cli::Json& json, const core::CimValue& value) {
    // Null, where neither holds, is what the document is already.
    if (const core::CimScalar* scalar = value.scalar()) {
        json = std::visit(cli::ScalarToJson(), *scalar);
    } else if (const std::vector<core::CimScalar>* elements = value.elements()) {
        json = cli::Json::array();
        for (const core::CimScalar& element : *elements)
            json.push_back(std::visit(cli::ScalarToJson(), element));
    }
}

void adl_serializer<core::InstanceValue>::to_json(cli::Json& json, const core::InstanceValue& instance) {
    // Appended, not assigned: to look each name up would take quadratic time, and no two are the same.
    cli::Json::object_t properties;
    for (const core::PropertyValue& property : instance.properties)
        properties.emplace_back(property.name, property.value);
    json = {{"path", instance.path},
            {"class", instance.path.getClassName()},
            {"properties", std::move(properties)}};
}

}  // namespace nlohmann
