// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <gtest/gtest.h>

#include <pugixml.hpp>
#include <string>
#include <vector>

#include "Indications/StrictListener.h"

namespace test {

/// All events of jobs, in WQL as in CQL.
inline constexpr const char* kAll =
    "SELECT * FROM CIM_InstIndication WHERE SourceInstance ISA CIM_ConcreteJob";

/// An indication as a listener reads it.
struct Told {
    std::string className;
    std::string filter;
    std::string context;
    std::string state;
    std::string before;  ///< state before a modification
    std::string percent;
    long number = -1;
};

inline std::string valueIn(const pugi::xml_node& instance, const char* property) {
    return instance.find_child_by_attribute("NAME", property).child("VALUE").text().get();
}

inline Told told(const std::string& body) {
    pugi::xml_document document;
    EXPECT_TRUE(document.load_string(body.c_str()));
    const pugi::xml_node instance = document.select_node("//EXPPARAMVALUE/INSTANCE").node();
    const auto embedded = [&](const char* name, const char* property) {
        pugi::xml_document inner;
        inner.load_string(valueIn(instance, name).c_str());
        return valueIn(inner.child("INSTANCE"), property);
    };
    return {instance.attribute("CLASSNAME").value(),       valueIn(instance, "IndicationFilterName"),
            valueIn(instance, "SequenceContext"),          embedded("SourceInstance", "JobState"),
            embedded("PreviousInstance", "JobState"),      embedded("SourceInstance", "PercentComplete"),
            std::stol(valueIn(instance, "SequenceNumber"))};
}

inline std::vector<Told> toldOf(StrictListener& listener, std::size_t count) {
    std::vector<Told> all;
    for (const std::string& body : listener.waitFor(count))
        all.push_back(told(body));
    EXPECT_EQ(listener.problems(), std::vector<std::string>());
    return all;
}

/// Waits for the indication of a job's deletion, which is its last.
inline std::vector<Told> toldUntilDeletion(StrictListener& listener) {
    for (std::size_t count = 4;; ++count) {
        std::vector<Told> all = toldOf(listener, count);
        if (all.size() < count || all.back().className == "CIM_InstDeletion") return all;
    }
}

}  // namespace test
