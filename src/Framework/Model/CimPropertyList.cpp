// SPDX-License-Identifier: Apache-2.0
#include "Framework/Model/CimPropertyList.h"

#include "Framework/Model/CimError.h"
#include "Framework/Model/CimProperties.h"
#include "Framework/Model/CimPropertyRef.h"

namespace core {

namespace {

std::unique_ptr<CimProperty> makeArray(const char* name, CimType type) {
    switch (type) {
        case CimType::String:
            return std::make_unique<CimPropertyString_arr>(name, nullptr);
        case CimType::Uint16:
            return std::make_unique<CimPropertyUint16_arr>(name, nullptr);
        default:
            return nullptr;
    }
}

std::unique_ptr<CimProperty> makeScalar(const char* name, CimType type) {
    switch (type) {
        case CimType::String:
            return std::make_unique<CimPropertyString>(name, nullptr);
        case CimType::Uint8:
            return std::make_unique<CimPropertyUint8>(name, nullptr);
        case CimType::Sint8:
            return std::make_unique<CimPropertySint8>(name, nullptr);
        case CimType::Uint16:
            return std::make_unique<CimPropertyUint16>(name, nullptr);
        case CimType::Uint32:
            return std::make_unique<CimPropertyUint32>(name, nullptr);
        case CimType::Uint64:
            return std::make_unique<CimPropertyUint64>(name, nullptr);
        case CimType::Boolean:
            return std::make_unique<CimPropertyBoolean>(name, nullptr);
        case CimType::Datetime:
            return std::make_unique<CimPropertyDatetime>(name, nullptr);
        case CimType::Reference:
            return std::make_unique<CimPropertyRef>(name, nullptr);
        default:
            return nullptr;
    }
}

}  // namespace

CimPropertyList::CimPropertyList() = default;
CimPropertyList::CimPropertyList(CimPropertyList&&) noexcept = default;
CimPropertyList& CimPropertyList::operator=(CimPropertyList&&) noexcept = default;
CimPropertyList::~CimPropertyList() = default;

CimProperty* CimPropertyList::getPropertyByName(std::string name) const {
    for (const auto& property : m_properties) {
        if (sameName(property->getName(), name)) return property.get();
    }
    return nullptr;
}

void CimPropertyList::add(std::unique_ptr<CimProperty> property) {
    m_properties.push_back(std::move(property));
}

CimProperty& CimPropertyList::add(const std::string& name, const CimValue& value) {
    m_names.push_back(std::make_unique<std::string>(name));
    const char* kept = m_names.back()->c_str();
    auto property = value.isArray ? makeArray(kept, value.type) : makeScalar(kept, value.type);
    if (property == nullptr) {
        throw CimError(CimStatus::InvalidParameter, name + ": no property holds values of type " +
                                                        std::string(typeName(value.type)) +
                                                        (value.isArray ? "[]" : ""));
    }
    property->setValue(value);
    add(std::move(property));
    return *m_properties.back();
}

}  // namespace core
