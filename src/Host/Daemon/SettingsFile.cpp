// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <optional>
#include <stdexcept>

#include "Host/Daemon/SettingsField.h"
#include "Utils/Os/Linux/linux.h"
#include "Utils/Toml.h"
#include "Utils/Utils.h"

namespace host {

namespace {

std::string placeOf(const std::string& file, const toml::source_region& source) {
    return file + ":" + std::to_string(source.begin.line);
}

/// The text of a value of the field's kind, or of one element of its list.
std::string textOf(const SettingsField& field, const toml::node& node) {
    if (field.isText() && node.is_string()) return node.as_string()->get();
    if (field.isFlag() && node.is_boolean()) return node.as_boolean()->get() ? "true" : "false";
    if (field.isNumber() && node.is_integer()) return std::to_string(node.as_integer()->get());
    throw std::runtime_error(field.key + " must be " +
                             (field.isFlag()   ? "true or false"
                              : field.isText() ? "a text in quotes"
                                               : "a whole number"));
}

void setList(const SettingsField& field, const toml::node& node) {
    // An empty list has to be able to take everybody off.
    std::get<std::vector<std::string>*>(field.target)->clear();
    if (field.takesOne && node.is_string()) return field.set(textOf(field, node));
    const toml::array* elements = node.as_array();
    if (elements == nullptr)
        throw std::runtime_error(field.key + " must be a list of texts, such as [\"alice\"]");
    for (const toml::node& element : *elements)
        field.set(textOf(field, element));
}

void setField(const std::vector<SettingsField>& fields, const std::string& key, const toml::node& node,
              const std::string& place) {
    const auto field = std::find_if(fields.begin(), fields.end(),
                                    [&](const SettingsField& each) { return each.key == key; });
    if (field == fields.end())
        throw std::runtime_error(place + ": there is no setting " + key +
                                 ". See quenx-cimd --help for all settings.");
    // What a field says of a wrong value knows nothing of files.
    try {
        if (field->isList()) {
            setList(*field, node);
        } else {
            field->set(textOf(*field, node));
        }
    } catch (const std::runtime_error& error) {
        throw std::runtime_error(place + ": " + error.what());
    }
}

/// The mistake that the parser describes least well: `method = users`, where TOML wants a text in quotes.
std::string hintAt(std::string_view text, std::size_t line) {
    for (; line > 1; --line)
        text.remove_prefix(std::min(text.find('\n'), text.size() - 1) + 1);
    text = text.substr(0, text.find_first_of("#\r\n"));
    const std::size_t equals = text.find('=');
    if (equals == std::string_view::npos) return "";
    const std::string value = utils::trim(text.substr(equals + 1));
    if (value.empty() || value.find_first_of("\"'[{") != std::string::npos) return "";
    return ". A text must stand in quotes: " + utils::trim(text.substr(0, equals)) + " = \"" + value + "\"";
}

std::string textOf(const std::string& file) try {
    if (const auto text = os::readTextFile(file)) return *text;
    throw std::runtime_error("There is no file " + file + ". Check --config.");
} catch (const os::UnusableFile& error) {
    throw std::runtime_error(file + " " + error.what() + ". Check --config.");
}

toml::table parse(const std::string& file) {
    const std::string text = textOf(file);
    try {
        return utils::parseToml(text);
    } catch (const utils::TomlError& error) {
        throw std::runtime_error(file + ":" + std::to_string(error.line()) + ": " + error.what() +
                                 hintAt(text, error.line()));
    }
}

}  // namespace

void readSettingsFile(const std::string& file, Settings& settings) {
    // Every key that is there is looked up, not every setting: so a misspelt key is noticed.
    const toml::table table = parse(file);
    const std::vector<SettingsField> fields = fieldsOf(settings);
    for (const auto& [section, content] : table) {
        const toml::table* entries = content.as_table();
        const std::string place = placeOf(file, content.source());
        if (entries == nullptr) {
            throw std::runtime_error(place + ": " + std::string(section.str()) +
                                     " must be in a [section], such as [listen]");
        }
        const std::string prefix = std::string(section.str()) + ".";
        const auto isIn = [&](const SettingsField& field) { return field.key.starts_with(prefix); };
        // A misspelt section without keys would leave no key to be noticed by.
        if (entries->empty() && std::none_of(fields.begin(), fields.end(), isIn))
            throw std::runtime_error(place + ": there is no section [" + std::string(section.str()) + "]");
        for (const auto& [name, value] : *entries) {
            const std::string key = std::string(section.str()) + "." + std::string(name.str());
            setField(fields, key, value, placeOf(file, value.source()));
        }
    }
}

}  // namespace host
