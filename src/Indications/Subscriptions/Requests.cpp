// SPDX-License-Identifier: Apache-2.0
#include "Indications/Subscriptions/Requests.h"

#include <algorithm>
#include <array>
#include <atomic>
#include <chrono>

#include "Indications/Delivery/Destination.h"
#include "Indications/Subscriptions/Classes.h"
#include "Utils/Log.h"
#include "Utils/Utils.h"

namespace indications {

namespace {

using core::CimError;
using core::CimStatus;
using core::CimType;
using core::CimValue;
using core::InstanceValue;

constexpr std::size_t kLongestName = 256;
constexpr std::size_t kLongestText = 1024;
constexpr std::size_t kMostNamespaces = 16;

[[noreturn]] void refuse(const std::string& text, CimStatus status = CimStatus::InvalidParameter) {
    throw CimError(status, text);
}

void requireShort(const char* what, const std::string& text, std::size_t most = kLongestText) {
    if (text.size() > most) refuse(std::string(what) + " is longer than " + std::to_string(most) + " bytes");
}

void requireName(const std::string& name) {
    requireShort("Name", name, kLongestName);
    const auto isControl = [](char each) { return static_cast<unsigned char>(each) < ' ' || each == '\x7F'; };
    if (std::ranges::any_of(name, isControl)) refuse("Name holds a control character");
}

void requireShort(const Labels& labels) {
    requireShort("Caption", labels.caption);
    requireShort("Description", labels.description);
    requireShort("ElementName", labels.elementName);
}

const core::PropertyDeclaration* declarationIn(const core::ClassChain& chain, std::string_view name) {
    for (const auto& level : chain) {
        if (const auto* found = core::findByName(level->properties, name)) return found;
    }
    return nullptr;
}

std::optional<core::CimScalar> typedScalar(CimType type, const core::CimScalar& given) {
    if (auto converted = core::convertScalar(type, given)) return converted;
    // Some clients send all as texts.
    const auto* const text = std::get_if<std::string>(&given);
    return text == nullptr ? std::nullopt : core::parseScalar(type, *text);
}

CimValue typedValue(const core::PropertyDeclaration& declared, const CimValue& given) {
    if (given.isNull()) return CimValue::null(declared.type, declared.isArray);
    std::vector<core::CimScalar> typed;
    bool fits = declared.isArray || given.scalar() != nullptr;
    CimValue copy = given;
    copy.forEach([&](const core::CimScalar& each) {
        auto scalar = typedScalar(declared.type, each);
        fits = fits && scalar;
        if (fits) typed.push_back(std::move(*scalar));
    });
    if (!fits) {
        refuse(declared.name + " takes a value of type " + std::string(core::typeName(declared.type)) +
                   (declared.isArray ? "[]" : ""),
               CimStatus::TypeMismatch);
    }
    if (declared.isArray) return CimValue::arrayOf(declared.type, std::move(typed));
    return CimValue::of(declared.type, std::move(typed.front()));
}

/// Once: a client that sends one sends it always.
void noteUnknown(const std::string& className, const std::string& property) {
    static std::atomic_flag noted;
    if (noted.test_and_set()) return;
    QUENX_ERROR("A client sends the property '%s', which %s does not have; such ones are passed over",
                utils::escapeForFormat(property).c_str(), className.c_str());
}

Labels labelsOf(const InstanceValue& instance) {
    return {instance.text("Caption"), instance.text("Description"), instance.text("ElementName")};
}

std::string nameOf(const InstanceValue& instance, const char* kind) {
    const std::string& className = instance.path.getClassName();
    const std::string given = instance.text("CreationClassName");
    if (!given.empty() && !core::sameName(given, className))
        refuse("CreationClassName is " + given + ", and the instance one of " + className);
    std::string name = instance.text("Name");
    if (!name.empty()) return name;
    static std::atomic<unsigned> count{0};
    return std::string("Quenx:") + kind + ":" + std::to_string(currentTime()) + "-" + std::to_string(++count);
}

using Allowed = std::initializer_list<std::uint64_t>;
constexpr Allowed kPersistences = {kPermanent, kTransient, kOtherPersistence};
constexpr Allowed kStates = {kEnabled, kDisabled};

void requireOneOf(const Allowed& allowed, std::uint64_t given, const char* name, CimStatus otherwise) {
    if (std::ranges::find(allowed, given) != allowed.end()) return;
    std::string right;
    for (const std::uint64_t each : allowed)
        right += (right.empty() ? "" : " or ") + std::to_string(each);
    refuse(std::string(name) + " is " + std::to_string(given) + "; here it can be " + right, otherwise);
}

/// A number of which only some are supported; the first of these where it is missing.
std::uint64_t requireNumber(const InstanceValue& instance, const char* name, const Allowed& allowed,
                            CimStatus otherwise = CimStatus::InvalidParameter) {
    const std::uint64_t number = instance.get<std::uint64_t>(name).value_or(*allowed.begin());
    requireOneOf(allowed, number, name, otherwise);
    return number;
}

std::string plainNamespace(const std::string& name) {
    core::CimPath path;
    path.setNamespace(name);
    return path.getNamespace();
}

bool hasNamespace(const std::vector<std::string>& namespaces, const std::string& name) {
    return std::ranges::any_of(namespaces,
                               [&](const auto& each) { return core::sameName(each, plainNamespace(name)); });
}

bool isSame(const core::PropertyValue* left, const CimValue& right) {
    if (left == nullptr || left->value.isNull() || right.isNull())
        return (left == nullptr || left->value.isNull()) == right.isNull();
    return core::valueText(left->value) == core::valueText(right);
}

}  // namespace

std::uint64_t currentTime() {
    const auto now = std::chrono::system_clock::now().time_since_epoch();
    return static_cast<std::uint64_t>(std::chrono::duration_cast<std::chrono::microseconds>(now).count());
}

InstanceValue typedInstance(const InstanceValue& given, const core::ClassChain& chain) {
    InstanceValue typed{given.path, {}};
    for (const core::PropertyValue& property : given.properties) {
        const auto* const declared = declarationIn(chain, property.name);
        if (declared == nullptr) {
            noteUnknown(chain.front()->name, property.name);
            continue;
        }
        if (typed.find(declared->name) != nullptr) refuse(declared->name + " is given twice");
        typed.properties.push_back(
            {declared->name, typedValue(*declared, property.value), declared->isKey, ""});
    }
    return typed;
}

Filter readFilter(const InstanceValue& instance, const std::string& eventNamespace) {
    Filter filter;
    filter.name = nameOf(instance, "filter");
    for (const auto& [name, value] :
         {std::pair("Query", &filter.query), {"QueryLanguage", &filter.language}}) {
        *value = instance.text(name);
        if (value->empty()) refuse(std::string(name) + " is missing");
    }
    if (!instance.get<bool>("IndividualSubscriptionSupported").value_or(true))
        refuse("filters that stand in collections only are not supported", CimStatus::NotSupported);
    filter.namespaces = instance.texts("SourceNamespaces");
    const std::string single = instance.text("SourceNamespace");
    if (filter.namespaces.empty() && !single.empty()) filter.namespaces.push_back(single);
    // The schema has them looked for where the filter is, in which nothing ever happens.
    if (filter.namespaces.empty()) filter.namespaces.push_back(eventNamespace);
    filter.labels = labelsOf(instance);
    return filter;
}

Destination readDestination(const InstanceValue& instance) {
    constexpr std::uint64_t kCimXml = 2;
    Destination destination;
    destination.key = {core::sameName(instance.path.getClassName(), kHandler) ? kHandler : kDestination,
                       nameOf(instance, "destination")};
    destination.url = instance.text("Destination");
    destination.persistence = requireNumber(instance, "PersistenceType", kPersistences);
    requireNumber(instance, "Protocol", {kCimXml});
    destination.labels = labelsOf(instance);
    return destination;
}

Subscription readSubscription(const InstanceValue& instance) {
    requireNumber(instance, "OnFatalErrorPolicy", {2}, CimStatus::NotSupported);
    requireNumber(instance, "RepeatNotificationPolicy", {2}, CimStatus::NotSupported);
    Subscription subscription;
    subscription.state = requireNumber(instance, "SubscriptionState", kStates);
    subscription.info = instance.text("SubscriptionInfo");
    subscription.duration = instance.get<std::uint64_t>("SubscriptionDuration");
    subscription.start = subscription.changed = currentTime();
    return subscription;
}

void change(Subscription& subscription, const InstanceValue& instance, const InstanceValue& current,
            const core::PropertyFilter& only) {
    constexpr std::array<const char*, 3> kChangeable = {"SubscriptionState", "SubscriptionInfo",
                                                        "SubscriptionDuration"};
    const core::WantedProperties counts(only);
    Subscription wanted = subscription;
    for (const core::PropertyValue& property : instance.properties) {
        const bool isKey = core::findByName(current.path.getKeys(), property.name) != nullptr;
        if (isKey || !counts.includes(property.name)) continue;
        if (isSame(current.find(property.name), property.value)) continue;
        if (std::ranges::none_of(kChangeable, [&](auto* each) { return property.name == each; }))
            refuse(property.name + " cannot be changed", CimStatus::NotSupported);
        const Subscription read = readSubscription({instance.path, {property}});
        if (property.name == "SubscriptionState") {
            wanted.state = read.state;
            wanted.changed = read.changed;
        } else if (property.name == "SubscriptionInfo") {
            wanted.info = read.info;
        } else {
            wanted.duration = read.duration;
        }
    }
    check(wanted);
    subscription = std::move(wanted);
}

void check(Filter& filter, const EventSources& sources) {
    requireName(filter.name);
    requireShort("QueryLanguage", filter.language);
    requireShort(filter.labels);
    if (filter.namespaces.size() > kMostNamespaces)
        refuse("SourceNamespaces names more than " + std::to_string(kMostNamespaces));
    for (const std::string& name : filter.namespaces) {
        if (!hasNamespace(sources.namespaces, name))
            refuse("SourceNamespaces names \"" + utils::escapeForFormat(name.substr(0, 100)) +
                   "\", which is no namespace here");
    }
    requireKnownLanguage(filter.language);
    auto compiled = std::make_shared<const Query>(filter.query);
    compiled->check({indicationClasses(), sources.classes});
    filter.compiled = std::move(compiled);
}

void check(const Destination& destination) {
    requireName(destination.key.name);
    requireOneOf(kPersistences, destination.persistence, "PersistenceType", CimStatus::InvalidParameter);
    requireShort(destination.labels);
    requireDestination(destination.url);
}

void check(const Subscription& subscription) {
    // A hundred years: what is added to a time must fit.
    constexpr std::uint64_t kLongest = 100ULL * 366 * 86400;
    requireShort("SubscriptionInfo", subscription.info);
    requireOneOf(kStates, subscription.state, "SubscriptionState", CimStatus::InvalidParameter);
    if (subscription.duration && (*subscription.duration == 0 || *subscription.duration > kLongest))
        refuse("SubscriptionDuration must be from 1 to " + std::to_string(kLongest) + " seconds");
}

void requireEvents(const Filter& filter, const EventSources& sources) {
    if (hasNamespace(filter.namespaces, sources.eventNamespace)) return;
    refuse("the filter \"" + filter.name + "\" looks in " + filter.namespaces.front() +
               ", where nothing ever happens; events come from " + sources.eventNamespace,
           CimStatus::NotSupported);
}

}  // namespace indications
