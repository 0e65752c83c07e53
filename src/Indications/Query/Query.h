// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "Framework/Model/ClassDeclaration.h"
#include "Indications/Query/Expression.h"

namespace indications {

/// What a query looks at: an indication, or an object embedded in one.
class QueryObject {
  public:
    QueryObject() = default;
    QueryObject(const QueryObject&) = delete;
    QueryObject& operator=(const QueryObject&) = delete;
    virtual ~QueryObject() = default;

    /// Whether it is of the class or of a subclass.
    virtual bool isOf(std::string_view className) const = 0;
    /// The value of a property, names in any case; null pointer for one that is not there or that holds an
    /// object.
    virtual const core::CimValue* value(std::string_view property) const = 0;
    /// The object that a property holds; null pointer for none.
    virtual const QueryObject* embedded(std::string_view property) const = 0;
};

/// The classes that a query may name, each with its superclasses behind it.
struct Vocabulary {
    const std::vector<core::ClassChain>& indications;  ///< CIM_Indication and its subclasses
    const std::vector<core::ClassChain>& sources;      ///< of the namespace that the events come from
};

/// CimError (query language not supported) for any but CQL and WQL, under each of their names.
void requireKnownLanguage(std::string_view language);

/// A query of a filter: which indications a client wants, and what of them. One language under both names, a
/// subset of CQL (DSP0202) in which everything that WQL can say about indications can be said; keywords,
/// classes and properties in any case. A value; matching is thread-safe.
///
///     SELECT * | path, ... FROM class [WHERE expression]
///
/// with AND, OR, NOT, comparisons, IS [NOT] NULL, ISA, and ANY path[*] for the elements of an array.
class Query {
  public:
    static constexpr std::size_t kMostBytes = 2048;
    static constexpr int kMostNodes = 64;  ///< predicates, operators and paths
    static constexpr int kDeepest = 16;    ///< levels of parentheses and NOT

    /// Reads a query. CimError: query feature not supported for what the language has and this subset has
    /// not, and for a query beyond these bounds; invalid query for what does not read. Both say where, or
    /// what.
    explicit Query(std::string_view text);

    /// Whether it can ever be true: CimError (invalid query) for a class or property that it names and that
    /// is not there; query feature not supported for arrays and objects compared as a whole.
    void check(const Vocabulary& vocabulary) const;

    /// Logic of three values: a comparison with what is null, not there or of another kind is neither true
    /// nor false, and so is what follows from nothing else. Only what is true matches.
    bool matches(const QueryObject& indication) const;

    /// The class of FROM, as it was written.
    const std::string& className() const { return m_className; }

    /// Whether those who asked get the property of the indication. What tells one indication from another
    /// they always get.
    bool wants(std::string_view property) const;
    /// The same of a property of an object that the indication holds.
    bool wants(std::string_view embedded, std::string_view property) const;

  private:
    std::string m_className;
    std::vector<Path> m_selected;  ///< empty for everything
    std::optional<Expression> m_condition;
};

}  // namespace indications
