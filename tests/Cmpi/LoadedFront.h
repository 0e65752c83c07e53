// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <dlfcn.h>

#include "Cmpi/TestBroker.h"

namespace test {

/// A request of a client, of any kind.
enum class Op {
    Names,
    Instances,
    Get,
    Query,
    Create,
    Modify,
    Delete,
    Invoke,
    Associators,
    AssociatorNames,
    References,
    ReferenceNames
};
struct Request {
    Op op = Op::Get;
    core::CimPath path = {};
    core::AssociationFilter by = {};
    core::PropertyFilter filter = {};
    std::string method = {};
    std::vector<core::Argument> arguments = {};
};

/// The objects of a call, which a test may change.
struct Sent {
    Sent(Call& its, const Request& asked) : call(its), request(asked) {}
    Call& call;
    const Request& request;
    Node& path = call.path(request.path);
    Node& in = call.arguments(request.arguments);
    Node& out = call.arguments({});
};

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
        const Call call(broker);
        create(call, "Quenx_Create_InstanceMI", instances);
        create(call, "Quenx_Create_AssociationMI", associations);
        create(call, "Quenx_Create_MethodMI", methods);
    }
    template <class MI>
    void create(const Call& call, const char* name, MI*& made) const {
        using Create = MI* (*)(const cmpi::Broker*, const cmpi::Context*, cmpi::Status*);
        cmpi::Status status{};
        made = reinterpret_cast<Create>(dlsym(handle, name))(&broker.broker, call.context, &status);
    }
    /// The codes of all interfaces, in the manager's order, with a blank before each.
    std::string cleanup(bool isTerminating = false) const {
        const auto code = [&](auto* mi) { return clean(mi, isTerminating); };
        const std::string first = broker.isSfcb ? "" : code(methods);
        const std::string both = first + code(instances) + code(associations);
        return broker.isSfcb ? both + code(methods) : both;
    }
    template <class MI>
    std::string clean(MI* mi, bool isTerminating = false) const {
        const Call call(broker);
        return " " +
               std::to_string(static_cast<int>(mi->ft->cleanup(mi, call.context, isTerminating ? 1 : 0).rc));
    }
    void unload() {
        if (void* const closed = std::exchange(handle, nullptr)) dlclose(closed);
    }

    /// What the client gets; a failure as CimError. Thread-safe.
    Answers ask(const Request& request, const std::string& nameSpace = "root/cimv2") const {
        Call call(broker, nameSpace);
        Sent sent(call, request);
        Answers answers = call.finish(send(sent));
        for (const Entry& output : sent.out.entries)
            answers.called.outputs.push_back({output.name, output.value});
        return answers;
    }
    core::CimPath first(const char* className) const {
        return ask({Op::Names, core::CimPath(className, {})}).paths.at(0);
    }
    /// One call of a function of an MI.
    cmpi::Status send(Sent& sent) const;

    TestBroker broker;
    void* handle;
    cmpi::InstanceMI* instances = nullptr;
    cmpi::AssociationMI* associations = nullptr;
    cmpi::MethodMI* methods = nullptr;
};

inline cmpi::Status LoadedFront::send(Sent& sent) const {
    using I = cmpi::InstanceMITable;
    using A = cmpi::AssociationMITable;
    const Op op = sent.request.op;
    const auto on = [&](auto* mi, auto function, auto... rest) {
        const auto* path = sent.path.as<cmpi::ObjectPath>();
        return (mi->ft->*function)(mi, sent.call.context, sent.call.result, path, rest...);
    };
    std::vector<const char*> names;
    for (const std::string& name : sent.request.filter.value_or(std::vector<std::string>{}))
        names.push_back(sent.call.make(nullptr, name).text.c_str());
    names.push_back(nullptr);
    const char** const list = sent.request.filter ? names.data() : nullptr;
    if (op == Op::Names) return on(instances, &I::enumerateInstanceNames);
    if (op == Op::Instances) return on(instances, &I::enumerateInstances, list);
    if (op == Op::Get) return on(instances, &I::getInstance, list);
    if (op == Op::Query) return on(instances, &I::execQuery, "select * from Test_Gadget", "WQL");
    if (op == Op::Create) return on(instances, &I::createInstance, nullptr);
    if (op == Op::Modify) return on(instances, &I::modifyInstance, nullptr, list);
    if (op == Op::Delete) return on(instances, &I::deleteInstance);
    if (op == Op::Invoke)
        return on(methods, &cmpi::MethodMITable::invokeMethod, sent.request.method.c_str(),
                  sent.in.as<cmpi::Args>(), sent.out.as<cmpi::Args>());
    // Null and empty are both used for what is not given.
    const auto orNull = [](const std::string& text) { return text.empty() ? nullptr : text.c_str(); };
    const core::AssociationFilter& by = sent.request.by;
    const char* const association = orNull(by.associationClass);
    const char* const result = by.resultClass.c_str();
    const char* const role = orNull(by.role);
    const char* const resultRole = by.resultRole.c_str();
    if (op == Op::Associators)
        return on(associations, &A::associators, association, result, role, resultRole, list);
    if (op == Op::AssociatorNames)
        return on(associations, &A::associatorNames, association, result, role, resultRole);
    if (op == Op::References) return on(associations, &A::references, result, role, list);
    return on(associations, &A::referenceNames, result, role);
}

}  // namespace test
