// SPDX-License-Identifier: Apache-2.0
#include "Indications/Subscriptions/Instances.h"

#include <algorithm>
#include <utility>

#include "Indications/Subscriptions/Classes.h"

namespace indications {

namespace {

using core::CimPath;
using core::CimType;
using core::CimValue;
using core::InstanceValue;

/// Fills an instance, property by property.
class Filling {
  public:
    explicit Filling(CimPath path) : m_instance{std::move(path), {}} {
        for (const core::CimKey& key : m_instance.path.getKeys()) {
            const bool isReference = std::holds_alternative<CimPath>(key.value);
            const auto type = isReference ? CimType::Reference : CimType::String;
            core::PropertyValue property{key.name, CimValue::of(type, key.value), true, ""};
            if (const auto* reference = std::get_if<CimPath>(&key.value))
                property.referenceClass = reference->getClassName();
            m_instance.properties.push_back(std::move(property));
        }
    }

    Filling& add(const char* name, CimValue value) {
        m_instance.properties.push_back({name, std::move(value), false, ""});
        return *this;
    }
    /// Null for an empty one.
    Filling& text(const char* name, const std::string& value) {
        return add(name,
                   value.empty() ? CimValue::null(CimType::String) : CimValue::of(CimType::String, value));
    }
    Filling& number(const char* name, CimType type, std::uint64_t value) {
        return add(name, CimValue::of(type, value));
    }
    Filling& flag(const char* name, bool value) { return add(name, CimValue::of(CimType::Boolean, value)); }
    Filling& time(const char* name, std::uint64_t microseconds) {
        return add(name, CimValue::of(CimType::Datetime, utils::Time::fromEpoch(microseconds)));
    }
    Filling& labels(const Labels& labels) {
        text("Caption", labels.caption).text("Description", labels.description);
        return text("ElementName", labels.elementName);
    }
    InstanceValue take() { return std::move(m_instance); }

  private:
    InstanceValue m_instance;
};

CimPath systemPath(const std::string& className, const std::string& name, const std::string& systemName) {
    return {className,
            {{"SystemCreationClassName", std::string("CIM_ComputerSystem")},
             {"SystemName", systemName},
             {"CreationClassName", className},
             {"Name", name}}};
}

}  // namespace

CimPath pathOf(const Filter& filter, const std::string& systemName) {
    return systemPath(kFilter, filter.name, systemName);
}

CimPath pathOf(const DestinationKey& destination, const std::string& systemName) {
    return systemPath(destination.className, destination.name, systemName);
}

CimPath pathOf(const Subscription& subscription, const std::string& systemName) {
    return {kSubscription,
            {{"Filter", systemPath(kFilter, subscription.filter, systemName)},
             {"Handler", pathOf(subscription.destination, systemName)}}};
}

InstanceValue instanceOf(const Filter& filter, const std::string& systemName) {
    std::vector<core::CimScalar> namespaces(filter.namespaces.begin(), filter.namespaces.end());
    return Filling(pathOf(filter, systemName))
        .labels(filter.labels)
        .text("SourceNamespace", filter.namespaces.front())
        .add("SourceNamespaces", CimValue::arrayOf(CimType::String, std::move(namespaces)))
        .text("Query", filter.query)
        .text("QueryLanguage", filter.language)
        .flag("IndividualSubscriptionSupported", true)
        .take();
}

InstanceValue instanceOf(const Destination& destination, const std::string& systemName) {
    constexpr std::uint64_t kCimXml = 2;
    return Filling(pathOf(destination.key, systemName))
        .labels(destination.labels)
        .number("PersistenceType", CimType::Uint16, destination.persistence)
        .text("Destination", destination.url)
        .number("Protocol", CimType::Uint16, kCimXml)
        .take();
}

InstanceValue instanceOf(const Subscription& subscription, std::uint64_t state, const std::string& systemName,
                         std::uint64_t now) {
    constexpr std::uint64_t kIgnore = 2;  // OnFatalErrorPolicy
    constexpr std::uint64_t kNone = 2;    // RepeatNotificationPolicy
    Filling filling(pathOf(subscription, systemName));
    filling.number("OnFatalErrorPolicy", CimType::Uint16, kIgnore)
        .number("RepeatNotificationPolicy", CimType::Uint16, kNone)
        .number("SubscriptionState", CimType::Uint16, state)
        .time("TimeOfLastStateChange", subscription.changed);
    filling.time("SubscriptionStartTime", subscription.start);
    if (subscription.duration) {
        const std::uint64_t passed = (now - subscription.start) / 1'000'000;
        filling.number("SubscriptionDuration", CimType::Uint64, *subscription.duration)
            .number("SubscriptionTimeRemaining", CimType::Uint64,
                    *subscription.duration - std::min(passed, *subscription.duration));
    } else {
        filling.add("SubscriptionDuration", CimValue::null(CimType::Uint64))
            .add("SubscriptionTimeRemaining", CimValue::null(CimType::Uint64));
    }
    return filling.text("SubscriptionInfo", subscription.info).take();
}

InstanceValue serviceInstance(const DeliverySettings& settings, const std::string& systemName) {
    constexpr std::uint64_t kIgnore = 4;  // a listener that is gone stays subscribed
    constexpr std::uint64_t kThirtyDays = 30ULL * 86400;
    const auto pause = std::chrono::ceil<std::chrono::seconds>(settings.retryPause);
    return Filling(systemPath(kService, "quenx-cimd", systemName))
        .text("ElementName", "Quenx indication service")
        .flag("Started", true)
        .number("EnabledState", CimType::Uint16, 2)
        .flag("FilterCreationEnabled", true)
        .number("DeliveryRetryAttempts", CimType::Uint16, static_cast<std::uint64_t>(settings.retries))
        .number("DeliveryRetryInterval", CimType::Uint32, static_cast<std::uint64_t>(pause.count()))
        .number("SubscriptionRemovalAction", CimType::Uint16, kIgnore)
        .number("SubscriptionRemovalTimeInterval", CimType::Uint32, kThirtyDays)
        .take();
}

InstanceValue capabilitiesInstance(std::size_t most, bool isPersisted) {
    CimPath path(kCapabilities, {{"InstanceID", std::string("Quenx:IndicationServiceCapabilities")}});
    return Filling(std::move(path))
        .text("ElementName", "Quenx indication service capabilities")
        .flag("FilterCreationEnabledIsSettable", false)
        .flag("DeliveryRetryAttemptsIsSettable", false)
        .flag("DeliveryRetryIntervalIsSettable", false)
        .flag("SubscriptionRemovalActionIsSettable", false)
        .flag("SubscriptionRemovalTimeIntervalIsSettable", false)
        .number("MaxListenerDestinations", CimType::Uint16, most)
        .number("MaxActiveSubscriptions", CimType::Uint16, most)
        .flag("SubscriptionsPersisted", isPersisted)
        .take();
}

}  // namespace indications
