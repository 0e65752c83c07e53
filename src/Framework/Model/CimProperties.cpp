// SPDX-License-Identifier: Apache-2.0
#include "Framework/Model/CimProperties.h"

#include "Framework/Model/CimError.h"

namespace core {

namespace {

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

}  // namespace

void CimPropertyString::CheckMaxLengthListener::onPropertyVerify(CimProperty* current,
                                                                 CimProperty* requested) {
    const std::size_t length = requestedText(requested).size();
    if (length > m_bound) refuse(current, length, "at most", m_bound);
}

void CimPropertyString::CheckMaxLengthListener::onPropertyModify(CimProperty* current,
                                                                 CimProperty* requested) {
    onPropertyVerify(current, requested);
}

void CimPropertyString::CheckMinLengthListener::onPropertyVerify(CimProperty* current,
                                                                 CimProperty* requested) {
    const std::size_t length = requestedText(requested).size();
    if (length < m_bound) refuse(current, length, "at least", m_bound);
}

void CimPropertyString::CheckMinLengthListener::onPropertyModify(CimProperty* current,
                                                                 CimProperty* requested) {
    onPropertyVerify(current, requested);
}

CimPropertyString::CimPropertyString(const char* name, CimInstance* owner)
    : CimProperty(name, owner, CimType::String, false) {
    addListener(&m_maxLength);
    addListener(&m_minLength);
}

CimPropertyString& CimPropertyString::operator=(std::string value) {
    const Guard guard(*this);
    if (!isNull() && m_value == value) return *this;
    m_value = std::move(value);
    changed();
    return *this;
}

CimPropertyString& CimPropertyString::operator=(const CimPropertyString& other) {
    if (this != &other) setValue(other.getValue());
    return *this;
}

CimPropertyString& CimPropertyString::operator=(CimPropertyString& other) {
    return *this = static_cast<const CimPropertyString&>(other);
}

std::string CimPropertyString::get() const {
    const Guard guard(*this);
    return isNull() ? std::string() : m_value;
}

void CimPropertyString::setLengthBounds(std::size_t shortest, std::size_t longest) {
    m_minLength.m_bound = shortest;
    m_maxLength.m_bound = longest;
}

void CimPropertyString::load(CimValue& value) const {
    value.data = CimScalar(m_value);
}

void CimPropertyString::store(const CimValue& value) {
    m_value = std::get<std::string>(*value.scalar());
}

template class CimPropertyArray<std::string, CimType::String>;
template class CimPropertyArray<unsigned short, CimType::Uint16>;
template class CimPropertyScalar<unsigned char, CimType::Uint8>;
template class CimPropertyScalar<signed char, CimType::Sint8>;
template class CimPropertyScalar<unsigned short, CimType::Uint16>;
template class CimPropertyScalar<unsigned int, CimType::Uint32>;
template class CimPropertyScalar<std::uint64_t, CimType::Uint64>;
template class CimPropertyScalar<bool, CimType::Boolean>;
template class CimPropertyScalar<utils::Time, CimType::Datetime>;

}  // namespace core
