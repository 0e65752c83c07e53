// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <string_view>

#include "CimXml/Request.h"
#include "Framework/Requests/CimOperations.h"

namespace host {

enum class ParameterKind { ClassName, InstanceName, ObjectName, Boolean, Text, TextList, Number, Instance };

/// One parameter of an intrinsic operation (DSP0200 5.4.2).
struct ParameterSpec {
    std::string_view name;
    ParameterKind kind;
    bool required = false;
};

/// The parameters of a call, checked against what the operation takes. Looked up without regard to case; one
/// that is null is the same as one that is not there. Holds on to the call.
class Parameters {
  public:
    /// CimError (invalid parameter) for an unknown or repeated parameter, a value of another kind, or a
    /// required one that is missing.
    Parameters(const cimxml::IntrinsicCall& call, std::span<const ParameterSpec> allowed);

    bool flag(std::string_view name, bool otherwise) const;
    std::optional<std::uint32_t> number(std::string_view name) const;
    /// Empty when not given, here and in className().
    std::string text(std::string_view name) const;
    std::string className(std::string_view name) const;
    core::PropertyFilter list(std::string_view name) const;
    /// A path without keys when not given, or given as a class.
    core::CimPath path(std::string_view name) const;
    /// What describes an instance to be made; only for a required parameter.
    const cimxml::InstanceBody& instance(std::string_view name) const;
    bool isClassName(std::string_view name) const;
    bool isGiven(std::string_view name) const { return find(name) != nullptr; }

  private:
    const cimxml::ParameterValue* find(std::string_view name) const;

    const cimxml::IntrinsicCall& m_call;
};

}  // namespace host
