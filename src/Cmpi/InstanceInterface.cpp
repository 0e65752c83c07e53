// SPDX-License-Identifier: Apache-2.0
// Instances. LocalOnly, DeepInheritance and the like are the object manager's affair.
#include "Cmpi/EntryPoints.h"
#include "Cmpi/Request.h"

namespace cmpi {

namespace {

using core::CimError;
using core::CimStatus;

template <class Body>
Status instanceAnswer(const Context* context, const Result* result, const ObjectPath* object,
                      const Body& body) noexcept {
    return answer({Interface::Instance, context, result, object}, body);
}

/// The object manager asks for each subclass by itself, so those are left out.
bool isAskedFor(const Request& request, const core::CimPath& path) {
    return core::sameName(path.getClassName(), request.object().getClassName());
}

Status enumerateInstanceNames(InstanceMI*, const Context* context, const Result* result,
                              const ObjectPath* object) {
    return instanceAnswer(context, result, object, [](Request& request) {
        if (!request.isOurs()) return;
        for (const core::CimPath& path :
             request.operations().enumerateInstanceNames(request.object().getClassName())) {
            if (isAskedFor(request, path)) request.give(path);
        }
    });
}

Status enumerateInstances(InstanceMI*, const Context* context, const Result* result, const ObjectPath* object,
                          const char** properties) {
    return instanceAnswer(context, result, object, [properties](Request& request) {
        if (!request.isOurs()) return;
        const core::PropertyFilter filter = filterFrom(properties);
        for (const core::InstanceValue& each :
             request.operations().enumerateInstances(request.object().getClassName())) {
            if (isAskedFor(request, each.path)) request.give(each, filter);
        }
    });
}

Status getInstance(InstanceMI*, const Context* context, const Result* result, const ObjectPath* object,
                   const char** properties) {
    return instanceAnswer(context, result, object, [properties](Request& request) {
        request.give(request.operations().getInstance(request.object()), filterFrom(properties));
    });
}

// Clients cannot create or modify anything here. One that is wrong about the class or the instance, too,
// hears that first.

Status createInstance(InstanceMI*, const Context* context, const Result* result, const ObjectPath* object,
                      const Instance*) {
    return instanceAnswer(context, result, object, [](Request& request) {
        request.audited("CreateInstance", {}, [&request]() -> std::string {
            const std::string& name = request.object().getClassName();
            if (!request.isOurs())
                throw CimError(CimStatus::InvalidClass, "no class \"" + name + "\" is served");
            throw CimError(CimStatus::NotSupported, "instances of " + name + " cannot be created");
        });
    });
}

Status modifyInstance(InstanceMI*, const Context* context, const Result* result, const ObjectPath* object,
                      const Instance*, const char**) {
    return instanceAnswer(context, result, object, [](Request& request) {
        request.audited("ModifyInstance", {}, [&request]() -> std::string {
            request.operations().getInstance(request.object(), std::vector<std::string>());
            throw CimError(CimStatus::NotSupported,
                           "instances of " + request.object().getClassName() + " cannot be modified");
        });
    });
}

Status deleteInstance(InstanceMI*, const Context* context, const Result* result, const ObjectPath* object) {
    return instanceAnswer(context, result, object, [](Request& request) {
        request.audited("DeleteInstance", {}, [&request] {
            request.operations().deleteInstance(request.object());
            return std::string("done");
        });
    });
}

Status execQuery(InstanceMI*, const Context* context, const Result* result, const ObjectPath* object,
                 const char*, const char*) {
    return instanceAnswer(context, result, object, [](Request&) {
        throw CimError(CimStatus::NotSupported, "queries are not supported");
    });
}

Status cleanup(InstanceMI*, const Context*, Boolean) {
    return cleanUp(Interface::Instance);
}

constexpr InstanceMITable kTable{kLevel,
                                 kLevel,
                                 kProviderName,
                                 cleanup,
                                 enumerateInstanceNames,
                                 enumerateInstances,
                                 getInstance,
                                 createInstance,
                                 modifyInstance,
                                 deleteInstance,
                                 execQuery};

InstanceMI theInterface{{nullptr, &kTable}};

}  // namespace

}  // namespace cmpi

cmpi::InstanceMI* Quenx_Create_InstanceMI(const cmpi::Broker* broker, const cmpi::Context*,
                                          cmpi::Status* status) {
    return cmpi::create(cmpi::Interface::Instance, cmpi::theInterface, broker, status);
}
