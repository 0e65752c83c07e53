// SPDX-License-Identifier: Apache-2.0
// Instances and their classes, and method calls. CimRequestsAssociations.cpp has the rest.
#include "Framework/Requests/CimRequests.h"

#include <algorithm>
#include <functional>
#include <map>
#include <utility>
#include <vector>

#include "Framework/Classes/InstanceList.h"
#include "Framework/Model/CimInstance.h"
#include "Framework/Model/CimPropertyList.h"
#include "Framework/Requests/AnswerMeter.h"
#include "Framework/Requests/DeniedUpdates.h"
#include "Framework/Requests/NotedCall.h"
#include "Framework/Requests/PolicyDecision.h"
#include "Framework/Requests/ServedClasses.h"
#include "Utils/Exception.h"

namespace core {

namespace {

/// The instances of an answer, told apart by their paths: two agents may serve the same one, or one class
/// list it twice.
class SeenInstances {
  public:
    /// False for one that was there already.
    bool insert(const CimInstance& instance) {
        if (m_places.size() <= 2 * m_count) grow();
        const Place place{instance.hashOfKeys(), &instance};
        Place& found = placeOf(place);
        if (found.instance != nullptr) return false;
        found = place;
        ++m_count;
        return true;
    }

  private:
    struct Place {
        std::size_t hash = 0;
        const CimInstance* instance = nullptr;
    };

    static std::string textOf(const CimInstance& instance) { return CimPath::of(instance).toString(); }

    /// Where that path is, or is to be.
    Place& placeOf(const Place& wanted) {
        for (std::size_t i = wanted.hash;; ++i) {
            Place& place = m_places[i & (m_places.size() - 1)];
            if (place.instance == nullptr) return place;
            // Texts are compared nearly never, since few others share a hash.
            if (place.hash == wanted.hash && textOf(*place.instance) == textOf(*wanted.instance))
                return place;
        }
    }
    void grow() {
        const std::vector<Place> old =
            std::exchange(m_places, std::vector<Place>(std::max(kFew, 4 * m_places.size())));
        for (const Place& each : old)
            if (each.instance != nullptr) placeOf(each) = each;
    }

    static constexpr std::size_t kFew = 16;

