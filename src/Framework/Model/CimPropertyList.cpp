// SPDX-License-Identifier: Apache-2.0
#include "Framework/Model/CimPropertyList.h"

#include <algorithm>
#include <iterator>

#include "Framework/Model/CimError.h"
#include "Framework/Model/CimValue.h"

namespace core {

namespace {

template <class Property>
std::unique_ptr<CimProperty> make(const char* name) {
    return std::make_unique<Property>(name, nullptr);
}

/// The kinds of properties, by the values that they hold.
struct Kind {
    CimType type;
    bool isArray;
    std::unique_ptr<CimProperty> (*make)(const char* name);
};
constexpr Kind kKinds[] = {
    {CimType::String, false, make<CimPropertyString>},
    {CimType::String, true, make<CimPropertyString_arr>},
    {CimType::Uint8, false, make<CimPropertyUint8>},
    {CimType::Sint8, false, make<CimPropertySint8>},
    {CimType::Uint16, false, make<CimPropertyUint16>},
    {CimType::Uint16, true, make<CimPropertyUint16_arr>},
    {CimType::Uint32, false, make<CimPropertyUint32>},
    {CimType::Uint64, false, make<CimPropertyUint64>},
    {CimType::Boolean, false, make<CimPropertyBoolean>},
    {CimType::Datetime, false, make<CimPropertyDatetime>},
    {CimType::Reference, false, make<CimPropertyRef>},
};

}  // namespace

CimProperty* CimPropertyList::getPropertyByName(std::string name) const {
    // A call has a handful of arguments.
    for (const auto& property : m_properties) {
        if (sameName(property->getName(), name)) return property.get();
    }
    return nullptr;
}

CimProperty& CimPropertyList::add(const std::string& name, const CimValue& value) {
    const auto kind = std::find_if(std::begin(kKinds), std::end(kKinds), [&](const Kind& each) {
        return each.type == value.type && each.isArray == value.isArray;
    });
    if (kind == std::end(kKinds)) {
        throw CimError(CimStatus::InvalidParameter, name + ": no property holds values of type " +
                                                        std::string(typeName(value.type)) +
                                                        (value.isArray ? "[]" : ""));
    }
    // Methods cast arguments to the kinds that they declare, so a null has to have its kind, too.
    auto property = kind->make(m_names.emplace_back(name).c_str());
    property->setValue(value);
    return *m_properties.emplace_back(std::move(property));
}

}  // namespace core
