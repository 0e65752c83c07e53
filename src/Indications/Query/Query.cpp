// SPDX-License-Identifier: Apache-2.0
#include "Indications/Query/Query.h"

#include <algorithm>
#include <array>

#include "Framework/Model/CimError.h"
#include "Indications/Query/Parser.h"

namespace indications {

using core::sameName;

void requireKnownLanguage(std::string_view language) {
    constexpr std::string_view kBlanks = " \t\r\n";
    const std::size_t begin = std::min(language.find_first_not_of(kBlanks), language.size());
    const std::string_view name = language.substr(begin, language.find_last_not_of(kBlanks) + 1 - begin);
    constexpr std::array<std::string_view, 5> kKnown = {"DMTF:CQL", "CIM:CQL", "CQL", "WQL", "wql1"};
    if (std::ranges::any_of(kKnown, [&](std::string_view each) { return sameName(each, name); })) return;
    throw core::CimError(core::CimStatus::QueryLanguageNotSupported,
                         "the query language is not known here; DMTF:CQL and WQL are");
}

std::string Path::text() const {
    std::string result;
    for (const Step& step : steps) {
        if (!result.empty()) result += '.';
        if (!step.scope.empty()) result += step.scope + "::";
        result += step.name;
        if (step.index) result += '[' + std::to_string(*step.index) + ']';
        if (step.everyElement) result += "[*]";
    }
    return result;
}

Query::Query(std::string_view text) {
    Parser parser(text);
    m_selected = parser.selectList();
    m_className = parser.fromClause();
    m_condition = parser.whereClause();
}

bool Query::wants(std::string_view property) const {
    constexpr std::array<std::string_view, 5> kAlways = {"SequenceContext", "SequenceNumber",
                                                         "IndicationFilterName", "IndicationIdentifier",
                                                         "IndicationTime"};
    const auto isNamed = [&](std::string_view name) { return sameName(name, property); };
    return m_selected.empty() || std::ranges::any_of(kAlways, isNamed) ||
           std::ranges::any_of(m_selected, [&](const Path& path) { return isNamed(path.steps[0].name); });
}

bool Query::wants(std::string_view embedded, std::string_view property) const {
    return m_selected.empty() || std::ranges::any_of(m_selected, [&](const Path& path) {
               // A path that ends in the object wants it whole.
               return sameName(path.steps[0].name, embedded) &&
                      (path.steps.size() == 1 || sameName(path.steps[1].name, property));
           });
}

}  // namespace indications
