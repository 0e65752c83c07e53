// SPDX-License-Identifier: Apache-2.0
#include "Indications/Subscriptions/Classes.h"

namespace indications {

namespace {

using core::CimType;
using core::CimValue;
using core::ClassDeclaration;
using core::PropertyDeclaration;
using Properties = std::vector<PropertyDeclaration>;

PropertyDeclaration property(const char* name, CimType type, bool isArray = false) {
    return {.name = name, .type = type, .isArray = isArray, .isKey = false};
}
PropertyDeclaration text(const char* name) {
    return property(name, CimType::String);
}
PropertyDeclaration flag(const char* name) {
    return property(name, CimType::Boolean);
}
PropertyDeclaration key(const char* name) {
    return {.name = name, .type = CimType::String, .isArray = false, .isKey = true};
}
PropertyDeclaration referenceKey(const char* name, const char* to) {
    return {.name = name, .type = CimType::Reference, .isArray = false, .isKey = true, .referenceClass = to};
}
core::Qualifier yes(const char* name) {
    return {name, CimValue::of(CimType::Boolean, true)};
}
PropertyDeclaration object(const char* name) {
    PropertyDeclaration made = text(name);
    made.qualifiers = {yes("EmbeddedObject")};
    return made;
}

ClassDeclaration declare(const char* name, const char* superclass, Properties properties = {}) {
    return {name, superclass, false, std::move(properties), {}};
}
ClassDeclaration abstract(ClassDeclaration declaration) {
    declaration.qualifiers.push_back(yes("Abstract"));
    return declaration;
}

/// The four keys of what belongs to a system, and others.
Properties withKeys(Properties others) {
    others.insert(others.begin(),
                  {key("SystemCreationClassName"), key("SystemName"), key("CreationClassName"), key("Name")});
    return others;
}

std::vector<ClassDeclaration> ofIndications() {
    std::vector<ClassDeclaration> all{
        abstract(declare("CIM_Indication", "",
                         {text("IndicationIdentifier"), property("IndicationTime", CimType::Datetime),
                          text("IndicationFilterName"), text("SequenceContext"),
                          property("SequenceNumber", CimType::Sint64)})),
        abstract(
            declare("CIM_InstIndication", "CIM_Indication",
                    {object("SourceInstance"), text("SourceInstanceModelPath"), text("SourceInstanceHost")})),
        declare("CIM_InstCreation", "CIM_InstIndication"),
        declare("CIM_InstModification", "CIM_InstIndication", {object("PreviousInstance")}),
        declare("CIM_InstDeletion", "CIM_InstIndication")};
    all.front().qualifiers.push_back(yes("Indication"));
    return all;
}

std::vector<ClassDeclaration> ofService() {
    return {declare(kService, "CIM_Service",
                    {flag("FilterCreationEnabled"), property("DeliveryRetryAttempts", CimType::Uint16),
                     property("DeliveryRetryInterval", CimType::Uint32),
                     property("SubscriptionRemovalAction", CimType::Uint16),
                     property("SubscriptionRemovalTimeInterval", CimType::Uint32)}),
            abstract(declare("CIM_Capabilities", "CIM_ManagedElement", {key("InstanceID")})),
            declare(kCapabilities, "CIM_Capabilities",
                    {flag("FilterCreationEnabledIsSettable"), flag("DeliveryRetryAttemptsIsSettable"),
                     flag("DeliveryRetryIntervalIsSettable"), flag("SubscriptionRemovalActionIsSettable"),
                     flag("SubscriptionRemovalTimeIntervalIsSettable"),
                     property("MaxListenerDestinations", CimType::Uint16),
                     property("MaxActiveSubscriptions", CimType::Uint16), flag("SubscriptionsPersisted")})};
}

std::vector<ClassDeclaration> ofSubscriptions() {
    std::vector<ClassDeclaration> all{
        declare(kFilter, "CIM_ManagedElement",
                withKeys({text("SourceNamespace"), property("SourceNamespaces", CimType::String, true),
                          text("Query"), text("QueryLanguage"), flag("IndividualSubscriptionSupported")})),
        abstract(declare("CIM_ListenerDestination", "CIM_ManagedElement",
                         withKeys({property("PersistenceType", CimType::Uint16), text("Destination"),
                                   property("Protocol", CimType::Uint16)}))),
        declare(kDestination, "CIM_ListenerDestination"),
        abstract(declare("CIM_IndicationHandler", "CIM_ListenerDestination")),
        declare(kHandler, "CIM_IndicationHandler"),
        abstract(declare(
            "CIM_AbstractIndicationSubscription", "",
            {referenceKey("Filter", "CIM_ManagedElement"), referenceKey("Handler", "CIM_ListenerDestination"),
             property("OnFatalErrorPolicy", CimType::Uint16),
             property("RepeatNotificationPolicy", CimType::Uint16),
             property("SubscriptionState", CimType::Uint16),
             property("TimeOfLastStateChange", CimType::Datetime),
             property("SubscriptionDuration", CimType::Uint64),
             property("SubscriptionStartTime", CimType::Datetime),
             property("SubscriptionTimeRemaining", CimType::Uint64), text("SubscriptionInfo")})),
        declare(kSubscription, "CIM_AbstractIndicationSubscription", {referenceKey("Filter", kFilter)})};
    for (std::size_t i = all.size() - 2; i < all.size(); ++i)
        all[i].isAssociation = true;
    return all;
}

}  // namespace

std::vector<ClassDeclaration> subscriptionClasses() {
    std::vector<ClassDeclaration> all = ofService();
    for (auto* part : {ofSubscriptions, ofIndications}) {
        for (ClassDeclaration& each : part())
            all.push_back(std::move(each));
    }
    return all;
}

const std::vector<core::ClassChain>& indicationClasses() {
    static const std::vector<core::ClassChain> kChains = core::chainsOf(ofIndications());
    return kChains;
}

}  // namespace indications
