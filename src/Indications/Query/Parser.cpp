// SPDX-License-Identifier: Apache-2.0
#include "Indications/Query/Parser.h"

#include <algorithm>
#include <array>
#include <utility>

#include "Framework/Model/CimError.h"
#include "Indications/Query/Query.h"

namespace indications {

namespace {

using core::sameName;

constexpr std::array<std::string_view, 13> kKeywords = {
    "SELECT", "FROM", "WHERE", "AND", "OR", "NOT", "ISA", "IS", "NULL", "TRUE", "FALSE", "ANY", "BY"};

/// What CQL or a dialect of it has under this word or sign.
struct Feature {
    std::string_view token;
    std::string_view name;
};
constexpr std::array<Feature, 23> kRefused = {{{"LIKE", "LIKE"},
                                               {"IN", "IN"},
                                               {"EVERY", "EVERY"},
                                               {"SATISFIES", "SATISFIES"},
                                               {"BETWEEN", "BETWEEN"},
                                               {"DISTINCT", "DISTINCT"},
                                               {"FIRST", "FIRST"},
                                               {"ORDER", "ORDER BY"},
                                               {"GROUP", "GROUP"},
                                               {"HAVING", "HAVING"},
                                               {"WITHIN", "WITHIN, events come as they happen"},
                                               {"JOIN", "joins"},
                                               {"AS", "aliases"},
                                               {"#", "symbolic constants, write the number"},
                                               {"$", "templates"},
                                               {"||", "joining texts"},
                                               {"+", "arithmetic"},
                                               {"-", "arithmetic"},
                                               {"/", "arithmetic"},
                                               {"%", "arithmetic"},
                                               {"*", "arithmetic"},
                                               {"(", "functions"},
                                               {"[", "ranges of elements"}}};

const Feature* refusedFeature(const Token& token) {
    if (token.kind != Token::Kind::Word && token.kind != Token::Kind::Sign) return nullptr;
    const auto* const found = std::ranges::find_if(
        kRefused, [&](const Feature& feature) { return sameName(feature.token, token.text); });
    return found == kRefused.end() ? nullptr : found;
}

bool isName(const Token& token) {
    return token.kind == Token::Kind::Word && refusedFeature(token) == nullptr &&
           std::ranges::none_of(kKeywords, [&](std::string_view each) { return sameName(each, token.text); });
}

[[noreturn]] void refuseFeature(std::string_view feature) {
    throw core::CimError(core::CimStatus::QueryFeatureNotSupported,
                         "queries are understood here without " + std::string(feature));
}

[[noreturn]] void refuseSize(const char* what, std::size_t most) {
    throw core::CimError(core::CimStatus::QueryFeatureNotSupported,
                         std::string("the query has too many ") + what + "; at most " + std::to_string(most) +
                             " are understood here");
}

std::string shown(const Token& token) {
    switch (token.kind) {
        case Token::Kind::End:
            return "the end";
        case Token::Kind::Literal:
            return "a value";
        default:
            return "\"" + token.text + "\"";
    }
}

bool hasEveryElement(const Operand& operand) {
    const Path* const path = std::get_if<Path>(&operand);
    return path != nullptr && path->steps.back().everyElement;
}

}  // namespace

Parser::Parser(std::string_view text) : m_tokens(text) {
    if (text.size() > Query::kMostBytes) refuseSize("bytes", Query::kMostBytes);
    m_token = m_tokens.next();
}

Token Parser::advance() {
    return std::exchange(m_token, m_tokens.next());
}

void Parser::refuse(const std::string& expected) const {
    if (const Feature* feature = refusedFeature(m_token)) refuseFeature(feature->name);
    refuseAt(m_token.place, "expected " + expected + ", found " + shown(m_token));
}

bool Parser::isWord(std::string_view word) const {
    return m_token.kind == Token::Kind::Word && sameName(m_token.text, word);
}

bool Parser::isSign(std::string_view sign) const {
    return m_token.kind == Token::Kind::Sign && m_token.text == sign;
}

bool Parser::acceptWord(std::string_view word) {
    const bool isThere = isWord(word);
    if (isThere) advance();
    return isThere;
}

bool Parser::acceptSign(std::string_view sign) {
    const bool isThere = isSign(sign);
    if (isThere) advance();
    return isThere;
}

void Parser::require(bool isThere, const char* what) {
    if (!isThere) refuse(what);
}

void Parser::countNode() {
    if (++m_nodes > Query::kMostNodes) refuseSize("conditions and paths", Query::kMostNodes);
}

void Parser::enter() {
    if (++m_depth > Query::kDeepest) refuseSize("levels", Query::kDeepest);
}

std::vector<Path> Parser::selectList() {
    require(acceptWord("SELECT"), "SELECT");
    if (acceptSign("*")) return {};
    std::vector<Path> paths;
    do {
        if (!isName(m_token)) refuse("* or the name of a property");
        Path selected = path();
        if (selected.steps.back().index || selected.steps.back().everyElement)
            refuseFeature("elements of arrays in the select list, name the array");
        paths.push_back(std::move(selected));
    } while (acceptSign(","));
    return paths;
}

std::string Parser::fromClause() {
    require(acceptWord("FROM"), "FROM");
    if (!isName(m_token)) refuse("the name of a class");
    std::string className = advance().text;
    if (isSign(",")) refuseFeature("joins");
    if (isName(m_token)) refuseFeature("aliases");
    return className;
}

std::optional<Expression> Parser::whereClause() {
    std::optional<Expression> condition;
    if (acceptWord("WHERE")) condition = junction(true);
    if (m_token.kind != Token::Kind::End) refuse(condition ? "AND, OR or the end" : "WHERE or the end");
    return condition;
}

Expression Parser::junction(bool isOr) {
    Junction parts{isOr, {}};
    do {
        parts.parts.push_back(isOr ? junction(false) : factor());
    } while (acceptWord(isOr ? "OR" : "AND"));
    if (parts.parts.size() == 1) return std::move(parts.parts.front());
    countNode();
    return {std::move(parts)};
}

Expression Parser::factor() {
    enter();
    Expression result;
    if (acceptWord("NOT")) {
        countNode();
        result.node = Negation{{factor()}};
    } else if (acceptSign("(")) {
        result = junction(true);
        require(acceptSign(")"), "AND, OR or )");
    } else {
        countNode();
        result = predicate();
    }
    leave();
    return result;
}

Expression Parser::predicate() {
    const std::size_t place = m_token.place;
    const bool any = acceptWord("ANY");
    Operand left = operand();
    if (any != hasEveryElement(left))
        refuseAt(place, "ANY and [*] stand together only: ANY Property[*] = value");
    const Path* const path = any ? nullptr : std::get_if<Path>(&left);
    if (path != nullptr && acceptWord("ISA")) return {ClassTest{*path, classNameOrText()}};
    if (path != nullptr && acceptWord("IS")) {
        const bool isNegated = acceptWord("NOT");
        require(acceptWord("NULL"), "NULL");
        return {NullTest{*path, isNegated}};
    }
    return comparison(any, std::move(left));
}

Expression Parser::comparison(bool any, Operand left) {
    const std::size_t place = m_token.place;
    const std::optional<Relation> found = relation();
    if (!found) {
        acceptWord("NOT");  // of NOT LIKE, say
        refuse("a comparison");
    }
    Operand right = operand();
    if (hasEveryElement(right)) refuseAt(place, "ANY and [*] stand on the left side only");
    // A value that is null stands on the right from here on.
    if (std::holds_alternative<Null>(left)) std::swap(left, right);
    if (!std::holds_alternative<Null>(right))
        return {Comparison{any, std::move(left), *found, std::move(right)}};
    const Path* const path = std::get_if<Path>(&left);
    const bool isEquality = *found == Relation::Equal || *found == Relation::NotEqual;
    if (path == nullptr || any || !isEquality)
        refuseAt(place, "NULL is compared by IS NULL or IS NOT NULL only, and with a property");
    return {NullTest{*path, *found == Relation::NotEqual}};
}

std::optional<Relation> Parser::relation() {
    constexpr std::array<std::pair<std::string_view, Relation>, 6> kRelations = {
        {{"=", Relation::Equal},
         {"<>", Relation::NotEqual},
         {"<", Relation::Less},
         {"<=", Relation::LessOrEqual},
         {">", Relation::Greater},
         {">=", Relation::GreaterOrEqual}}};
    for (const auto& [sign, relation] : kRelations)
        if (acceptSign(sign)) return relation;
    return std::nullopt;
}

Operand Parser::operand() {
    if (m_token.kind == Token::Kind::Literal) return advance().literal;
    if (acceptWord("NULL")) return Null();
    if (acceptWord("TRUE")) return core::CimScalar(true);
    if (acceptWord("FALSE")) return core::CimScalar(false);
    if (!isName(m_token)) refuse("a property or a value");
    return path();
}

Path Parser::path() {
    countNode();
    Path result;
    do {
        if (!result.steps.empty() && isSign("*")) refuseFeature("X.*, name the properties");
        if (!result.steps.empty() && (result.steps.back().index || result.steps.back().everyElement))
            refuse("an index in the last step of a path only");
        result.steps.push_back(step());
    } while (acceptSign("."));
    if (isSign("(")) refuseFeature("functions");
    return result;
}

Step Parser::step() {
    Step result;
    result.name = name("the name of a property");
    if (acceptSign("::")) result.scope = std::exchange(result.name, name("the name of a property"));
    if (!acceptSign("[")) return result;
    if (acceptSign("*")) {
        result.everyElement = true;
    } else {
        const auto* const index = std::get_if<std::uint64_t>(&m_token.literal);
        if (m_token.kind != Token::Kind::Literal || index == nullptr)
            refuse("the number of an element, or *");
        result.index = *index;
        advance();
    }
    if (isSign(".") || isSign(",")) refuseFeature("ranges of elements");
    require(acceptSign("]"), "]");
    return result;
}

std::string Parser::name(const char* what) {
    if (m_token.kind != Token::Kind::Word) refuse(what);
    return advance().text;
}

std::string Parser::classNameOrText() {
    const auto* const text = std::get_if<std::string>(&m_token.literal);
    if (m_token.kind == Token::Kind::Literal && text != nullptr)
        return std::get<std::string>(advance().literal);
    if (!isName(m_token)) refuse("the name of a class");
    return advance().text;
}

}  // namespace indications
