// SPDX-License-Identifier: Apache-2.0
// Walking associations.
#include "Cmpi/EntryPoints.h"
#include "Cmpi/Request.h"
#include "Cmpi/Slots.h"
#include "Utils/Utils.h"

namespace cmpi {

namespace {

using core::AssociationFilter;

/// What narrows a walk, as the object manager says it: null or empty narrows nothing.
struct Narrowing {
    const char* associationClass;
    const char* resultClass;
    const char* role;
    const char* resultRole;
};

/// sfcb asks once for every association class that is registered, and says which one it is about only in what
/// the registration has as parameters. If each time all of them answered, clients would get every result as
/// often.
/// @param association  narrowed to that class; false when that one is not below it
bool narrowToRegistration(const Request& request, std::string& association) {
    const std::string parameters = request.contextEntry("sfcbProviderParameters");
    const std::string registered(utils::trimOf(parameters, " \t\r\n"));
    const core::ClassChain chain = request.operations().getClass(registered);
    if (chain.empty() || !core::isAssociation(chain)) return true;
    if (!association.empty() && !core::derivesFrom(chain, association)) return false;
    association = registered;
    return true;
}

/// Runs the walk where all the classes named are known here. The object manager asks every provider whose
/// associations might fit, and has looked at the names itself: who knows nothing of one has nothing to add.
/// @param association  where the filter names the association
template <class Body>
Status walk(const Sender& sender, const Narrowing& by, std::string AssociationFilter::*association,
            const Body& body) noexcept {
    return answer(sender, [&](Request& request) {
        AssociationFilter filter{textOf(by.associationClass), textOf(by.resultClass), textOf(by.role),
                                 textOf(by.resultRole)};
        const auto isKnown = [&](const std::string& name) { return name.empty() || request.isOurs(name); };
        if (request.isOurs() && isKnown(filter.associationClass) && isKnown(filter.resultClass) &&
            narrowToRegistration(request, filter.*association))
            body(request, filter);
    });
}

void giveAll(Request& request, const std::vector<core::InstanceValue>& instances, const char** properties) {
    const core::PropertyFilter filter = filterFrom(properties);
    for (const core::InstanceValue& each : instances)
        request.give(each, filter);
}

void giveAll(Request& request, const std::vector<core::CimPath>& paths) {
    for (const core::CimPath& each : paths)
        request.give(each);
}

Status associators(AssociationMI*, const Context* context, const Result* result, const ObjectPath* object,
                   const char* associationClass, const char* resultClass, const char* role,
                   const char* resultRole, const char** properties) {
    return walk({Interface::Association, context, result, object},
                {associationClass, resultClass, role, resultRole}, &AssociationFilter::associationClass,
                [properties](Request& request, const AssociationFilter& by) {
                    giveAll(request, request.operations().associators(request.object(), by), properties);
                });
}

Status associatorNames(AssociationMI*, const Context* context, const Result* result, const ObjectPath* object,
                       const char* associationClass, const char* resultClass, const char* role,
                       const char* resultRole) {
    return walk({Interface::Association, context, result, object},
                {associationClass, resultClass, role, resultRole}, &AssociationFilter::associationClass,
                [](Request& request, const AssociationFilter& by) {
                    giveAll(request, request.operations().associatorNames(request.object(), by));
                });
}

Status references(AssociationMI*, const Context* context, const Result* result, const ObjectPath* object,
                  const char* resultClass, const char* role, const char** properties) {
    return walk({Interface::Association, context, result, object}, {nullptr, resultClass, role, nullptr},
                &AssociationFilter::resultClass, [properties](Request& request, const AssociationFilter& by) {
                    giveAll(request, request.operations().references(request.object(), by), properties);
                });
}

Status referenceNames(AssociationMI*, const Context* context, const Result* result, const ObjectPath* object,
                      const char* resultClass, const char* role) {
    return walk({Interface::Association, context, result, object}, {nullptr, resultClass, role, nullptr},
                &AssociationFilter::resultClass, [](Request& request, const AssociationFilter& by) {
                    giveAll(request, request.operations().referenceNames(request.object(), by));
                });
}

Status cleanup(AssociationMI*, const Context*, Boolean) {
    return cleanUp(Interface::Association);
}

constexpr AssociationMITable kTable{kLevel,      kLevel,          kProviderName, cleanup,
                                    associators, associatorNames, references,    referenceNames};

AssociationMI theInterface{{nullptr, &kTable}};

}  // namespace

}  // namespace cmpi

cmpi::AssociationMI* Quenx_Create_AssociationMI(const cmpi::Broker* broker, const cmpi::Context*,
                                                cmpi::Status* status) {
    return cmpi::create(cmpi::Interface::Association, cmpi::theInterface, broker, status);
}
