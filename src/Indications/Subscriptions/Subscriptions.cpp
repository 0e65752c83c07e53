// SPDX-License-Identifier: Apache-2.0
#include "Indications/Subscriptions/Subscriptions.h"

#include <algorithm>

#include "Framework/Requests/Caller.h"
#include "Indications/Subscriptions/Classes.h"
#include "Indications/Subscriptions/Instances.h"
#include "Indications/Subscriptions/Requests.h"
#include "Utils/Log.h"

namespace indications {

namespace {

using core::CimError;
using core::CimPath;
using core::CimStatus;
using core::InstanceValue;

const core::ClassChain& chainOf(std::string_view className) {
    static const std::vector<core::ClassChain> kChains = core::chainsOf(subscriptionClasses());
    static const core::ClassChain kNone;
    for (const core::ClassChain& chain : kChains)
        if (core::sameName(chain.front()->name, className)) return chain;
    return kNone;
}

bool isDestination(std::string_view className) {
    return core::sameName(className, kDestination) || core::sameName(className, kHandler);
}

void requireRoom(std::size_t count, std::size_t most, const char* what) {
    if (count < most) return;
    throw CimError(CimStatus::ServerLimitsExceeded,
                   "there are " + std::to_string(most) + " " + what + " already, the most that are kept");
}

[[noreturn]] void refuseSecond(const CimPath& path) {
    throw CimError(CimStatus::AlreadyExists, core::shownPath(path) + " exists already");
}

[[noreturn]] void refuseUnknown(const CimPath& path) {
    throw CimError(CimStatus::NotFound, core::shownPath(path) + " names no instance");
}

/// The path that a property holds.
CimPath referenceIn(const InstanceValue& instance, const char* name) {
    const auto path = instance.get<CimPath>(name);
    if (!path) throw CimError(CimStatus::InvalidParameter, std::string(name) + " is missing");
    return *path;
}

/// Of the key, which may be the only one and without its name.
const core::CimScalar* keyOf(const CimPath& path, std::string_view name) {
    const core::CimKey* const key = core::findByName(path.getKeys(), name);
    return key == nullptr ? nullptr : &key->value;
}

CimPath referenceIn(const CimPath& path, std::string_view name) {
    const core::CimScalar* const value = keyOf(path, name);
    if (value == nullptr) return {};
    const auto* const reference = std::get_if<CimPath>(value);
    return reference != nullptr ? *reference : CimPath(core::scalarText(*value));
}

}  // namespace

Subscriptions::Subscriptions(SubscriptionSettings settings, std::vector<std::string> namespaces,
                             std::string systemName, std::shared_ptr<core::CimOperations> implementation,
                             std::shared_ptr<EventQueue> events)
    : m_settings(std::move(settings)),
      m_namespaces(std::move(namespaces)),
      m_systemName(std::move(systemName)),
      m_implementation(implementation),
      m_file(m_settings.file),
      m_records(std::make_shared<const Records>()),
      m_broadcast(
          m_settings.delivery, m_systemName,
          [this](const Destination& destination) { return policyFor(destination); }, [this] { clear(); },
          std::move(implementation), std::move(events)) {}

std::shared_ptr<const Records> Subscriptions::records() const {
    const std::lock_guard lock(m_mutex);
    return m_records;
}

EventSources Subscriptions::sources() const {
    return {m_namespaces, m_namespaces.front(), m_implementation->enumerateClasses("", true)};
}

AddressPolicy Subscriptions::policyFor(const Destination& destination) const {
    const DestinationRule& rule = m_settings.destinations;
    // A client of the Unix socket has no address: it is on this machine.
    const auto known = machineAddress(destination.address);
    const MachineAddress subscriber = known ? *known : machineAddress("127.0.0.1").value();
    auto policy = AddressPolicy::onlyTo(subscriber);
    if (rule.kind == DestinationRule::Kind::Listed) policy = AddressPolicy::onlyTo(rule.networks);
    if (rule.kind == DestinationRule::Kind::Any) policy = AddressPolicy::anywhere(subscriber);
    policy.deny(m_settings.ownPorts);
    return policy;
}

void Subscriptions::resume() {
    const std::lock_guard changing(m_changes);
    Records all;
    const EventSources known = sources();
    for (Filter& filter : staticFilters(m_namespaces.front())) {
        try {
            check(filter, known);
        } catch (const CimError&) {
            continue;  // there are no jobs here
        }
        all.filters.push_back(std::move(filter));
    }
    if (!accept(all, m_file.read())) m_file.keepCopy();
    auto shared = std::make_shared<const Records>(std::move(all));
    try {
        m_broadcast.prepare(*shared);
    } catch (const std::exception& error) {
        QUENX_ERROR("Nobody can be told of events: %s", error.what());
    }
    m_broadcast.follow(shared);
    const std::lock_guard lock(m_mutex);
    m_records = std::move(shared);
}

/// What was kept is looked at like what a client sends: another version, or a person, may have written it.
bool Subscriptions::accept(Records& all, Records kept) {
    bool isAll = true;
    const auto take = [&](const std::string& what, const auto& step) {
        try {
            step();
        } catch (const CimError& error) {
            isAll = false;
            QUENX_ERROR("%s is passed over: %s", utils::escapeForFormat(what).c_str(), error.what());
        }
    };
    const EventSources known = sources();
    for (Filter& filter : kept.filters) {
        take("Filter " + filter.name, [&] {
            requireRoom(all.clientFilters(), 2 * m_settings.most, "filters");
            if (all.filter(filter.name) != nullptr) refuseSecond(pathOf(filter, m_systemName));
            try {
                check(filter, known);
            } catch (const CimError& error) {
                // Kept, since what is missing may come back with its provider.
                QUENX_ERROR("The subscriptions to the filter '%s' are disabled: %s",
                            utils::escapeForFormat(filter.name).c_str(), error.what());
            }
            all.filters.push_back(std::move(filter));
        });
    }
    for (Destination& destination : kept.destinations) {
        take("Destination " + destination.key.name, [&] {
            requireRoom(all.destinations.size(), m_settings.most, "destinations");
            if (!isDestination(destination.key.className)) refuseUnknown(pathOf(destination.key, ""));
            if (all.destination(destination.key) != nullptr)
                refuseSecond(pathOf(destination.key, m_systemName));
            check(destination);
            all.destinations.push_back(std::move(destination));
        });
    }
    for (Subscription& subscription : kept.subscriptions) {
        if (subscription.isExpired(currentTime())) continue;
        take("Subscription to " + subscription.filter, [&] {
            requireRoom(all.subscriptions.size(), m_settings.most, "subscriptions");
            const CimPath path = pathOf(subscription, m_systemName);
            if (all.subscription(subscription.filter, subscription.destination) != nullptr)
                refuseSecond(path);
            if (all.filter(subscription.filter) == nullptr ||
                all.destination(subscription.destination) == nullptr)
                refuseUnknown(path);
            check(subscription);
            subscription.tag = ++m_tags;
            all.subscriptions.push_back(std::move(subscription));
        });
    }
    return isAll;
}

bool Subscriptions::serves(std::string_view className) {
    return core::sameName(className, kFilter) || core::sameName(className, kSubscription) ||
           isDestination(className);
}

bool Subscriptions::isHere(const CimPath& path) const {
    const std::string& name = path.getNamespace();
    return name.empty() || std::any_of(m_namespaces.begin() + 1, m_namespaces.end(),
                                       [&](const auto& each) { return core::sameName(each, name); });
}

std::string Subscriptions::nameIn(const CimPath& path) const {
    const core::CimScalar* const name = keyOf(path, "Name");
    return name == nullptr || !isHere(path) ? "" : core::scalarText(*name);
}

const Filter* Subscriptions::findFilter(const Records& records, const CimPath& path) const {
    return core::sameName(path.getClassName(), kFilter) ? records.filter(nameIn(path)) : nullptr;
}

const Destination* Subscriptions::findDestination(const Records& records, const CimPath& path) const {
    for (const char* each : {kDestination, kHandler}) {
        if (core::sameName(path.getClassName(), each)) return records.destination({each, nameIn(path)});
    }
    return nullptr;
}

const Subscription* Subscriptions::findSubscription(const Records& records, const CimPath& path) const {
    if (!core::sameName(path.getClassName(), kSubscription) || !isHere(path)) return nullptr;
    const Filter* const filter = findFilter(records, referenceIn(path, "Filter"));
    const Destination* const destination = findDestination(records, referenceIn(path, "Handler"));
    if (filter == nullptr || destination == nullptr) return nullptr;
    const Subscription* const found = records.subscription(filter->name, destination->key);
    return found == nullptr || found->isExpired(currentTime()) ? nullptr : found;
}

InstanceValue Subscriptions::shown(const Subscription& subscription, const Records& records) const {
    std::uint64_t state = subscription.state;
    const Filter* const filter = records.filter(subscription.filter);
    if (filter == nullptr || filter->compiled == nullptr) state = kDisabled;
    const auto counters = m_broadcast.counters(subscription.destination);
    if (state == kEnabled && counters && counters->isFailing) state = kDegraded;
    return instanceOf(subscription, state, m_systemName, currentTime());
}

std::vector<InstanceValue> Subscriptions::instances() const {
    const auto all = records();
    std::vector<InstanceValue> instances{serviceInstance(m_settings.delivery, m_systemName),
                                         capabilitiesInstance(m_settings.most, m_file.isKept())};
    for (const Filter& each : all->filters)
        instances.push_back(instanceOf(each, m_systemName));
    for (const Destination& each : all->destinations)
        instances.push_back(instanceOf(each, m_systemName));
    for (const Subscription& each : all->subscriptions)
        if (!each.isExpired(currentTime())) instances.push_back(shown(each, *all));
    return instances;
}

InstanceValue Subscriptions::get(const CimPath& path) const {
    const auto all = records();
    if (const auto* filter = findFilter(*all, path)) return instanceOf(*filter, m_systemName);
    if (const auto* destination = findDestination(*all, path)) return instanceOf(*destination, m_systemName);
    if (const auto* subscription = findSubscription(*all, path)) return shown(*subscription, *all);
    refuseUnknown(path);
}

std::vector<InstanceValue> Subscriptions::referring(const CimPath& path) const {
    const auto all = records();
    const Filter* const filter = findFilter(*all, path);
    const Destination* const destination = findDestination(*all, path);
    std::vector<InstanceValue> found;
    for (const Subscription& each : all->subscriptions) {
        const bool refers = (filter != nullptr && each.filter == filter->name) ||
                            (destination != nullptr && each.destination == destination->key);
        if (refers && !each.isExpired(currentTime())) found.push_back(shown(each, *all));
    }
    return found;
}

Records Subscriptions::changeable() const {
    Records copy = *records();
    const std::uint64_t now = currentTime();
    std::erase_if(copy.subscriptions, [&](const Subscription& each) { return each.isExpired(now); });
    return copy;
}

/// Of clients that have gone without a word nothing stays for ever.
void Subscriptions::clear() noexcept try {
    const std::lock_guard changing(m_changes);
    const auto gone = m_broadcast.abandoned();
    if (gone.empty()) return;  // a client has been quicker
    Records changed = changeable();
    for (const DestinationKey& each : gone)
        changed.erase(each);
    publish(std::move(changed));
    for (const DestinationKey& each : gone) {
        QUENX_ERROR(
            "The destination '%s' was removed with its subscriptions: it has taken nothing for too long",
            utils::escapeForFormat(each.text()).c_str());
    }
} catch (const std::exception& error) {
    QUENX_ERROR("Subscriptions of clients that have gone could not be removed: %s", error.what());
}

void Subscriptions::publish(Records changed) {
    auto shared = std::make_shared<const Records>(std::move(changed));
    try {
        m_broadcast.prepare(*shared);
        m_file.write(*shared);
    } catch (...) {
        m_broadcast.follow(records());
        throw;
    }
    m_broadcast.follow(shared);
    const std::lock_guard lock(m_mutex);
    m_records = std::move(shared);
}

CimPath Subscriptions::createFilter(Records& records, const InstanceValue& instance) {
    Filter filter = readFilter(instance, m_namespaces.front());
    filter.creator = core::CallerScope::current().principal;
    CimPath path = pathOf(filter, m_systemName);
    if (records.filter(filter.name) != nullptr) refuseSecond(path);
    requireRoom(records.clientFilters(), 2 * m_settings.most, "filters");
    check(filter, sources());
    records.filters.push_back(std::move(filter));
    return path;
}

CimPath Subscriptions::createDestination(Records& records, const InstanceValue& instance) {
    Destination destination = readDestination(instance);
    destination.creator = core::CallerScope::current().principal;
    destination.address = core::CallerScope::current().address;
    CimPath path = pathOf(destination.key, m_systemName);
    if (records.destination(destination.key) != nullptr) refuseSecond(path);
    requireRoom(records.destinations.size(), m_settings.most, "destinations");
    check(destination);
    records.destinations.push_back(std::move(destination));
    return path;
}

CimPath Subscriptions::createSubscription(Records& records, const InstanceValue& instance) {
    const CimPath filterPath = referenceIn(instance, "Filter");
    const CimPath handlerPath = referenceIn(instance, "Handler");
    const Filter* const filter = findFilter(records, filterPath);
    if (filter == nullptr) refuseUnknown(filterPath);
    const Destination* const destination = findDestination(records, handlerPath);
    if (destination == nullptr) refuseUnknown(handlerPath);
    Subscription subscription = readSubscription(instance);
    subscription.filter = filter->name;
    subscription.destination = destination->key;
    subscription.creator = core::CallerScope::current().principal;
    CimPath path = pathOf(subscription, m_systemName);
    if (records.subscription(subscription.filter, subscription.destination) != nullptr) refuseSecond(path);
    requireRoom(records.subscriptions.size(), m_settings.most, "subscriptions");
    check(subscription);
    requireEvents(*filter, sources());
    subscription.tag = ++m_tags;
    records.subscriptions.push_back(std::move(subscription));
    return path;
}

CimPath Subscriptions::create(const InstanceValue& instance) {
    const std::string& className = instance.path.getClassName();
    const InstanceValue typed = typedInstance(instance, chainOf(className));
    const std::lock_guard changing(m_changes);
    Records changed = changeable();
    CimPath path;
    if (core::sameName(className, kFilter)) {
        path = createFilter(changed, typed);
    } else if (core::sameName(className, kSubscription)) {
        path = createSubscription(changed, typed);
    } else {
        path = createDestination(changed, typed);
    }
    publish(std::move(changed));
    return path;
}

void Subscriptions::modify(const InstanceValue& instance, const core::PropertyFilter& properties) {
    const InstanceValue current = get(instance.path);
    const std::string& className = current.path.getClassName();
    if (!core::sameName(className, kSubscription))
        throw CimError(CimStatus::NotSupported, "instances of " + className + " cannot be modified");
    const InstanceValue typed = typedInstance(instance, chainOf(className));
    const std::lock_guard changing(m_changes);
    Records changed = changeable();
    const Subscription* const found = findSubscription(changed, instance.path);
    if (found == nullptr) refuseUnknown(instance.path);
    Subscription& subscription =
        changed.subscriptions[static_cast<std::size_t>(found - changed.subscriptions.data())];
    change(subscription, typed, shown(subscription, changed), properties);
    publish(std::move(changed));
}

void Subscriptions::remove(const CimPath& path) {
    const std::lock_guard changing(m_changes);
    Records changed = changeable();
    const auto inUse = referring(path);
    if (!inUse.empty()) {
        throw CimError(CimStatus::Failed, core::shownPath(path) + " is referred to by " +
                                              core::shownPath(inUse.front().path) + "; delete that first");
    }
    const auto erase = [](auto& list, const auto* each) { list.erase(list.begin() + (each - list.data())); };
    if (const auto* filter = findFilter(changed, path)) {
        if (filter->isStatic)
            throw CimError(CimStatus::AccessDenied, core::shownPath(path) + " is the server's own");
        erase(changed.filters, filter);
    } else if (const auto* destination = findDestination(changed, path)) {
        erase(changed.destinations, destination);
    } else if (const auto* subscription = findSubscription(changed, path)) {
        erase(changed.subscriptions, subscription);
    } else {
        refuseUnknown(path);
    }
    publish(std::move(changed));
}

}  // namespace indications
