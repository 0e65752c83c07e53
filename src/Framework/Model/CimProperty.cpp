// SPDX-License-Identifier: Apache-2.0
#include "Framework/Model/CimProperty.h"

#include <algorithm>
#include <type_traits>
#include <utility>

#include "Framework/Model/CimError.h"
#include "Framework/Model/CimInstance.h"

namespace core {

namespace {

std::string typeText(CimType type, bool isArray) {
    return std::string(typeName(type)) + (isArray ? "[]" : "");
}

[[noreturn]] void refuseType(const CimProperty& property, CimType type, const CimValue& value) {
    throw CimError(CimStatus::TypeMismatch, std::string(property.getName()) + " takes a value of type " +
                                                typeText(type, property.isArray()) + ", not of type " +
                                                typeText(value.type, value.isArray));
}

/// The value with every element held as the type wants it; CimError where one does not fit.
CimValue converted(const CimProperty& property, CimType type, CimValue value) {
    if (value.isArray != property.isArray()) refuseType(property, type, value);
    value.forEach([&](CimScalar& scalar) {
        auto held = convertScalar(type, scalar);
        if (!held) refuseType(property, type, value);
        scalar = std::move(*held);
    });
    value.type = type;
    return value;
}

/// The text of a requested property; empty when it is null.
std::string requestedText(CimProperty* requested) {
    const auto* text = dynamic_cast<const CimPropertyString*>(requested);
    return text == nullptr ? std::string() : text->get();
}

[[noreturn]] void refuse(const CimProperty* property, std::size_t length, const char* relation,
                         std::size_t bound) {
    throw CimError(CimStatus::InvalidParameter, std::string(property->getName()) + " would have " +
                                                    std::to_string(length) + " characters; it takes " +
                                                    relation + " " + std::to_string(bound));
}

/// How a property's C++ type is held in a CimScalar.
template <class T>
using Held = std::conditional_t<!std::is_integral_v<T> || std::is_same_v<T, bool>, T,
                                std::conditional_t<std::is_signed_v<T>, std::int64_t, std::uint64_t>>;

template <class T>
CimCell seen(const T& value) {
    if constexpr (std::is_same_v<T, std::string>) {
        return std::string_view(value);
    } else {
        return static_cast<Held<T>>(value);
    }
}

template <class T>
T heldIn(const CimScalar& scalar) {
    return static_cast<T>(std::get<Held<T>>(scalar));
}

/// What a null property gives. A default-built Time is now, which none should show.
template <class T>
T unset() {
    if constexpr (std::is_same_v<T, utils::Time>) {
        return utils::Time(0ULL);
    } else {
        return T();
    }
}

}  // namespace

void CimProperty::Listener::onPropertyModify(CimProperty*, CimProperty*) {}
void CimProperty::Listener::onPropertyVerify(CimProperty*, CimProperty*) {}
CimProperty::Listener::~Listener() = default;

std::unique_lock<RecursiveMutex> CimProperty::lockOwner() const {
    // An argument of a method has no owner, and belongs to one thread.
    return m_owner == nullptr ? std::unique_lock<RecursiveMutex>() : std::unique_lock(m_owner->getMutex());
}

CimProperty::CimProperty(const char* name, CimInstance* owner, CimType type, bool isArray)
    : m_array(isArray), m_type(type), m_name(name), m_owner(owner) {
    if (m_owner != nullptr) m_owner->registerProperty(this);
}

CimProperty::~CimProperty() {
    if (m_owner != nullptr) m_owner->unregisterProperty(this);
}

std::string CimProperty::toString() {
    return valueText(getValue());
}

CimType CimProperty::getType() {
    return m_type;
}

void CimProperty::check(const CimProperty& requested) const {
    if (requested.m_type != m_type || requested.m_array != m_array)
        refuseType(*this, m_type, CimValue::null(requested.m_type, requested.m_array));
}

void CimProperty::modify(CimProperty* requested) {
    check(*requested);
    // Linked through the listeners: a vector here would cost every property of every instance three pointers.
    for (Listener* listener = m_listeners; listener != nullptr; listener = listener->m_next) {
        listener->onPropertyModify(this, requested);
    }
    setValue(requested->getValue());
}

void CimProperty::verify(CimProperty* requested) {
    check(*requested);
    for (Listener* listener = m_listeners; listener != nullptr; listener = listener->m_next) {
        listener->onPropertyVerify(this, requested);
    }
}

void CimProperty::setNull() {
    const auto lock = lockOwner();
    changed(true);
}

void CimProperty::changed(bool isNull) {
    m_null = isNull;
    if (m_key && m_owner != nullptr) m_owner->forgetPath();
}

bool CimProperty::IsNull() const {
    const auto lock = lockOwner();
    return m_null;
}

CimValue CimProperty::getValue() const {
    CimValue value = CimValue::null(m_type, m_array);
    const auto lock = lockOwner();
    if (!m_null) load(value);
    return value;
}

CimCell CimProperty::cell(std::size_t) const {
    return {};
}

void CimProperty::load(CimValue& value) const {
    if (!m_array) {
        value.data = scalarOf(cell(0));
        return;
    }
    std::vector<CimScalar> elements;
    elements.reserve(cellCount());
    for (std::size_t i = 0; i < cellCount(); ++i)
        elements.push_back(scalarOf(cell(i)));
    value.data = std::move(elements);
}

void CimProperty::setValue(const CimValue& value) {
    // Converted before the lock: a reader waits for the swap alone.
    const CimValue held = converted(*this, m_type, value);
    const auto lock = lockOwner();
    if (!held.isNull()) store(held);
    changed(held.isNull());
}

void CimProperty::addListener(Listener* listener) {
    listener->m_next = m_listeners;
    m_listeners = listener;
}

template <class T, CimType Type>
CimPropertyScalar<T, Type>::CimPropertyScalar(const char* name, CimInstance* owner)
    : CimProperty(name, owner, Type, false), m_value(unset<T>()) {}

template <class T, CimType Type>
CimPropertyScalar<T, Type>& CimPropertyScalar<T, Type>::operator=(T value) {
    const auto lock = lockOwner();
    m_value = std::move(value);
    changed();
    return *this;
}

template <class T, CimType Type>
T CimPropertyScalar<T, Type>::get() const {
    const auto lock = lockOwner();
    return isNull() ? unset<T>() : m_value;
}

template <class T, CimType Type>
CimCell CimPropertyScalar<T, Type>::cell(std::size_t) const {
    return seen(m_value);
}

template <class T, CimType Type>
void CimPropertyScalar<T, Type>::store(const CimValue& value) {
    m_value = heldIn<T>(*value.scalar());
}

template <class T, CimType Type>
CimPropertyArray<T, Type>::CimPropertyArray(const char* name, CimInstance* owner)
    : CimProperty(name, owner, Type, true) {}

template <class T, CimType Type>
void CimPropertyArray<T, Type>::push_back(T value) {
    const auto lock = lockOwner();
    if (isNull()) m_values.clear();
    m_values.push_back(std::move(value));
    changed();
}

template <class T, CimType Type>
void CimPropertyArray<T, Type>::clear() {
    *this = std::vector<T>();
}

template <class T, CimType Type>
CimPropertyArray<T, Type>& CimPropertyArray<T, Type>::operator=(std::vector<T> values) {
    const auto lock = lockOwner();
    m_values = std::move(values);
    changed();
    return *this;
}

template <class T, CimType Type>
std::vector<T> CimPropertyArray<T, Type>::get() const {
    const auto lock = lockOwner();
    return isNull() ? std::vector<T>() : m_values;
}

template <class T, CimType Type>
CimCell CimPropertyArray<T, Type>::cell(std::size_t index) const {
    return seen(m_values[index]);
}

template <class T, CimType Type>
void CimPropertyArray<T, Type>::store(const CimValue& value) {
    // Built aside: without memory for one of them the property keeps what it has.
    std::vector<T> values(value.elements()->size());
    std::transform(value.elements()->begin(), value.elements()->end(), values.begin(), heldIn<T>);
    m_values = std::move(values);
}

void CimPropertyString::LengthListener::onPropertyModify(CimProperty* current, CimProperty* requested) {
    onPropertyVerify(current, requested);
}

void CimPropertyString::CheckMaxLengthListener::onPropertyVerify(CimProperty* current,
                                                                 CimProperty* requested) {
    const std::size_t length = requestedText(requested).size();
    if (length > m_bound) refuse(current, length, "at most", m_bound);
}

void CimPropertyString::CheckMinLengthListener::onPropertyVerify(CimProperty* current,
                                                                 CimProperty* requested) {
    const std::size_t length = requestedText(requested).size();
    if (length < m_bound) refuse(current, length, "at least", m_bound);
}

CimPropertyString::CimPropertyString(const char* name, CimInstance* owner) : CimPropertyScalar(name, owner) {
    addListener(&m_maxLength);
    addListener(&m_minLength);
}

CimPropertyString& CimPropertyString::operator=(std::string value) {
    const auto lock = lockOwner();
    // A refresh sets what mostly has not changed; a changed key would cost the instance its cached path.
    if (isNull() || m_value != value) CimPropertyScalar::operator=(std::move(value));
    return *this;
}

CimPropertyString& CimPropertyString::operator=(const CimPropertyString& other) {
    if (this != &other) setValue(other.getValue());
    return *this;
}

CimPropertyRef::CimPropertyRef(const char* name, CimInstance* owner)
    : CimProperty(name, owner, CimType::Reference, false) {}

CimPath CimPropertyRef::getPath() const {
    const auto lock = lockOwner();
    return isNull() ? CimPath() : *m_path;
}

void CimPropertyRef::assign(const CimInstance* target) {
    if (target == nullptr) {
        setNull();
        return;
    }
    // Read the target before locking the owner: two instances are never locked at once.
    auto path = target->getPath();
    const auto lock = lockOwner();
    m_path = std::move(path);
    changed();
}

void CimPropertyRef::load(CimValue& value) const {
    value.data = CimScalar(*m_path);
}

void CimPropertyRef::store(const CimValue& value) {
    m_path = std::make_shared<const CimPath>(std::get<CimPath>(*value.scalar()));
}

template class CimPropertyArray<std::string, CimType::String>;
template class CimPropertyArray<unsigned short, CimType::Uint16>;
template class CimPropertyScalar<std::string, CimType::String>;
template class CimPropertyScalar<unsigned char, CimType::Uint8>;
template class CimPropertyScalar<signed char, CimType::Sint8>;
template class CimPropertyScalar<unsigned short, CimType::Uint16>;
template class CimPropertyScalar<unsigned int, CimType::Uint32>;
template class CimPropertyScalar<std::uint64_t, CimType::Uint64>;
template class CimPropertyScalar<bool, CimType::Boolean>;
template class CimPropertyScalar<utils::Time, CimType::Datetime>;

}  // namespace core
