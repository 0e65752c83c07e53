// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "Indications/Query/Query.h"

/// What clients have made of subscriptions, as the object manager keeps it. All are values.
namespace indications {

/// What a client may say of anything, for people.
struct Labels {
    std::string caption;
    std::string description;
    std::string elementName;
};

/// What is wanted (CIM_IndicationFilter). Its name is its key.
struct Filter {
    std::string name;
    std::vector<std::string> namespaces;  ///< that the events come from; never empty
    std::string query;                    ///< as the client sent it, like the language
    std::string language;
    Labels labels = {};
    std::string creator = {};                         ///< who made it; empty for one of the server's own
    bool isStatic = false;                            ///< the server's own
    std::shared_ptr<const Query> compiled = nullptr;  ///< null for one that can be compiled no more
};

/// What names a destination.
struct DestinationKey {
    std::string className;  ///< as the schema spells it
    std::string name;

    bool operator==(const DestinationKey&) const = default;
    /// For the log and for the delivery.
    std::string text() const { return className + " " + name; }
};

/// PersistenceType of CIM_ListenerDestination.
inline constexpr std::uint64_t kOtherPersistence = 1;
inline constexpr std::uint64_t kPermanent = 2;
inline constexpr std::uint64_t kTransient = 3;

/// Where to (CIM_ListenerDestinationCIMXML, and CIM_IndicationHandlerCIMXML of older clients).
struct Destination {
    DestinationKey key;
    std::string url;  ///< as the client sent it
    std::uint64_t persistence = kPermanent;
    Labels labels = {};
    std::string creator = {};
    std::string address = {};  ///< of the creator
};

/// SubscriptionState of CIM_AbstractIndicationSubscription.
inline constexpr std::uint64_t kEnabled = 2;
inline constexpr std::uint64_t kDegraded = 3;
inline constexpr std::uint64_t kDisabled = 4;

/// That a filter's indications go to a destination (CIM_IndicationSubscription). Both are its key.
struct Subscription {
    std::string filter;
    DestinationKey destination;
    std::uint64_t state = kEnabled;  ///< as a client has set it: enabled or disabled
    std::string info = {};
    std::optional<std::uint64_t> duration = {};  ///< seconds from the start; for ever without
    std::uint64_t start = 0;                     ///< microseconds since the Unix epoch, like the next
    std::uint64_t changed = 0;                   ///< when the state was set
    std::string creator = {};
    std::uint64_t tag = 0;  ///< of this process, for what waits for delivery

    bool isExpired(std::uint64_t now) const { return duration && now - start >= *duration * 1'000'000; }
};

/// All of them. Those of the server come first among the filters.
struct Records {
    std::vector<Filter> filters;
    std::vector<Destination> destinations;
    std::vector<Subscription> subscriptions;

    /// How many filters are none of the server's own.
    std::size_t clientFilters() const;

    // Null where there is none.
    const Filter* filter(const std::string& name) const;
    const Destination* destination(const DestinationKey& key) const;
    const Subscription* subscription(const std::string& filter, const DestinationKey& destination) const;

    /// With the subscriptions that refer to it, and the filters of its creator to which these alone refer.
    void erase(const DestinationKey& key);
};

/// The filters that the server itself has for jobs, not compiled yet.
/// @param namespaceName  in which the jobs are
std::vector<Filter> staticFilters(const std::string& namespaceName);

}  // namespace indications
