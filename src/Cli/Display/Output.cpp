// SPDX-License-Identifier: Apache-2.0
#include "Cli/Display/Output.h"

#include <algorithm>
#include <numeric>
#include <optional>

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

constexpr std::size_t kGap = 2;  // between two columns

/// Measured as printed: a control character takes four columns.
Rows disarmed(Rows rows) {
    for (Row& row : rows)
        for (Cell& cell : row)
            cell.text = printable(cell.text);
    return rows;
}

std::vector<std::size_t> columnWidths(const Rows& rows) {
    // A longer cell does not widen its column: it would take as many spaces in each of the other rows.
    constexpr std::size_t kWidest = 200;
    std::vector<std::size_t> widths;
    for (const Row& row : rows) {
        widths.resize(std::max(widths.size(), row.size()));
        for (std::size_t i = 0; i < row.size(); ++i)
            widths[i] = std::max(widths[i], std::min(columnsOf(row[i].text), kWidest));
    }
    return widths;
}

/// The widest columns made narrower until all fit; nothing where they would become too narrow to read. The
/// first column stays whole: it names the row, and people copy it.
std::optional<std::vector<std::size_t>> fittedWidths(std::vector<std::size_t> widths, std::size_t width) {
    constexpr std::size_t kNarrowest = 14;
    const auto total = [&] {
        return std::accumulate(widths.begin(), widths.end(), kGap * (widths.size() - 1));
    };
    while (widths.size() > 1 && total() > width) {
        const auto widest = std::max_element(widths.begin() + 1, widths.end());
        if (*widest <= kNarrowest) return std::nullopt;
        --*widest;
    }
    return widths;
}

void printLine(std::ostream& out, const Row& row, const std::vector<std::size_t>& widths) {
    // Nothing follows the last cell, so no spaces either.
    for (std::size_t i = 0; i < row.size(); ++i) {
        const auto& [text, look] = row[i];
        out << coloured(out, look, text);
        if (i + 1 < row.size())
            out << std::string(widths[i] + kGap - std::min(columnsOf(text), widths[i]), ' ');
    }
    out << '\n';
}

/// The row on as many lines as its longest cell takes.
void printWrapped(std::ostream& out, Row rest, const std::vector<std::size_t>& widths) {
    while (std::ranges::any_of(rest, [](const Cell& cell) { return !cell.text.empty(); })) {
        Row line;
        for (std::size_t i = 0; i < rest.size(); ++i)
            line.emplace_back(takeLine(rest[i].text, widths[i]), rest[i].look);
        while (line.back().text.empty())
            line.pop_back();
        printLine(out, line, widths);
    }
}

/// For a terminal too narrow for the table: a block of lines for each row, with the heading before each cell.
void printBlocks(std::ostream& out, const Rows& rows) {
    const Row& headings = rows.front();
    std::size_t width = 0;
    for (const Cell& heading : headings)
        width = std::max(width, columnsOf(heading.text));
    for (std::size_t row = 1; row < rows.size(); ++row) {
        if (row > 1) out << '\n';
        for (std::size_t i = 0; i < rows[row].size(); ++i)
            printLine(out, {headings[i], rows[row][i]}, {width, 0});
    }
}

void printFitted(std::ostream& out, const Rows& rows, std::size_t width) {
    const std::vector<std::size_t> widths = columnWidths(rows);
    const std::optional<std::vector<std::size_t>> fitting = fittedWidths(widths, width);
    // Two columns may have no headings, and a block would be no narrower.
    if (!fitting && widths.size() > 2) return printBlocks(out, rows);
    const bool isWrapped = fitting && *fitting != widths;
    for (const Row& row : rows) {
        if (isWrapped)
            printWrapped(out, row, *fitting);
        else
            printLine(out, row, widths);
    }
}

}  // namespace

void printJson(std::ostream& out, const Json& document) {
    out << document.dump(2, ' ', true, Json::error_handler_t::replace) << '\n';
}

std::string jsonLine(const Json& document) {
    return document.dump(-1, ' ', true, Json::error_handler_t::replace);
}

void printTable(std::ostream& out, const Rows& rows) {
    printTable(out, rows, widthOf(out));
}

void printTable(std::ostream& out, const Rows& rows, std::size_t width) {
    Rows shown = disarmed(rows);
    for (Cell& heading : shown.front())
        heading.look = Look::Heading;
    printFitted(out, shown, width);
}

void printPairs(std::ostream& out, const Rows& rows) {
    printFitted(out, disarmed(rows), widthOf(out));
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
