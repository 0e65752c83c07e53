#include "Host/Operations/ClassElements.h"

#include <algorithm>

#include "Host/Operations/ValueMaps.h"

namespace host {

namespace {

using cimxml::ClassMethod;
using cimxml::ClassProperty;
using cimxml::Qualifier;
using core::CimType;
using core::CimValue;

Qualifier flagQualifier(std::string name, bool value, bool overridable = true) {
    return {std::move(name), CimValue::of(CimType::Boolean, value), overridable};
}

template <class Elements>
auto findByName(Elements& elements, const std::string& name) {
    return std::find_if(elements.begin(), elements.end(),
                        [&](const auto& element) { return core::sameName(element.name, name); });
}

bool isWanted(const core::PropertyFilter& filter, const std::string& name) {
    return !filter || std::any_of(filter->begin(), filter->end(),
                                  [&](const std::string& each) { return core::sameName(each, name); });
}

std::vector<Qualifier> propertyQualifiers(const core::ClassChain& chain,
                                          const core::PropertyDeclaration& declared) {
    std::vector<Qualifier> qualifiers;
    if (declared.isKey) qualifiers.push_back(flagQualifier("Key", true, false));
    for (Qualifier& qualifier : valueMapOf(chain, declared.name))
        qualifiers.push_back(std::move(qualifier));
    return qualifiers;
}

ClassMethod methodElement(const core::MethodDeclaration& declared, bool includeQualifiers) {
    ClassMethod method;
    method.name = declared.name;
    method.returnType = declared.returnType;
    for (const core::ParameterDeclaration& parameter : declared.parameters) {
        cimxml::ClassParameter& element = method.parameters.emplace_back();
        element.declaration = parameter;
        if (includeQualifiers && parameter.direction == core::CimDirection::Out) {
            element.qualifiers = {flagQualifier("In", false), flagQualifier("Out", true)};
        }
    }
    return method;
}

/// Collects declarations from the root down, so that a nearer one takes the place of a farther one while the
/// origin stays the farthest.
class ElementBuilder {
  public:
    ElementBuilder(const core::ClassChain& chain, const ClassOptions& options)
        : m_chain(chain), m_options(options) {}

    cimxml::ClassElement build() {
        for (auto each = m_chain.rbegin(); each != m_chain.rend(); ++each) {
            const bool propagated = *each != m_chain.front();
            for (const core::PropertyDeclaration& property : (*each)->properties) {
                addProperty(property, (*each)->name, propagated);
            }
            for (const core::MethodDeclaration& method : (*each)->methods) {
                addMethod(method, (*each)->name, propagated);
            }
        }
        finish();
        return std::move(m_element);
    }

  private:
    void addProperty(const core::PropertyDeclaration& declared, const std::string& origin, bool propagated) {
        const auto found = std::find_if(
            m_element.properties.begin(), m_element.properties.end(),
            [&](const auto& element) { return core::sameName(element.declaration.name, declared.name); });
        if (found == m_element.properties.end()) {
            m_element.properties.push_back({declared, origin, propagated, {}});
            return;
        }
        const bool isKey = found->declaration.isKey || declared.isKey;
        found->declaration = declared;
        found->declaration.isKey = isKey;
        found->propagated = propagated;
    }

    void addMethod(const core::MethodDeclaration& declared, const std::string& origin, bool propagated) {
        ClassMethod method = methodElement(declared, m_options.includeQualifiers);
        method.propagated = propagated;
        const auto found = findByName(m_element.methods, declared.name);
        method.origin = found == m_element.methods.end() ? origin : found->origin;
        if (found == m_element.methods.end()) {
            m_element.methods.push_back(std::move(method));
        } else {
            *found = std::move(method);
        }
    }

    void finish() {
        const core::ClassDeclaration& first = *m_chain.front();
        m_element.name = first.name;
        m_element.superclass = first.superclass;
        std::erase_if(m_element.properties, [&](const ClassProperty& property) {
            return (m_options.localOnly && property.propagated) ||
                   !isWanted(m_options.properties, property.declaration.name);
        });
        std::erase_if(m_element.methods,
                      [&](const ClassMethod& method) { return m_options.localOnly && method.propagated; });
        for (ClassProperty& property : m_element.properties) {
            if (!m_options.includeClassOrigin) property.origin.clear();
            if (m_options.includeQualifiers) {
                property.qualifiers = propertyQualifiers(m_chain, property.declaration);
            }
        }
        for (ClassMethod& method : m_element.methods) {
            if (!m_options.includeClassOrigin) method.origin.clear();
        }
        const bool isAssociation =
            std::any_of(m_chain.begin(), m_chain.end(), [](const auto& each) { return each->isAssociation; });
        if (m_options.includeQualifiers && isAssociation) {
            m_element.qualifiers.push_back(flagQualifier("Association", true, false));
        }
    }

    const core::ClassChain& m_chain;
    const ClassOptions& m_options;
    cimxml::ClassElement m_element;
};

}  // namespace

cimxml::ClassElement classElement(const core::ClassChain& chain, const ClassOptions& options) {
    return ElementBuilder(chain, options).build();
}

std::vector<std::string> propertyNames(const core::ClassChain& chain) {
    std::vector<std::string> names;
    for (const auto& declaration : chain) {
        for (const core::PropertyDeclaration& property : declaration->properties) {
            names.push_back(property.name);
        }
    }
    return names;
}

std::map<std::string, std::string> originsOf(const core::ClassChain& chain) {
    std::map<std::string, std::string> origins;
    for (const auto& declaration : chain) {
        for (const core::PropertyDeclaration& property : declaration->properties) {
            origins[core::foldName(property.name)] = declaration->name;
        }
    }
    return origins;
}

const std::vector<cimxml::QualifierDeclaration>& qualifierDeclarations() {
    const CimValue no = CimValue::of(CimType::Boolean, false);
    const CimValue yes = CimValue::of(CimType::Boolean, true);
    const CimValue noTexts = CimValue::null(CimType::String, true);
    const CimValue noText = CimValue::null(CimType::String);
    static const std::vector<cimxml::QualifierDeclaration> declarations{
        {"Association", CimType::Boolean, false, false, {"ASSOCIATION"}, no},
        {"Description", CimType::String, false, true, {"CLASS", "PROPERTY", "METHOD", "PARAMETER"}, noText},
        {"In", CimType::Boolean, false, false, {"PARAMETER"}, yes},
        {"Key", CimType::Boolean, false, false, {"PROPERTY", "REFERENCE"}, no},
        {"Out", CimType::Boolean, false, false, {"PARAMETER"}, no},
        {"ValueMap", CimType::String, true, true, {"PROPERTY", "METHOD", "PARAMETER"}, noTexts},
        {"Values", CimType::String, true, true, {"PROPERTY", "METHOD", "PARAMETER"}, noTexts}};
    return declarations;
}

}  // namespace host
