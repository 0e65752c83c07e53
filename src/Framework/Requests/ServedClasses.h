// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>
#include <vector>

#include "Framework/Classes/CimBroker.h"
#include "Framework/Classes/RequestScope.h"

namespace core {

/// What is served at the moment, for the length of one request: the agents cannot leave meanwhile, and the
/// instances that the request meets stay alive. Must outlive what a provider throws: the type of an exception
/// goes with its library. Used on the stack of one thread.
class ServedClasses {
  public:
    explicit ServedClasses(CimBroker& broker);

    /// The classes that are of this class: itself and its subclasses, by every agent; empty for one
    /// that is only mentioned. CimError (invalid class) when it is unknown.
    std::vector<const ServedClass*> derivedFrom(std::string_view className) const;
    /// The classes of exactly this name, one per agent that serves it.
    std::vector<const ServedClass*> named(std::string_view className) const;
    /// The associations among the classes; with a name only those derived from it.
    std::vector<const ServedClass*> associations(std::string_view className) const;
    const std::vector<const ServedClass*>& all() const { return m_classes; }

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
    const RequestScope m_scope;
    CimBroker& m_broker;
    std::vector<AgentUse> m_uses;
    std::vector<const ServedClass*> m_classes;
    std::vector<const ClassChain*> m_chains;
};

}  // namespace core
