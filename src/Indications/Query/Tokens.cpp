// SPDX-License-Identifier: Apache-2.0
#include "Indications/Query/Tokens.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <cstdint>

#include "Framework/Model/CimError.h"
#include "Utils/Utils.h"

namespace indications {

namespace {

using utils::isDigit;

bool beginsName(char each) {
    return utils::isLetter(each) || each == '_';
}

bool isOfName(char each) {
    return beginsName(each) || isDigit(each);
}

bool isBlank(char each) {
    return each == ' ' || each == '\t' || each == '\n' || each == '\r';
}

std::size_t lengthOf(std::string_view text, bool (*belongs)(char)) {
    return static_cast<std::size_t>(std::ranges::find_if_not(text, belongs) - text.begin());
}

/// The longer ones first.
constexpr std::array<std::string_view, 23> kSigns = {"<>", "!=", "<=", ">=", "::", "||", "<", ">",
                                                     "=",  "(",  ")",  "[",  "]",  ",",  ".", "*",
                                                     "#",  "$",  "+",  "-",  "/",  "%",  ";"};

template <class Number>
core::CimScalar numberOf(std::string_view digits, std::size_t place) {
    Number value{};
    const auto [end, error] = std::from_chars(digits.data(), digits.data() + digits.size(), value);
    if (error != std::errc() || end != digits.data() + digits.size())
        refuseAt(place, "the number " + std::string(digits) + " is too large");
    return value;
}

}  // namespace

void refuseAt(std::size_t place, const std::string& reason) {
    throw core::CimError(core::CimStatus::InvalidQuery, "the query cannot be read at character " +
                                                            std::to_string(place + 1) + ": " + reason);
}

std::string_view Tokens::take(std::size_t bytes) {
    const std::string_view taken = m_text.substr(m_place, bytes);
    m_place += taken.size();
    return taken;
}

Token Tokens::next() {
    m_place += lengthOf(rest(), isBlank);
    if (rest().empty()) return {Token::Kind::End, "", {}, m_place};
    const char first = rest().front();
    if (beginsName(first)) return word();
    const bool isSigned = (first == '-' || first == '+') && rest().size() > 1 && isDigit(rest()[1]);
    if (isDigit(first) || isSigned) return number();
    if (first == '\'' || first == '"') return quoted();
    return sign();
}

Token Tokens::word() {
    const std::size_t place = m_place;
    return {Token::Kind::Word, std::string(take(lengthOf(rest(), isOfName))), {}, place};
}

Token Tokens::number() {
    const std::size_t place = m_place;
    const bool isNegative = rest().front() == '-';
    if (rest().front() == '+') ++m_place;
    const std::size_t begin = m_place;
    if (isNegative) ++m_place;
    take(lengthOf(rest(), isDigit));
    bool isReal = false;
    if (rest().size() > 1 && rest()[0] == '.' && isDigit(rest()[1])) {
        isReal = true;
        take(1);
        take(lengthOf(rest(), isDigit));
    }
    if (!rest().empty() && (rest()[0] == 'e' || rest()[0] == 'E')) {
        const std::size_t sign = rest().size() > 1 && (rest()[1] == '-' || rest()[1] == '+') ? 2 : 1;
        const std::size_t digits = lengthOf(rest().substr(sign), isDigit);
        if (digits == 0) refuseAt(place, "the exponent of a number has no digits");
        isReal = true;
        take(sign + digits);
    }
    if (!rest().empty() && isOfName(rest().front()))
        refuseAt(m_place, "a number ends in letters; write it in decimal digits");
    const std::string_view digits = m_text.substr(begin, m_place - begin);
    if (isReal) return {Token::Kind::Literal, "", numberOf<double>(digits, place), place};
    if (isNegative) return {Token::Kind::Literal, "", numberOf<std::int64_t>(digits, place), place};
    return {Token::Kind::Literal, "", numberOf<std::uint64_t>(digits, place), place};
}

Token Tokens::quoted() {
    const std::size_t place = m_place;
    const char quote = take(1).front();
    std::string value;
    while (!rest().empty()) {
        const char each = take(1).front();
        const bool isDoubled = each == quote && !rest().empty() && rest().front() == quote;
        if (each == quote && !isDoubled) return {Token::Kind::Literal, "", value, place};
        if (isDoubled || (each == '\\' && !rest().empty())) {
            value += take(1).front();
        } else {
            value += each;
        }
    }
    refuseAt(place, "a text in quotes has no end");
}

Token Tokens::sign() {
    const auto* const found =
        std::ranges::find_if(kSigns, [&](std::string_view each) { return rest().starts_with(each); });
    if (found == kSigns.end()) refuseAt(m_place, "this character stands in texts in quotes only");
    const std::size_t place = m_place;
    take(found->size());
    return {Token::Kind::Sign, std::string(*found == "!=" ? "<>" : *found), {}, place};
}

}  // namespace indications
