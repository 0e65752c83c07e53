// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "Indications/Query/Expression.h"
#include "Indications/Query/Tokens.h"

namespace indications {

/// Reads one query, with one token to look ahead. Used once. Fails as Query's constructor says.
class Parser {
  public:
    explicit Parser(std::string_view text);

    // In this order.

    /// `SELECT ...`; empty for everything.
    std::vector<Path> selectList();
    /// `FROM class`.
    std::string fromClause();
    /// `WHERE ...` to the end of the query; nothing where it is not there.
    std::optional<Expression> whereClause();

  private:
    Expression junction(bool isOr);
    Expression factor();
    Expression predicate();
    Expression comparison(bool any, Operand left);
    std::optional<Relation> relation();
    Operand operand();
    Path path();
    Step step();
    /// A name, where any word can only be one.
    std::string name(const char* what);
    std::string classNameOrText();

    bool isWord(std::string_view word) const;
    bool isSign(std::string_view sign) const;
    bool acceptWord(std::string_view word);
    bool acceptSign(std::string_view sign);
    void require(bool isThere, const char* what);
    Token advance();

    void countNode();
    void enter();
    void leave() { --m_depth; }
    /// What stands here is not what may.
    [[noreturn]] void refuse(const std::string& expected) const;

    Tokens m_tokens;
    Token m_token;
    int m_nodes = 0;
    int m_depth = 0;
};

}  // namespace indications
