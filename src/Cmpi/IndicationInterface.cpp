// SPDX-License-Identifier: Apache-2.0
// Indications: the object manager says whether somebody listens, and delivers what it is given.
#include "Cmpi/EntryPoints.h"
#include "Cmpi/Listening.h"
#include "Cmpi/Request.h"
#include "Cmpi/Slots.h"

namespace cmpi {

namespace {

/// The path tells the namespace alone: its class may be that of the indications, or of what they are about.
FilterPlace placeOf(const char* className, const ObjectPath* path) {
    return {textOf(call(path, &ObjectPathTable::getNameSpace, nullptr)), textOf(className)};
}

template <class Body>
Status indicationStatus(const Context* context, const Body& body) noexcept {
    return statusOf({Interface::Indication, context, nullptr, nullptr}, std::cref(body));
}

/// Who may listen is decided by the object manager, as who may read.
Status authorizeFilter(IndicationMI*, const Context*, const SelectExp*, const char*, const ObjectPath*,
                       const char*) {
    return {ReturnCode::Ok, nullptr};
}

/// Never: the providers tell by themselves. Some object managers pass one argument more, so none is looked
/// at.
Status mustPoll(IndicationMI*, const Context*, const SelectExp*, const char*, const ObjectPath*) {
    return {ReturnCode::NotSupported, nullptr};
}

Status activateFilter(IndicationMI*, const Context* context, const SelectExp*, const char* className,
                      const ObjectPath* path, Boolean) {
    return indicationStatus(context, [=] {
        const Front::Use use(Interface::Indication);
        Listening::theOne().activate(context, placeOf(className, path));
    });
}

Status deActivateFilter(IndicationMI*, const Context* context, const SelectExp*, const char* className,
                        const ObjectPath* path, Boolean isLast) {
    return indicationStatus(context,
                            [=] { Listening::theOne().deactivate(placeOf(className, path), isLast != 0); });
}

Status enableIndications(IndicationMI*, const Context* context) {
    return indicationStatus(context, [=] {
        const Front::Use use(Interface::Indication);
        Listening::theOne().enable(context);
    });
}

Status disableIndications(IndicationMI*, const Context* context) {
    return indicationStatus(context, [] { Listening::theOne().disable(); });
}

Status cleanup(IndicationMI*, const Context* context, Boolean isTerminating) {
    // The object manager may be gone when the last interface has been asked, whatever the answers were.
    if (isTerminating != 0) indicationStatus(context, [] { Listening::theOne().end(); });
    return cleanUp(Interface::Indication);
}

constexpr IndicationMITable kTable{
    kLevel,   kLevel,         kProviderName,    cleanup,           authorizeFilter,
    mustPoll, activateFilter, deActivateFilter, enableIndications, disableIndications};

IndicationMI theInterface{{nullptr, &kTable}};

}  // namespace

}  // namespace cmpi

cmpi::IndicationMI* Quenx_Create_IndicationMI(const cmpi::Broker* broker, const cmpi::Context*,
                                              cmpi::Status* status) {
    return cmpi::create(cmpi::Interface::Indication, cmpi::theInterface, broker, status);
}
