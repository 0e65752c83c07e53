// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <functional>
#include <string>

#include "Cmpi/Front.h"
#include "Cmpi/Values.h"
#include "Framework/Requests/Caller.h"
#include "Framework/Requests/CimOperations.h"

namespace cmpi {

/// The arguments that functions of an MI take. Any may be null.
struct Sender {
    Interface interface;
    const Context* context;
    const Result* result;
    const ObjectPath* object;
};

/// One request of the object manager, from its arguments to its results. Used on the stack of its thread. The
/// functions throw core::CimError.
class Request {
  public:
    explicit Request(const Sender& sender);
    Request(const Request&) = delete;
    Request& operator=(const Request&) = delete;

    core::CimOperations& operations() const { return m_use.operations(); }
    const Place& place() const { return m_place; }
    /// What it is about; without a namespace, which is that of the request.
    const core::CimPath& object() const { return m_object; }
    /// Whether the class is known here. Object managers ask every provider that may know something.
    bool isOurs() const { return isOurs(m_object.getClassName()); }
    bool isOurs(const std::string& className) const { return !operations().getClass(className).empty(); }
    /// A text that the object manager tells of the request; empty where it does not.
    std::string contextEntry(const char* name) const;

    /// Results, any number of them.
    void give(const core::CimPath& path);
    /// @param filter  the client's; keys are given all the same, since some object managers look for them
    void give(const core::InstanceValue& instance, const core::PropertyFilter& filter);
    void give(core::CimType type, const core::CimScalar& value);

    /// Carries out what changes something, and leaves a line in the audit trail, however it ends.
    /// @param work  returns the outcome for the line
    void audited(const std::string& operation, const std::vector<core::Argument>& arguments,
                 const std::function<std::string()>& work) const;

  private:
    core::Caller caller() const;

    const Sender& m_sender;
    const Front::Use m_use;
    Place m_place;
    const core::CallerScope m_scope;
    core::CimPath m_object;
};

/// A list of names as the functions take them: null for all properties.
core::PropertyFilter filterFrom(const char** names);

/// Runs the body and turns its end, every exception included, into a status with its text, and into a
/// CIM_Error where the object manager takes one. The thread cannot be cancelled meanwhile.
Status statusOf(const Sender& sender, const std::function<void()>& body) noexcept;

/// The same for a body that gives results, whose end is told.
Status answerWith(const Sender& sender, const std::function<void(Request&)>& body) noexcept;

/// The same for any such body; by reference, since a copy could find no memory before anything is caught.
template <class Body>
Status answer(const Sender& sender, const Body& body) noexcept {
    return answerWith(sender, std::cref(body));
}

}  // namespace cmpi
