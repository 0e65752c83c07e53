// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>

#include "Cmpi/Cmpi.h"
#include "Framework/Model/CimError.h"

/// Calls into the object manager. Real ones leave slots out, state levels that they do not have, and hand
/// over null where an object should be, so nothing is called before it has been looked at.
namespace cmpi {

/// What stands for the answer of a slot that is not there: a null pointer, 0, "not found", "not supported".
template <class R>
constexpr R missing() {
    return R{};
}
template <>
constexpr Data missing() {
    return {kNull, kNullValue | kNotFound, {}};
}
template <>
constexpr Status missing() {
    return {ReturnCode::NotSupported, nullptr};
}

/// Calls a slot of the object's own table.
template <class Object, class Table, class R, class Self, class... Parameters>
R call(Object* object, R (*Table::*slot)(Self, Parameters...),
       std::type_identity_t<Parameters>... arguments) {
    if (object == nullptr || object->ft == nullptr || object->ft->*slot == nullptr) return missing<R>();
    return (object->ft->*slot)(object, arguments...);
}

/// Calls a slot whose answer would be taken for a value where there is none. Throws core::CimError there.
template <class Object, class Table, class R, class Self>
R read(Object* object, R (*Table::*slot)(Self, Status*)) {
    Status status{};
    const bool isThere = object != nullptr && object->ft != nullptr && object->ft->*slot != nullptr;
    const R answer = isThere ? (object->ft->*slot)(object, &status) : R{};
    if (isThere && status.rc == ReturnCode::Ok) return answer;
    throw core::CimError(core::CimStatus::Failed, "the object manager does not tell a value that it gave");
}

/// Calls a slot of one of the broker's tables.
template <class Table, class R, class... Parameters>
R call(const Broker& broker, const Table* table, R (*Table::*slot)(const Broker*, Parameters...),
       std::type_identity_t<Parameters>... arguments) {
    if (table == nullptr || table->*slot == nullptr) return missing<R>();
    return (table->*slot)(&broker, arguments...);
}

/// True for a value that can be looked at: neither null nor missing nor bad, however that is said.
inline bool isGood(const Data& data) {
    return (data.state & (kNullValue | kNotFound | kBadValue)) == 0;
}

/// The object's text; empty where there is none.
inline std::string textOf(const String* text) {
    const char* characters = call(text, &StringTable::getCharPtr, nullptr);
    return characters == nullptr ? "" : characters;
}
inline std::string textOf(const char* text) {
    return text == nullptr ? "" : text;
}

/// What the object manager was to make. Throws core::CimError where it did not.
template <class Object>
Object* made(Object* object, const char* what) {
    if (object != nullptr) return object;
    throw core::CimError(core::CimStatus::Failed, std::string("the object manager could not make ") + what);
}
/// Throws core::CimError unless the object manager has taken it.
inline void requireTaken(Status status, const char* what) {
    if (status.rc == ReturnCode::Ok) return;
    throw core::CimError(core::CimStatus::Failed, std::string("the object manager did not take ") + what +
                                                      " (code " +
                                                      std::to_string(static_cast<int>(status.rc)) + ")");
}

/// A string of the object manager; null where it cannot be had.
inline String* newString(const Broker& broker, const std::string& text) {
    return call(broker, broker.eft, &BrokerEncTable::newString, text.c_str(), nullptr);
}

}  // namespace cmpi
