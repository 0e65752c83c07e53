// SPDX-License-Identifier: Apache-2.0
#include "Indications/Subscriptions/Records.h"

#include <algorithm>

namespace indications {

namespace {

template <class Elements, class Test>
auto find(const Elements& elements, const Test& test) -> const typename Elements::value_type* {
    const auto found = std::ranges::find_if(elements, test);
    return found == elements.end() ? nullptr : &*found;
}

struct StaticQuery {
    const char* event;
    const char* query;
    const char* description;
};

/// The texts are those of other servers' filters for jobs, so that clients find what they know.
constexpr StaticQuery kStaticQueries[] = {
    {"Created", "SELECT * FROM CIM_InstCreation WHERE SourceInstance ISA CIM_ConcreteJob",
     "A job has been created"},
    {"PercentUpdated",
     "SELECT * FROM CIM_InstModification WHERE SourceInstance ISA CIM_ConcreteJob AND "
     "SourceInstance.CIM_ConcreteJob::PercentComplete <> PreviousInstance.CIM_ConcreteJob::PercentComplete",
     "A job has got further"},
    {"Changed",
     "SELECT * FROM CIM_InstModification WHERE SourceInstance ISA CIM_ConcreteJob AND "
     "SourceInstance.CIM_ConcreteJob::JobState <> PreviousInstance.CIM_ConcreteJob::JobState",
     "The state of a job has changed"},
    {"Succeeded",
     "SELECT * FROM CIM_InstModification WHERE SourceInstance ISA CIM_ConcreteJob AND "
     "SourceInstance.CIM_ConcreteJob::JobState = 7",
     "A job has completed"},
    {"Failed",
     "SELECT * FROM CIM_InstModification WHERE SourceInstance ISA CIM_ConcreteJob AND "
     "SourceInstance.CIM_ConcreteJob::JobState = 10",
     "A job has failed"},
    {"Deleted", "SELECT * FROM CIM_InstDeletion WHERE SourceInstance ISA CIM_ConcreteJob",
     "A job has been deleted"}};

}  // namespace

std::size_t Records::clientFilters() const {
    return static_cast<std::size_t>(std::ranges::count(filters, false, &Filter::isStatic));
}

const Filter* Records::filter(const std::string& name) const {
    return find(filters, [&](const Filter& each) { return each.name == name; });
}

const Destination* Records::destination(const DestinationKey& key) const {
    return find(destinations, [&](const Destination& each) { return each.key == key; });
}

const Subscription* Records::subscription(const std::string& filter,
                                          const DestinationKey& destination) const {
    return find(subscriptions, [&](const Subscription& each) {
        return each.filter == filter && each.destination == destination;
    });
}

void Records::erase(const DestinationKey& key) {
    const Destination* const gone = destination(key);
    if (gone == nullptr) return;
    std::erase_if(filters, [&](const Filter& filter) {
        if (filter.isStatic || filter.creator != gone->creator) return false;
        const auto refersTo = [&](const Subscription& each) { return each.filter == filter.name; };
        const auto isElsewhere = [&](const Subscription& each) {
            return refersTo(each) && each.destination != key;
        };
        return std::ranges::any_of(subscriptions, refersTo) &&
               std::ranges::none_of(subscriptions, isElsewhere);
    });
    std::erase_if(subscriptions, [&](const Subscription& each) { return each.destination == key; });
    std::erase_if(destinations, [&](const Destination& each) { return each.key == key; });
}

std::vector<Filter> staticFilters(const std::string& namespaceName) {
    std::vector<Filter> filters;
    for (const StaticQuery& each : kStaticQueries) {
        Filter& filter = filters.emplace_back();
        filter.name = std::string("Quenx:ConcreteJob:") + each.event;
        filter.namespaces = {namespaceName};
        filter.query = each.query;
        filter.language = "DMTF:CQL";
        filter.labels.description = each.description;
        filter.isStatic = true;
    }
    return filters;
}

}  // namespace indications
