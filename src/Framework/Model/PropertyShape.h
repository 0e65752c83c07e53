// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstddef>
#include <memory>
#include <vector>

#include "Framework/Model/CimClassInfo.h"

namespace core {

class CimProperty;

/// Which of an instance's registered properties are served, as indices in the order of declaration: of every
/// name the last one, since that is the most derived.
struct PropertyShape {
    std::vector<std::size_t> served;
    std::vector<std::size_t> keys;  ///< those of the served ones that are keys
};

/// The shape of instances with these properties. Found once for all instances whose properties have the same
/// names and keys in the same order, and remembered. Thread-safe.
std::shared_ptr<const PropertyShape> shapeOf(const std::vector<CimProperty*>& properties);

/// Where the properties of each class of a chain end, as the constructors of an instance report it.
using DeclarationMarks = std::vector<std::pair<const CimClassInfo*, std::size_t>>;

/// Notes a report on the calling thread while a DeclarationRecorder lives there; else does nothing.
void recordDeclaration(const CimClassInfo& info, std::size_t propertyCount);

/// Collects the reports of the instances built on this thread while it lives.
class DeclarationRecorder {
  public:
    DeclarationRecorder();
    ~DeclarationRecorder();
    DeclarationRecorder(const DeclarationRecorder&) = delete;
    DeclarationRecorder& operator=(const DeclarationRecorder&) = delete;

    DeclarationMarks marks;

  private:
    DeclarationRecorder* m_outer;
};

}  // namespace core
