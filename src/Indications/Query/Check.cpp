// SPDX-License-Identifier: Apache-2.0
#include <algorithm>

#include "Framework/Model/CimError.h"
#include "Indications/Query/Query.h"

namespace indications {

namespace {

using core::sameName;
using Classes = std::vector<core::ClassChain>;

[[noreturn]] void refuse(const std::string& reason) {
    throw core::CimError(core::CimStatus::InvalidQuery, reason);
}

[[noreturn]] void refuseFeature(const std::string& reason) {
    throw core::CimError(core::CimStatus::QueryFeatureNotSupported, reason);
}

Classes derivedFrom(const Classes& classes, std::string_view name) {
    Classes found;
    std::ranges::copy_if(classes, std::back_inserter(found),
                         [&](const core::ClassChain& chain) { return core::derivesFrom(chain, name); });
    return found;
}

const core::PropertyDeclaration* findProperty(const core::ClassChain& chain, std::string_view name) {
    for (const auto& declaration : chain) {
        if (const auto* found = core::findByName(declaration->properties, name)) return found;
    }
    return nullptr;
}

bool holdsObject(const core::PropertyDeclaration& property) {
    return core::findByName(property.qualifiers, "EmbeddedObject") != nullptr ||
           core::findByName(property.qualifiers, "EmbeddedInstance") != nullptr;
}

/// Goes through a condition and asks for each path whether it can lead anywhere.
class Checker {
  public:
    Checker(const Vocabulary& vocabulary, std::string_view className)
        : m_vocabulary(vocabulary), m_indications(derivedFrom(vocabulary.indications, className)) {
        if (m_indications.empty()) refuse(std::string(className) + " is no class of indications here");
    }

    void operator()(const Comparison& node) const {
        checkOperand(node.left);
        checkOperand(node.right);
    }

    void operator()(const NullTest& node) const { target(node.path); }

    void operator()(const ClassTest& node) const {
        if (!holdsObject(target(node.path)))
            refuse(node.path.text() + " holds no object, so it is of no class");
        requireSource(node.className);
    }

    void operator()(const Junction& node) const {
        for (const Expression& part : node.parts)
            std::visit(*this, part.node);
    }

    void operator()(const Negation& node) const { std::visit(*this, node.part.front().node); }

    /// The property that a path ends in.
    const core::PropertyDeclaration& target(const Path& path) const {
        const Classes* classes = &m_indications;
        for (const Step& step : path.steps) {
            const core::PropertyDeclaration& property = find(*classes, step, path);
            if (&step == &path.steps.back()) return checkIndex(property, path);
            if (!holdsObject(property))
                refuse(path.text() + " goes on after " + step.name + ", which holds no object");
            classes = &m_vocabulary.sources;
        }
        refuse("a path without steps");
    }

  private:
    void requireSource(const std::string& className) const {
        if (derivedFrom(m_vocabulary.sources, className).empty())
            refuse("no class " + className + " is served, of which objects could be");
    }

    const core::PropertyDeclaration& find(const Classes& classes, const Step& step, const Path& path) const {
        const Classes scope = step.scope.empty() ? classes : derivedFrom(classes, step.scope);
        if (scope.empty()) refuse("no class " + step.scope + " can stand where " + path.text() + " has it");
        for (const core::ClassChain& chain : scope) {
            // The declaration outlives the copy of its chain: the vocabulary shares it.
            if (const auto* property = findProperty(chain, step.name)) return *property;
        }
        refuse("no class has the property " + step.name + " that " + path.text() + " names");
    }

    const core::PropertyDeclaration& checkIndex(const core::PropertyDeclaration& property,
                                                const Path& path) const {
        const Step& last = path.steps.back();
        if ((last.index || last.everyElement) && !property.isArray)
            refuse(path.text() + " names an element, and " + last.name + " is no array");
        return property;
    }

    void checkOperand(const Operand& operand) const {
        const auto* const path = std::get_if<Path>(&operand);
        if (path == nullptr) return;
        const core::PropertyDeclaration& property = target(*path);
        const Step& last = path->steps.back();
        if (holdsObject(property)) {
            refuseFeature("objects are not compared as a whole; " + path->text() +
                          " can be tested by ISA and IS NULL");
        }
        if (property.isArray && !last.index && !last.everyElement) {
            refuseFeature("arrays are not compared as a whole; write ANY " + path->text() +
                          "[*], or an index");
        }
    }

    const Vocabulary& m_vocabulary;
    const Classes m_indications;
};

}  // namespace

void Query::check(const Vocabulary& vocabulary) const {
    const Checker checker(vocabulary, m_className);
    for (const Path& path : m_selected)
        checker.target(path);
    if (m_condition) std::visit(checker, m_condition->node);
}

}  // namespace indications
