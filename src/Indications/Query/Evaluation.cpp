// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <compare>
#include <utility>

#include "Indications/Query/Query.h"

namespace indications {

namespace {

/// Nothing for what is neither true nor false.
using Truth = std::optional<bool>;

Truth negated(Truth truth) {
    return truth ? Truth(!*truth) : truth;
}

/// Of many truths, OR: one that is true decides; else one that is unknown makes it unknown. AND is the same
/// of what is not.
class Disjunction {
  public:
    /// True when nothing can change it any more.
    bool add(Truth truth) {
        if (truth == Truth(true)) m_result = true;
        if (!truth && m_result == Truth(false)) m_result = std::nullopt;
        return m_result == Truth(true);
    }
    Truth result() const { return m_result; }

  private:
    Truth m_result = false;
};

/// What a path leads to.
struct Target {
    const core::CimValue* value = nullptr;
    const QueryObject* object = nullptr;

    bool isNull() const { return object == nullptr && (value == nullptr || value->isNull()); }
};

Target follow(const Path& path, const QueryObject& indication) {
    const QueryObject* object = &indication;
    for (std::size_t i = 0;; ++i) {
        const Step& step = path.steps[i];
        if (!step.scope.empty() && !object->isOf(step.scope)) return {};
        const QueryObject* const inner = object->embedded(step.name);
        if (i + 1 == path.steps.size()) return {inner == nullptr ? object->value(step.name) : nullptr, inner};
        if (inner == nullptr) return {};
        object = inner;
    }
}

/// The one value at a path's end, by its index in an array; null pointer for none.
const core::CimScalar* scalarAt(const Path& path, const QueryObject& indication) {
    const core::CimValue* const value = follow(path, indication).value;
    if (value == nullptr) return nullptr;
    const std::optional<std::size_t> index = path.steps.back().index;
    if (!index) return value->scalar();
    const auto* const elements = value->elements();
    return elements != nullptr && *index < elements->size() ? &(*elements)[*index] : nullptr;
}

const core::CimScalar* scalarOf(const Operand& operand, const QueryObject& indication) {
    if (const auto* path = std::get_if<Path>(&operand)) return scalarAt(*path, indication);
    return std::get_if<core::CimScalar>(&operand);
}

/// Numbers of all kinds by value, in a type that holds each integer of 64 bits exactly.
std::optional<long double> numberIn(const core::CimScalar& value) {
    if (const auto* number = std::get_if<std::uint64_t>(&value)) return static_cast<long double>(*number);
    if (const auto* number = std::get_if<std::int64_t>(&value)) return static_cast<long double>(*number);
    if (const auto* number = std::get_if<double>(&value)) return static_cast<long double>(*number);
    return std::nullopt;
}

/// The text form of a date, or of a text that is one.
std::optional<std::string> dateIn(const core::CimScalar& value) {
    if (const auto* time = std::get_if<utils::Time>(&value)) return core::datetimeText(*time);
    const auto* const text = std::get_if<std::string>(&value);
    const auto time = text == nullptr ? std::nullopt : core::parseDatetime(*text);
    return time ? std::optional(core::datetimeText(*time)) : std::nullopt;
}

/// Where in the text form of a date stands whether it is a point in time or an interval.
constexpr std::size_t kDateKind = 21;

/// Unordered for values of different kinds, and for paths.
std::partial_ordering compare(const core::CimScalar& left, const core::CimScalar& right) {
    constexpr auto kUnordered = std::partial_ordering::unordered;
    if (std::holds_alternative<utils::Time>(left) || std::holds_alternative<utils::Time>(right)) {
        const auto first = dateIn(left);
        const auto second = dateIn(right);
        const bool isComparable = first && second && (*first)[kDateKind] == (*second)[kDateKind];
        return isComparable ? std::partial_ordering(*first <=> *second) : kUnordered;
    }
    if (const auto first = numberIn(left)) {
        const auto second = numberIn(right);
        return second ? *first <=> *second : kUnordered;
    }
    if (left.index() != right.index()) return kUnordered;
    if (const auto* text = std::get_if<std::string>(&left)) return *text <=> std::get<std::string>(right);
    if (const auto* flag = std::get_if<bool>(&left)) return *flag <=> std::get<bool>(right);
    return kUnordered;
}

Truth holds(Relation relation, const core::CimScalar& left, const core::CimScalar& right) {
    const std::partial_ordering order = compare(left, right);
    if (order == std::partial_ordering::unordered) return std::nullopt;
    const bool isOrdered = !std::holds_alternative<bool>(left);
    if (!isOrdered && relation != Relation::Equal && relation != Relation::NotEqual) return std::nullopt;
    switch (relation) {
        case Relation::Equal:
            return order == 0;
        case Relation::NotEqual:
            return order != 0;
        case Relation::Less:
            return order < 0;
        case Relation::LessOrEqual:
            return order <= 0;
        case Relation::Greater:
            return order > 0;
        case Relation::GreaterOrEqual:
            return order >= 0;
    }
    return std::nullopt;
}

Truth truthOf(const Expression& expression, const QueryObject& indication);

/// One for each kind of expression.
struct Evaluation {
    const QueryObject& indication;

    Truth operator()(const Comparison& node) const {
        const core::CimScalar* const right = scalarOf(node.right, indication);
        if (right == nullptr) return std::nullopt;
        if (!node.any) {
            const core::CimScalar* const left = scalarOf(node.left, indication);
            return left == nullptr ? std::nullopt : holds(node.relation, *left, *right);
        }
        const core::CimValue* const array = follow(std::get<Path>(node.left), indication).value;
        if (array == nullptr || array->elements() == nullptr) return std::nullopt;
        Disjunction result;
        for (const core::CimScalar& each : *array->elements())
            if (result.add(holds(node.relation, each, *right))) break;
        return result.result();
    }

    Truth operator()(const NullTest& node) const {
        const bool isElement = node.path.steps.back().index.has_value();
        const bool isNull =
            isElement ? scalarAt(node.path, indication) == nullptr : follow(node.path, indication).isNull();
        return isNull != node.isNegated;
    }

    Truth operator()(const ClassTest& node) const {
        const QueryObject* const object = follow(node.path, indication).object;
        return object == nullptr ? std::nullopt : Truth(object->isOf(node.className));
    }

    Truth operator()(const Junction& node) const {
        Disjunction result;
        for (const Expression& part : node.parts) {
            const Truth truth = truthOf(part, indication);
            if (result.add(node.isOr ? truth : negated(truth))) break;
        }
        return node.isOr ? result.result() : negated(result.result());
    }

    Truth operator()(const Negation& node) const { return negated(truthOf(node.part.front(), indication)); }
};

Truth truthOf(const Expression& expression, const QueryObject& indication) {
    return std::visit(Evaluation{indication}, expression.node);
}

}  // namespace

bool Query::matches(const QueryObject& indication) const {
    if (!indication.isOf(m_className)) return false;
    return !m_condition || truthOf(*m_condition, indication) == Truth(true);
}

}  // namespace indications
