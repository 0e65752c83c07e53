// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string_view>
#include <vector>

#include "Framework/Classes/CimBroker.h"
#include "Framework/Classes/RequestScope.h"
#include "Framework/Model/CimError.h"

namespace core {

/// What is served at the moment, for the length of one request: the agents cannot leave meanwhile, and the
/// instances that the request meets stay alive. Used on the stack of one thread.
class ServedClasses {
  public:
    /// @param servedNamespace  in which paths name something; has to outlive the object
    explicit ServedClasses(const std::string& servedNamespace);

    /// The classes that are of this class: itself and its subclasses, by every agent; empty for one
    /// that is only mentioned. CimError (invalid class) when it is unknown.
    std::vector<const ServedClass*> derivedFrom(std::string_view className) const;
    /// The classes of exactly this name, one per agent that serves it.
    std::vector<const ServedClass*> named(std::string_view className) const;
    /// The associations among the classes; with a name only those derived from it.
    std::vector<const ServedClass*> associations(std::string_view className) const;

    /// The chains of the served classes and of those that they mention.
    const std::vector<const ClassChain*>& chains() const { return m_chains; }
    /// The chain of such a class or of a superclass of one; empty when unknown.
    ClassChain chainOf(std::string_view className) const;
    /// The same; CimError (invalid class) when unknown.
    ClassChain requireChain(std::string_view className) const;

    /// The path with its keys as the class declares them; see typedPath().
    CimPath typed(const CimPath& path) const;
    /// The instance that a typed path names. CimError (not found) when there is none.
    CimInstance& requireInstance(CimPath& path) const;

  private:
    template <class Predicate>
    std::vector<const ServedClass*> select(Predicate&& isSelected) const;

    const RequestScope m_scope;
    std::vector<const ServedClass*> m_classes;
    std::vector<const ClassChain*> m_chains;
};

/// Runs the body of a request on what is served; it fails with CimError only.
/// @param servedNamespace  in which paths name something
template <class Body>
auto answerRequest(const std::string& servedNamespace, Body&& body) {
    // Declared first: it keeps the provider's library, and with it the type of what it throws, loaded until
    // the exception is converted.
    const ServedClasses classes(servedNamespace);
    try {
        return body(classes);
    } catch (...) {
        rethrowAsCimError();
    }
}

}  // namespace core
