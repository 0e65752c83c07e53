// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstddef>
#include <optional>
#include <string>
#include <variant>
#include <vector>

#include "Framework/Model/CimValue.h"

/// A query in memory. What the parser makes of it has the bounds that the parser keeps.
namespace indications {

/// One step of a path: `CIM_ConcreteJob::OperationalStatus[0]`.
struct Step {
    std::string scope;  ///< the class that the object has to be of; empty for any
    std::string name;
    std::optional<std::size_t> index;  ///< of an array's element
    bool everyElement = false;         ///< `[*]`
};

/// From the indication to a property: through embedded objects in all steps but the last. Never empty.
struct Path {
    std::vector<Step> steps;

    std::string text() const;
};

struct Null {};
using Operand = std::variant<Null, core::CimScalar, Path>;

enum class Relation { Equal, NotEqual, Less, LessOrEqual, Greater, GreaterOrEqual };

/// Neither operand is Null. With `any` the left one is a path that ends in every element of an array.
struct Comparison {
    bool any = false;
    Operand left;
    Relation relation = Relation::Equal;
    Operand right;
};

struct NullTest {
    Path path;
    bool isNegated = false;
};

struct ClassTest {
    Path path;
    std::string className;
};

struct Expression;

/// At least two parts.
struct Junction {
    bool isOr = false;
    std::vector<Expression> parts;
};

struct Negation {
    std::vector<Expression> part;  ///< one
};

struct Expression {
    std::variant<Comparison, NullTest, ClassTest, Junction, Negation> node;
};

}  // namespace indications
