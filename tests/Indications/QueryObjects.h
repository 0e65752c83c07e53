// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <map>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "Indications/Query/Query.h"

namespace test {

/// An object for queries, of a class and its superclasses.
class Object : public indications::QueryObject {
  public:
    explicit Object(std::vector<std::string> classes) : m_classes(std::move(classes)) {}

    Object& set(const std::string& name, core::CimValue value) {
        m_values[core::foldName(name)] = std::move(value);
        return *this;
    }
    Object& hold(const std::string& name, std::shared_ptr<const Object> object) {
        m_objects[core::foldName(name)] = std::move(object);
        return *this;
    }

    bool isOf(std::string_view className) const override {
        for (const std::string& each : m_classes)
            if (core::sameName(each, className)) return true;
        return false;
    }
    const core::CimValue* value(std::string_view property) const override {
        const auto found = m_values.find(core::foldName(property));
        return found == m_values.end() ? nullptr : &found->second;
    }
    const QueryObject* embedded(std::string_view property) const override {
        const auto found = m_objects.find(core::foldName(property));
        return found == m_objects.end() ? nullptr : found->second.get();
    }

  private:
    std::vector<std::string> m_classes;
    std::map<std::string, core::CimValue> m_values;
    std::map<std::string, std::shared_ptr<const Object>> m_objects;
};

/// A job as a listener is shown it.
inline std::shared_ptr<Object> job(std::uint64_t state, std::uint64_t percent,
                                   std::vector<core::CimScalar> statuses) {
    using core::CimType;
    using core::CimValue;
    auto made = std::make_shared<Object>(
        std::vector<std::string>{"Quenx_ConcreteJob", "CIM_ConcreteJob", "CIM_Job", "CIM_ManagedElement"});
    made->set("JobState", CimValue::of(CimType::Uint16, state))
        .set("PercentComplete", CimValue::of(CimType::Uint16, percent))
        .set("OperationalStatus", CimValue::arrayOf(CimType::Uint16, std::move(statuses)))
        .set("Caption", CimValue::of(CimType::String, std::string("Update of eth0's \"UEFI\"")))
        .set("Owner", CimValue::null(CimType::String))
        .set("ErrorCode", CimValue::of(CimType::Sint64, std::int64_t{-3}))
        .set("DeleteOnCompletion", CimValue::of(CimType::Boolean, false))
        .set("StartTime", CimValue::of(CimType::Datetime, *core::parseDatetime("20260102030405.000000+000")));
    return made;
}

/// The indication of a change of it; without the second of its creation.
inline std::shared_ptr<Object> indication(std::shared_ptr<const Object> after,
                                          std::shared_ptr<const Object> before) {
    const char* const name = before == nullptr ? "CIM_InstCreation" : "CIM_InstModification";
    auto made =
        std::make_shared<Object>(std::vector<std::string>{name, "CIM_InstIndication", "CIM_Indication"});
    made->hold("SourceInstance", std::move(after));
    if (before != nullptr) made->hold("PreviousInstance", std::move(before));
    return made;
}

/// The classes of these.
inline const indications::Vocabulary& vocabulary() {
    using core::CimType;
    const auto property = [](const char* name, CimType type, bool isArray = false) {
        return core::PropertyDeclaration{.name = name, .type = type, .isArray = isArray, .isKey = false};
    };
    const auto object = [&](const char* name, const char* qualifier) {
        core::PropertyDeclaration made = property(name, CimType::String);
        made.qualifiers = {{qualifier, core::CimValue::of(CimType::Boolean, true)}};
        return made;
    };
    const auto declared = [](const char* name, const char* superclass,
                             std::vector<core::PropertyDeclaration> properties) {
        core::ClassDeclaration made;
        made.name = name;
        made.superclass = superclass;
        made.properties = std::move(properties);
        return made;
    };
    static const std::vector<core::ClassChain> indicationClasses = core::chainsOf(
        {declared("CIM_Indication", "", {property("IndicationTime", CimType::Datetime)}),
         declared("CIM_InstIndication", "CIM_Indication", {object("SourceInstance", "EmbeddedObject")}),
         declared("CIM_InstCreation", "CIM_InstIndication", {}),
         declared("CIM_InstModification", "CIM_InstIndication",
                  {object("PreviousInstance", "EmbeddedInstance")})});
    static const std::vector<core::ClassChain> sources = core::chainsOf(
        {declared("CIM_ManagedElement", "", {property("Caption", CimType::String)}),
         declared("CIM_Job", "CIM_ManagedElement", {property("OperationalStatus", CimType::Uint16, true)}),
         declared("CIM_ConcreteJob", "CIM_Job",
                  {property("JobState", CimType::Uint16), property("PercentComplete", CimType::Uint16)}),
         declared("CIM_Port", "CIM_ManagedElement", {})});
    static const indications::Vocabulary all{indicationClasses, sources};
    return all;
}

}  // namespace test
