#include <algorithm>
#include <stdexcept>

#include "Host/Daemon/SettingsField.h"
#include "MidAPI/Toml.h"

namespace host {

namespace {

std::string placeOf(const std::string& file, const toml::source_region& source) {
    // A file that cannot be read has no line.
    return source.begin.line == 0 ? file : file + ":" + std::to_string(source.begin.line);
}

std::string textOf(const toml::node& node, const std::string& place) {
    if (const auto* text = node.as_string()) return text->get();
    if (const auto* number = node.as_integer()) return std::to_string(number->get());
    if (const auto* flag = node.as_boolean()) return flag->get() ? "true" : "false";
    throw std::runtime_error(place + ": a text, a whole number, true or false is expected");
}

void checkKind(const SettingsField& field, const toml::node& node) {
    const bool fits = field.isFlag()   ? node.is_boolean()
                      : field.isText() ? node.is_string()
                                       : node.is_integer();
    if (!fits) {
        throw std::runtime_error(field.key + " must be " +
                                 (field.isFlag()   ? "true or false"
                                  : field.isText() ? "a text in quotes"
                                                   : "a whole number"));
    }
}

void setList(const SettingsField& field, const toml::node& node, const std::string& place) {
    std::get<std::vector<std::string>*>(field.target)->clear();
    const toml::array* elements = node.as_array();
    if (elements == nullptr) throw std::runtime_error(field.key + " must be a list of texts");
    for (const toml::node& element : *elements) {
        checkKind(field, element);
        field.set(textOf(element, place));
    }
}

void setField(const std::vector<SettingsField>& fields, const std::string& key, const toml::node& node,
              const std::string& place) {
    const auto field = std::find_if(fields.begin(), fields.end(),
                                    [&](const SettingsField& each) { return each.key == key; });
    if (field == fields.end()) throw std::runtime_error(place + ": there is no setting " + key);
    try {
        if (field->isList()) {
            setList(*field, node, place);
        } else {
            checkKind(*field, node);
            field->set(textOf(node, place));
        }
    } catch (const std::runtime_error& error) {
        throw std::runtime_error(place + ": " + error.what());
    }
}

toml::table parse(const std::string& file) {
    toml::parse_result parsed = toml::parse_file(file);
    if (parsed) return std::move(parsed).table();
    const toml::parse_error& error = parsed.error();
    throw std::runtime_error(placeOf(file, error.source()) + ": " + std::string(error.description()));
}

}  // namespace

void readSettingsFile(const std::string& file, Settings& settings) {
    const toml::table table = parse(file);
    const std::vector<SettingsField> fields = fieldsOf(settings);
    for (const auto& [section, content] : table) {
        const toml::table* entries = content.as_table();
        const std::string place = placeOf(file, content.source());
        if (entries == nullptr) {
            throw std::runtime_error(place + ": " + std::string(section.str()) +
                                     " must stand in a [section]");
        }
        for (const auto& [name, value] : *entries) {
            const std::string key = std::string(section.str()) + "." + std::string(name.str());
            setField(fields, key, value, placeOf(file, value.source()));
        }
    }
}

}  // namespace host
