// SPDX-License-Identifier: Apache-2.0
#include "Framework/Model/CimProperty.h"

#include "Framework/Model/CimError.h"
#include "Framework/Model/CimInstance.h"

namespace core {

namespace {

std::string typeText(CimType type, bool isArray) {
    return std::string(typeName(type)) + (isArray ? "[]" : "");
}

/// The value with every element held as the type wants it; CimError where one does not fit.
CimValue converted(const CimProperty& property, CimType type, const CimValue& value) {
    const auto mismatch = [&] {
        return CimError(CimStatus::TypeMismatch, std::string(property.getName()) + " takes a value of type " +
                                                     typeText(type, property.isArray()) + ", not of type " +
                                                     typeText(value.type, value.isArray));
    };
    if (value.isArray != property.isArray()) throw mismatch();
    CimValue result{type, value.isArray, {}};
    if (const CimScalar* scalar = value.scalar()) {
        auto held = convertScalar(type, *scalar);
        if (!held) throw mismatch();
        result.data = std::move(*held);
    } else if (const auto* elements = value.elements()) {
        std::vector<CimScalar> all;
        for (const CimScalar& element : *elements) {
            auto held = convertScalar(type, element);
            if (!held) throw mismatch();
            all.push_back(std::move(*held));
        }
        result.data = std::move(all);
    }
    return result;
}

}  // namespace

void CimProperty::Listener::onPropertyModify(CimProperty*, CimProperty*) {}
void CimProperty::Listener::onPropertyVerify(CimProperty*, CimProperty*) {}
CimProperty::Listener::~Listener() = default;

CimProperty::Guard::Guard(const CimProperty& property) : m_owner(property.m_owner) {
    if (m_owner != nullptr) m_owner->getMutex().lock();
}

CimProperty::Guard::~Guard() {
    if (m_owner != nullptr) m_owner->getMutex().unlock();
}

CimProperty::CimProperty(const char* name, CimInstance* owner, CimType type, bool isArray)
    : m_array(isArray), m_type(type), m_name(name), m_owner(owner) {
    if (m_owner != nullptr) m_owner->registerProperty(this);
}

CimProperty::~CimProperty() {
    if (m_owner != nullptr) m_owner->unregisterProperty(this);
}

std::string CimProperty::toString() {
    const CimValue value = getValue();
    if (const CimScalar* scalar = value.scalar()) return scalarText(value.type, *scalar);
    std::string text;
    if (const auto* elements = value.elements()) {
        for (const CimScalar& element : *elements) {
            if (!text.empty()) text += ',';
            text += scalarText(value.type, element);
        }
    }
    return text;
}

CimType CimProperty::getType() {
    return m_type;
}

void CimProperty::check(const CimProperty& requested) const {
    if (requested.m_type == m_type && requested.m_array == m_array) return;
    throw CimError(CimStatus::TypeMismatch, std::string(m_name) + " takes a value of type " +
                                                typeText(m_type, m_array) + ", not of type " +
                                                typeText(requested.m_type, requested.m_array));
}

void CimProperty::modify(CimProperty* requested) {
    check(*requested);
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
    const Guard guard(*this);
    changed(true);
}

void CimProperty::changed(bool isNull) {
    m_null = isNull;
    if (m_key && m_owner != nullptr) m_owner->forgetPath();
}

bool CimProperty::IsNull() const {
    const Guard guard(*this);
    return m_null;
}

CimValue CimProperty::getValue() const {
    CimValue value = CimValue::null(m_type, m_array);
    const Guard guard(*this);
    if (!m_null) load(value);
    return value;
}

void CimProperty::setValue(const CimValue& value) {
    const CimValue held = converted(*this, m_type, value);
    const Guard guard(*this);
    if (!held.isNull()) store(held);
    changed(held.isNull());
}

void CimProperty::addListener(Listener* listener) {
    listener->m_next = m_listeners;
    m_listeners = listener;
}

}  // namespace core
