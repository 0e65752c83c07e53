// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

#include "Framework/Model/CimValue.h"

namespace indications {

/// What a query is made of.
struct Token {
    enum class Kind { End, Word, Literal, Sign };

    Kind kind = Kind::End;
    std::string text;         ///< a word or a sign as it was written, "<>" for "!="
    core::CimScalar literal;  ///< a text or a number
    std::size_t place = 0;    ///< where it begins, from 0
};

/// Takes a query apart, one token after the other.
class Tokens {
  public:
    /// @param text  has to outlive it
    explicit Tokens(std::string_view text) : m_text(text) {}

    /// The next token; End at the end, and after it. CimError (invalid query) for what is no token.
    Token next();

  private:
    Token word();
    Token number();
    Token quoted();
    Token sign();

    std::string_view rest() const { return m_text.substr(m_place); }
    /// Takes what belongs to a token off the text.
    std::string_view take(std::size_t bytes);

    std::string_view m_text;
    std::size_t m_place = 0;
};

/// Refuses a query: "invalid query" with the place, counted from 1.
[[noreturn]] void refuseAt(std::size_t place, const std::string& reason);

}  // namespace indications
