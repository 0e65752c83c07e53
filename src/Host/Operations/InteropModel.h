// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>
#include <vector>

#include "Framework/Model/ClassDeclaration.h"
#include "Framework/Requests/RequestValues.h"

namespace host {

/// What the host serves of itself in the interop namespaces: CIM_ObjectManager and one CIM_Namespace for each
/// namespace. Fixed when built; thread-safe.
class InteropModel {
  public:
    /// The names of all namespaces, and that of the machine.
    InteropModel(std::vector<std::string> namespaces, std::string systemName);

    /// Empty for a class that is not the host's own.
    core::ClassChain findClass(const std::string& className) const;
    /// All of them, superclasses included.
    const std::vector<core::ClassChain>& classes() const { return m_classes; }
    /// The instances, with paths in the given namespace.
    std::vector<core::InstanceValue> instances(const std::string& namespaceName) const;

  private:
    core::InstanceValue objectManager() const;
    core::InstanceValue namespaceInstance(const std::string& name) const;

    const std::vector<std::string> m_namespaces;
    const std::string m_systemName;
    const std::vector<core::ClassChain> m_classes;
};

}  // namespace host