    // One table, since a node for each instance costs more than all else that is done here. Its size is a
    // power of two.
    std::vector<Place> m_places;
    std::size_t m_count = 0;
};

/// Calls the visitor once per path.
void visitInstances(const ServedClasses& classes, const std::string& className,
                    const std::function<void(CimInstance&)>& visit) {
    SeenInstances seen;
    for (const ServedClass* each : classes.derivedFrom(className)) {
        for (CimInstance* instance : InstanceRange(each->object->getInstances())) {
            if (seen.insert(*instance)) visit(*instance);
        }
    }
}

/// Hands the instance over as it is, or as a value where paths have to be completed with the namespace.
std::size_t handOver(CimInstance& instance, WantedProperties& wanted, const std::string& namespaceName,
                     InstanceSink& sink) {
    {
        const RecursiveLocker lock(instance.getMutex());
        const WantedProperties::Choice& choice = wanted.among(instance);
        if (!choice.hasReferences) return sink.take(InstanceCells{instance, choice.properties});
    }
    return sink.take(readInstance(instance, CimPath::of(instance), wanted, namespaceName));
}

/// The output parameter under which an instance handed back by a method is served.
constexpr std::string_view kJobParameter = "Job";

struct CallLists {
    CimPropertyList in;
    CimPropertyList out;
};

/// A value that the client gives for an output parameter goes to the method with the outputs: the method
/// decides what to do with it.
CallLists listsFor(const MethodDeclaration& method, const std::vector<Argument>& arguments) {
    CallLists lists;
    for (const ParameterDeclaration& parameter : method.parameters) {
        const Argument* given = findByName(arguments, parameter.name);
        const bool isOutput = parameter.direction == CimDirection::Out;
        // What is required and missing stays absent: the provider says so in its own words.
        if (given == nullptr && !isOutput && !parameter.optional) continue;
        CimPropertyList& list = isOutput ? lists.out : lists.in;
        list.add(parameter.name,
                 given == nullptr ? CimValue::null(parameter.type, parameter.isArray) : given->value);
    }
    return lists;
}

bool sameValues(const CimValue& left, const CimValue& right) {
    if (const CimScalar* scalar = left.scalar())
        return right.scalar() != nullptr && sameValue(*scalar, *right.scalar());
    const auto* elements = left.elements();
    const auto* others = right.elements();
    if (elements == nullptr || others == nullptr) return left.isNull() && right.isNull();
    return std::equal(elements->begin(), elements->end(), others->begin(), others->end(), sameValue);
}

/// What the method has put out: of its outputs, not those that still are what the client gave for them.
std::vector<Argument> outputsOf(const CallLists& lists, const std::vector<Argument>& arguments,
                                const CimInstance* handedBack, const std::string& namespaceName) {
    std::vector<Argument> outputs;
    for (const auto& property : lists.out.getProperties()) {
        if (sameName(property->getName(), kJobParameter)) continue;  // an instance, handed back
        CimValue value = property->getValue();
        const Argument* given = findByName(arguments, property->getName());
        if (given != nullptr && sameValues(given->value, value)) continue;
        if (!value.isNull()) outputs.push_back({property->getName(), std::move(value)});
    }
    if (handedBack != nullptr) {
        CimPath path = CimPath::of(*handedBack);
        path.completeNamespace(namespaceName);
        outputs.push_back(
            {std::string(kJobParameter), CimValue::of(CimType::Reference, CimScalar(std::move(path)))});
    }
    return outputs;
}

/// A method reports a wrong argument by an exception, anything else by its return value.
unsigned int call(CimInstance& instance, const std::string& method, CallLists& lists,
                  CimInstance*& handedBack) {
    try {
        return instance.invokeMethod(method, lists.in, lists.out, handedBack);
    } catch (const utils::EUnspecifiedError& refusal) {
        throw CimError(CimStatus::InvalidParameter, refusal.what());
    }
}

/// The decision of one who may call; one who may not is told of as well.
PolicyDecision requireLeave(const std::string& method, const std::vector<Argument>& arguments) {
    const NotedCall noted;
    try {
        return PolicyDecision();
    } catch (const CimError& denied) {
        tellOfDenied(method, arguments, noted.notes().reason, denied.what());
        throw;
    }
}

}  // namespace

CimRequests::CimRequests(std::string namespaceName) : m_namespace(std::move(namespaceName)) {}

std::vector<InstanceValue> CimRequests::enumerateInstances(const std::string& className,
                                                           const PropertyFilter& filter) {
    return answerRequest(m_namespace, [&](const ServedClasses& classes) {
        WantedProperties wanted(filter);
        std::vector<InstanceValue> result;
        visitInstances(classes, className, [&](CimInstance& instance) {
            AnswerMeter::append(result, readInstance(instance, CimPath::of(instance), wanted, m_namespace));
        });
        return result;
    });
}

void CimRequests::streamInstances(const std::string& className, const PropertyFilter& filter,
                                  InstanceSink& sink) {
    answerRequest(m_namespace, [&](const ServedClasses& classes) {
        WantedProperties wanted(filter);
        visitInstances(classes, className, [&](CimInstance& instance) {
            AnswerMeter::tell(handOver(instance, wanted, m_namespace, sink));
        });
    });
}

std::vector<CimPath> CimRequests::enumerateInstanceNames(const std::string& className) {
    return answerRequest(m_namespace, [&](const ServedClasses& classes) {
        std::vector<CimPath> result;
        visitInstances(classes, className, [&](CimInstance& instance) {
            CimPath path = CimPath::of(instance);
            path.completeNamespace(m_namespace);
            AnswerMeter::append(result, std::move(path));
        });
        return result;
    });
}

InstanceValue CimRequests::getInstance(const CimPath& path, const PropertyFilter& filter) {
    return answerRequest(m_namespace, [&](const ServedClasses& classes) {
        CimPath typed = classes.typed(path);
        CimInstance& instance = classes.requireInstance(typed);
        // Its own path: a client may have spelled names in another case.
        WantedProperties wanted(filter);
        return readInstance(instance, CimPath::of(instance), wanted, m_namespace);
    });
}

void CimRequests::streamInstance(const CimPath& path, const PropertyFilter& filter, InstanceSink& sink) {
    answerRequest(m_namespace, [&](const ServedClasses& classes) {
        CimPath typed = classes.typed(path);
        WantedProperties wanted(filter);
        AnswerMeter::tell(handOver(classes.requireInstance(typed), wanted, m_namespace, sink));
    });
}

void CimRequests::deleteInstance(const CimPath& path) {
    answerRequest(m_namespace, [&](const ServedClasses& classes) {
        const PolicyDecision decision;
        CimPath typed = classes.typed(path);
        bool isSupported = false;
        for (const ServedClass* each : classes.named(typed.getClassName())) {
            if (each->deleteInstance == nullptr) continue;
            isSupported = true;
            const int code = each->deleteInstance(*each->object, typed);
            if (code == 0) return;
            // Another agent that serves the class may have it.
            if (code == kDeleteNotFound) continue;
            throw CimError(CimStatus::Failed, "the deletion of " + typed.toString() + " ended with code " +
                                                  std::to_string(code));
        }
        // Of a class without deletion a client learns first whether the instance is there at all.
        if (isSupported) throw CimError(CimStatus::NotFound, shownPath(typed) + " names no instance");
        classes.requireInstance(typed);
        throw CimError(CimStatus::NotSupported,
                       "instances of " + typed.getClassName() + " cannot be deleted");
    });
}

MethodResult CimRequests::invokeMethod(const CimPath& path, const std::string& method,
                                       const std::vector<Argument>& arguments) {
    return answerRequest(m_namespace, [&](const ServedClasses& classes) -> MethodResult {
        // Before anything else: one who may not learns nothing of what there is to call.
        const PolicyDecision decision = requireLeave(method, arguments);
        const ClassChain chain = classes.chainOf(path.getClassName());
        // Not InvalidClass, which DSP0200 does not list for extrinsic methods.
        if (chain.empty()) {
            throw CimError(CimStatus::NotFound, "no class \"" + path.getClassName() + "\" is served");
        }
        const MethodDeclaration* declared = findMethod(chain, method);
        if (declared == nullptr) {
            throw CimError(CimStatus::MethodNotFound, chain.front()->name + " has no method " + method);
        }
        // No class here has static methods.
        if (!path.isInstancePath()) {
            throw CimError(CimStatus::MethodNotAvailable, declared->name + " is called on an instance");
        }
        CimPath typed = classes.typed(path);
        const std::vector<Argument> given = typedArguments(
            *declared, arguments, [&](const std::string& name) { return classes.chainOf(name); });
        CimInstance& instance = classes.requireInstance(typed);
        CallLists lists = listsFor(*declared, given);
        CimInstance* handedBack = nullptr;
        const unsigned int returnValue = call(instance, declared->name, lists, handedBack);
        return {returnValue, outputsOf(lists, given, handedBack, m_namespace), declared->returnType};
    });
}

ClassChain CimRequests::getClass(const std::string& className) {
    return ServedClasses(m_namespace).chainOf(className);
}

std::vector<ClassChain> CimRequests::enumerateClasses(const std::string& className, bool deep) {
    const ServedClasses classes(m_namespace);
    if (!className.empty()) classes.requireChain(className);
    // By name, since many served classes share their superclasses.
    std::map<std::string, ClassChain> found;
    for (const ClassChain* chain : classes.chains()) {
        for (auto first = chain->begin(); first != chain->end(); ++first) {
            ClassChain rest(first, chain->end());
            if (isBelow(rest, className, deep)) found.emplace((*first)->name, std::move(rest));
        }
    }
    std::vector<ClassChain> result;
    result.reserve(found.size());
    for (auto& [name, chain] : found)
        result.push_back(std::move(chain));
    return result;
}

}  // namespace core
