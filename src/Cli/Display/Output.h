// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <nlohmann/json.hpp>
#include <ostream>
#include <string>
#include <vector>

#include "Cli/Display/Colour.h"
#include "Framework/Requests/CimOperations.h"

/// Results, as text for a person and as JSON for a script.
namespace cli {

/// Keeps its members in the order in which they are written here.
using Json = nlohmann::ordered_json;

/// One document and a line end, in ASCII, so that no text drives a terminal. Bytes that are not UTF-8 are
/// replaced: JSON has no place for them.
void printJson(std::ostream& out, const Json& document);

/// The same on a line, without its end.
std::string jsonLine(const Json& document);

/// What stands in a row of a table.
struct Cell {
    Cell(std::string words, Look how = Look::Plain) : text(std::move(words)), look(how) {}
    Cell(const char* words, Look how = Look::Plain) : text(words), look(how) {}

    std::string text;
    Look look;
};
using Row = std::vector<Cell>;
using Rows = std::vector<Row>;

/// Prints rows with each column as wide as its widest cell; control characters in cells are made visible. On
/// a terminal the table is made to fit its width; nothing is left out. The first row has the headings.
void printTable(std::ostream& out, const Rows& rows);

/// The same in at most `width` columns where that can be: long cells go on below, and where there are too
/// many columns for that, each row becomes a block of lines with the headings of the first row.
void printTable(std::ostream& out, const Rows& rows, std::size_t width);

/// The same for rows of two columns that need no headings.
void printPairs(std::ostream& out, const Rows& rows);

/// The value as one line for a person: strings in quotes, arrays in braces, "NULL".
std::string displayText(const core::CimValue& value);

}  // namespace cli

// How the model's values become JSON. The library looks for this in its own namespace.
namespace nlohmann {

/// Numbers and booleans as such, all else as text, arrays as arrays. Integers are exact.
template <>
struct adl_serializer<core::CimValue> {
    static void to_json(cli::Json& json, const core::CimValue& value);
};

template <>
struct adl_serializer<core::CimPath> {
    static void to_json(cli::Json& json, const core::CimPath& path) { json = path.toString(); }
};

/// {"path": ..., "class": ..., "properties": {...}}
template <>
struct adl_serializer<core::InstanceValue> {
    static void to_json(cli::Json& json, const core::InstanceValue& instance);
};

}  // namespace nlohmann
