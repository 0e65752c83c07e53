// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <dlfcn.h>
#include <sys/wait.h>
#include <unistd.h>

#include "Cmpi/TestBroker.h"

namespace test {

/// The front as an object manager loads it; closed at the end of the scope.
struct LoadedFront {
    LoadedFront(const char* library, Dialect dialect)
        : broker(dialect), handle(dlopen(library, RTLD_GLOBAL | (broker.isSfcb ? RTLD_NOW : RTLD_LAZY))) {
        create();
    }
    LoadedFront(const LoadedFront&) = delete;
    ~LoadedFront() { unload(); }

    /// For every class again, as one of the managers does it.
    void create() {
        Call call(broker);
        create(call, "Quenx_Create_InstanceMI", instances);
        create(call, "Quenx_Create_AssociationMI", associations);
        create(call, "Quenx_Create_MethodMI", methods);
    }
    template <class MI>
    void create(Call& call, const char* name, MI*& made) const {
        using Create = MI* (*)(const cmpi::Broker*, const cmpi::Context*, cmpi::Status*);
        cmpi::Status status{};
        made = reinterpret_cast<Create>(dlsym(handle, name))(&broker.broker, call.context.as<cmpi::Context>(),
                                                             &status);
    }
    /// The codes of all these interfaces, in the manager's order, with a blank before each.
    std::string cleanup(bool isTerminating = false) const {
        const auto code = [&](auto* mi) { return clean(mi, isTerminating); };
        const std::string first = broker.isSfcb ? "" : code(methods);
        const std::string both = first + code(instances) + code(associations);
        return broker.isSfcb ? both + code(methods) : both;
    }
    template <class MI>
    std::string clean(MI* mi, bool isTerminating = false) const {
        Call call(broker);
        const auto answer = mi->ft->cleanup(mi, call.context.as<cmpi::Context>(), isTerminating ? 1 : 0);
        return " " + std::to_string(static_cast<int>(answer.rc));
    }
    void unload() {
        if (void* const closed = std::exchange(handle, nullptr)) dlclose(closed);
    }

    /// What the client gets; a failure as CimError. Thread-safe.
    Answers ask(const Request& request, const std::string& nameSpace = "root/cimv2") const {
        Call call(broker, request, nameSpace);
        return call.finish(send(call));
    }
    core::CimPath first(const char* className) const {
        return ask({"names", core::CimPath(className, {})}).paths.at(0);
    }
    /// What InstallFromURI answers.
    core::MethodResult install(const std::string& uri, const core::CimPath& port) const {
        using core::CimType;
        using core::CimValue;
        const Request request{"invoke",
                              first("Quenx_SoftwareInstallationService"),
                              {},
                              {},
                              "InstallFromURI",
                              {{"URI", CimValue::of(CimType::String, uri)},
                               {"Target", CimValue::of(CimType::Reference, port)},
                               {"InstallOptions", CimValue::arrayOf(CimType::Uint16, {std::uint64_t{5}})},
                               {"InstallOptionsValues", CimValue::arrayOf(CimType::String, {})}}};
        return ask(request).called;
    }
    /// One call of a function of an MI.
    cmpi::Status send(Call& call) const;

    TestBroker broker;
    void* handle;
    cmpi::InstanceMI* instances = nullptr;
    cmpi::AssociationMI* associations = nullptr;
    cmpi::MethodMI* methods = nullptr;
};

inline cmpi::Status LoadedFront::send(Call& call) const {
    using I = cmpi::InstanceMITable;
    using A = cmpi::AssociationMITable;
    const auto& [op, path, by, filter, method, arguments] = call.request;
    const auto on = [&](auto* mi, auto function, auto... rest) {
        return (mi->ft->*function)(mi, call.context.as<cmpi::Context>(), call.result.as<cmpi::Result>(),
                                   call.path.as<cmpi::ObjectPath>(), rest...);
    };
    std::vector<const char*> names;
    for (std::size_t i = 0; filter && i < filter->size(); ++i)
        names.push_back((*filter)[i].c_str());
    names.push_back(nullptr);
    const char** const list = filter ? names.data() : nullptr;
    if (op == "names") return on(instances, &I::enumerateInstanceNames);
    if (op == "instances") return on(instances, &I::enumerateInstances, list);
    if (op == "get") return on(instances, &I::getInstance, list);
    if (op == "query") return on(instances, &I::execQuery, "select * from Test_Gadget", "WQL");
    if (op == "create") return on(instances, &I::createInstance, nullptr);
    if (op == "modify") return on(instances, &I::modifyInstance, nullptr, list);
    if (op == "delete") return on(instances, &I::deleteInstance);
    if (op == "invoke")
        return on(methods, &cmpi::MethodMITable::invokeMethod, method.c_str(), call.in.as<cmpi::Args>(),
                  call.out.as<cmpi::Args>());
    // Null and empty are both used for what is not given.
    const auto orNull = [](const std::string& text) { return text.empty() ? nullptr : text.c_str(); };
    const char* const association = orNull(by.associationClass);
    const char* const result = by.resultClass.c_str();
    const char* const role = orNull(by.role);
    const char* const resultRole = by.resultRole.c_str();
    if (op == "associators")
        return on(associations, &A::associators, association, result, role, resultRole, list);
    if (op == "associatorNames")
        return on(associations, &A::associatorNames, association, result, role, resultRole);
    if (op == "references") return on(associations, &A::references, result, role, list);
    if (op == "referenceNames") return on(associations, &A::referenceNames, result, role);
    throw std::logic_error("no operation " + op);
}

/// Runs in a fork without an exec, as one manager's process is. Returns how it ended.
inline int asChild(const std::function<void()>& body) {
    if (const pid_t child = ::fork(); child != 0) {
        int status = -1;
        ::waitpid(child, &status, 0);
        return status;
    }
    ::alarm(60);
    body();
    std::exit(0);
}

}  // namespace test
