#pragma once

#include <string>
#include <vector>

#include "Framework/Classes/CimBroker.h"

namespace core {

/// One class of one agent.
struct ModelClass {
    CimAgent* agent;
    const ServedClass* served;
};

/// What is served at the moment, for the length of one request. The agents cannot leave meanwhile.
class ServedModel {
  public:
    explicit ServedModel(CimBroker& broker);

    /// The classes that are of this class: itself and its subclasses, by every agent. Empty for an unknown
    /// class and for one that is only a superclass of nothing.
    std::vector<ModelClass> derivedFrom(std::string_view className) const;
    /// The classes of exactly this name, one per agent that serves it.
    std::vector<ModelClass> named(std::string_view className) const;
    /// The associations among the classes; with a name only those derived from it.
    std::vector<ModelClass> associations(std::string_view className) const;
    const std::vector<ModelClass>& all() const { return m_classes; }

    /// CimError (invalid class) when no served class is of this class.
    void requireClass(std::string_view className) const;
    /// The chain of a served class or of a superclass of one; empty when unknown.
    ClassChain chainOf(std::string_view className) const;

  private:
    std::vector<AgentUse> m_uses;
    std::vector<ModelClass> m_classes;
};

}  // namespace core
