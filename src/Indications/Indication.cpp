// SPDX-License-Identifier: Apache-2.0
#include "Indications/Indication.h"

#include <algorithm>
#include <array>

#include "Framework/Events/LifecycleIndication.h"

namespace indications {

namespace {

using core::CimType;
using core::CimValue;

core::PropertyValue textProperty(const char* name, std::string text) {
    return {name, CimValue::of(CimType::String, std::move(text)), false, {}};
}

const core::CimValue* valueIn(const std::vector<core::PropertyValue>& properties, std::string_view name) {
    const auto* const found = core::findByName(properties, name);
    return found == nullptr ? nullptr : &found->value;
}

/// An instance within an indication, as queries look at it.
class SourceObject : public QueryObject {
  public:
    SourceObject(const core::InstanceValue& instance, const core::ClassChain& chain)
        : m_instance(instance), m_chain(chain) {}
    bool isOf(std::string_view className) const override {
        return core::derivesFrom(m_chain, className) ||
               core::sameName(m_instance.path.getClassName(), className);
    }
    const core::CimValue* value(std::string_view property) const override {
        return valueIn(m_instance.properties, property);
    }
    const QueryObject* embedded(std::string_view) const override { return nullptr; }

  private:
    const core::InstanceValue& m_instance;
    const core::ClassChain& m_chain;
};

/// The indication itself.
class IndicationObject : public QueryObject {
  public:
    IndicationObject(const std::string& className, const std::vector<core::PropertyValue>& properties,
                     const QueryObject* source, const QueryObject* previous)
        : m_className(className), m_properties(properties), m_source(source), m_previous(previous) {}
    bool isOf(std::string_view className) const override {
        constexpr std::array<std::string_view, 2> kAbove = {"CIM_InstIndication", "CIM_Indication"};
        return core::sameName(m_className, className) ||
               std::ranges::any_of(kAbove, [&](auto each) { return core::sameName(each, className); });
    }
    const core::CimValue* value(std::string_view property) const override {
        return valueIn(m_properties, property);
    }
    const QueryObject* embedded(std::string_view property) const override {
        if (core::sameName(property, "SourceInstance")) return m_source;
        return core::sameName(property, "PreviousInstance") ? m_previous : nullptr;
    }

  private:
    const std::string& m_className;
    const std::vector<core::PropertyValue>& m_properties;
    const QueryObject* m_source;
    const QueryObject* m_previous;
};

/// The instance with the properties that a query selects; the instance itself where it selects all.
core::InstanceSnapshot projected(const core::InstanceSnapshot& instance, const Query& query,
                                 const char* embedded) {
    const auto isWanted = [&](const auto& property) { return query.wants(embedded, property.name); };
    if (std::ranges::all_of(instance->properties, isWanted)) return instance;
    auto copy = std::make_shared<core::InstanceValue>(core::InstanceValue{instance->path, {}});
    std::ranges::copy_if(instance->properties, std::back_inserter(copy->properties), isWanted);
    return copy;
}

}  // namespace

Indication::Indication(const core::InstanceEvent& event, std::string identifier, std::string host,
                       const core::ClassLookup& classes)
    : m_className(core::indicationClassOf(event)),
      m_source(core::sourceOf(event)),
      m_previous(core::previousOf(event)),
      m_sourceClass(classes(m_source->path.getClassName())),
      m_properties(core::indicationProperties(event, std::move(identifier), std::move(host),
                                              m_source->path.getNamespace())) {}

bool Indication::matches(const Query& query) const {
    const SourceObject source(*m_source, m_sourceClass);
    if (m_previous == nullptr)
        return query.matches(IndicationObject(m_className, m_properties, &source, nullptr));
    const SourceObject previous(*m_previous, m_sourceClass);
    return query.matches(IndicationObject(m_className, m_properties, &source, &previous));
}

cimxml::ExportedIndication Indication::exported(const Query& query, const std::string& filterName,
                                                const Sequence& sequence) const {
    cimxml::ExportedIndication result{m_className, {}, {}};
    std::ranges::copy_if(m_properties, std::back_inserter(result.properties),
                         [&](const auto& property) { return query.wants(property.name); });
    result.properties.push_back(textProperty("IndicationFilterName", filterName));
    result.properties.push_back(textProperty("SequenceContext", sequence.context));
    result.properties.push_back(
        {"SequenceNumber", CimValue::of(CimType::Sint64, sequence.number), false, {}});
    if (m_previous != nullptr && query.wants("PreviousInstance"))
        result.embedded.push_back({"PreviousInstance", projected(m_previous, query, "PreviousInstance")});
    if (query.wants("SourceInstance"))
        result.embedded.push_back({"SourceInstance", projected(m_source, query, "SourceInstance")});
    return result;
}

}  // namespace indications
