// SPDX-License-Identifier: Apache-2.0
// From the request layer to the object manager.
#include "Cmpi/Slots.h"
#include "Cmpi/Values.h"

namespace cmpi {

namespace {

using core::CimScalar;
using core::CimType;

/// The first character of a text as UTF-16; U+FFFD where it takes two units.
unsigned short utf16Of(const std::string& text) {
    const auto byte = [&](std::size_t i) {
        return static_cast<unsigned int>(i < text.size() ? static_cast<unsigned char>(text[i]) : 0U);
    };
    const unsigned int lead = byte(0);
    if (lead < 0x80) return static_cast<unsigned short>(lead);
    if (lead < 0xE0) return static_cast<unsigned short>((lead & 0x1FU) << 6U | (byte(1) & 0x3FU));
    if (lead < 0xF0) {
        return static_cast<unsigned short>((lead & 0x0FU) << 12U | (byte(1) & 0x3FU) << 6U |
                                           (byte(2) & 0x3FU));
    }
    return 0xFFFD;
}

/// Sets the number's member of the union. Others stay 0: object managers may copy the whole union.
struct NumberSetter {
    Value& value;
    CimType type;

    void operator()(std::uint64_t number) const {
        switch (type) {
            case CimType::Uint8:
                value.uint8 = static_cast<std::uint8_t>(number);
                break;
            case CimType::Uint16:
                value.uint16 = static_cast<std::uint16_t>(number);
                break;
            case CimType::Uint32:
                value.uint32 = static_cast<std::uint32_t>(number);
                break;
            default:
                value.uint64 = number;
        }
    }
    void operator()(std::int64_t number) const {
        switch (type) {
            case CimType::Sint8:
                value.sint8 = static_cast<std::int8_t>(number);
                break;
            case CimType::Sint16:
                value.sint16 = static_cast<std::int16_t>(number);
                break;
            case CimType::Sint32:
                value.sint32 = static_cast<std::int32_t>(number);
                break;
            default:
                value.sint64 = number;
        }
    }
    void operator()(double number) const {
        if (type == CimType::Real32) {
            value.real32 = static_cast<float>(number);
        } else {
            value.real64 = number;
        }
    }
    void operator()(bool flag) const { value.boolean = flag ? 1 : 0; }
    template <class Other>
    void operator()(const Other&) const {}  // not a number
};

/// The type of a key that is known by its value alone; the width of a number is not.
CimType typeOf(const CimScalar& value) {
    constexpr CimType kTypes[] = {CimType::Boolean, CimType::Uint64,   CimType::Sint64,   CimType::Real64,
                                  CimType::String,  CimType::Datetime, CimType::Reference};
    return kTypes[value.index()];
}

}  // namespace

ObjectPath* newPath(const Place& place, const core::CimPath& path) {
    const std::string& own = path.getNamespace();
    const bool isServed = own.empty() || core::sameName(own, place.served);
    ObjectPath* result =
        made(call(place.broker, place.broker.eft, &BrokerEncTable::newObjectPath,
                  isServed ? place.requested.c_str() : own.c_str(), path.getClassName().c_str(), nullptr),
             "an object path");
    for (const core::CimKey& key : path.getKeys()) {
        const Given value(place, typeOf(key.value), key.value);
        requireTaken(call(result, &ObjectPathTable::addKey, key.name.c_str(), value.value(), value.type()),
                     "a key");
    }
    return result;
}

Given::Given(const Place& place, const core::CimValue& value) : m_type(typeCode(value.type, value.isArray)) {
    if (const CimScalar* scalar = value.scalar()) {
        hold(place, value.type, *scalar);
    } else if (const auto* elements = value.elements()) {
        m_value.array = newArray(place, value.type, *elements);
        m_given = &m_value;
    }
}

Given::Given(const Place& place, CimType type, const CimScalar& scalar) : m_type(typeCode(type)) {
    hold(place, type, scalar);
}

void Given::hold(const Place& place, CimType type, const CimScalar& scalar) {
    m_given = &m_value;
    const auto* text = std::get_if<std::string>(&scalar);
    if (const auto* path = std::get_if<core::CimPath>(&scalar)) {
        m_value.ref = newPath(place, *path);
    } else if (const auto* time = std::get_if<utils::Time>(&scalar)) {
        // The text that other clients get, too.
        m_value.dateTime = made(call(place.broker, place.broker.eft, &BrokerEncTable::newDateTimeFromChars,
                                     core::datetimeText(*time).c_str(), nullptr),
                                "a datetime");
    } else if (text != nullptr && type == CimType::Char16) {
        m_value.char16 = utf16Of(*text);
    } else if (text != nullptr) {
        // Not the address of a union that holds the text, which is what object managers would store.
        m_type = kChars;
        m_given = static_cast<const Value*>(static_cast<const void*>(text->c_str()));
    } else {
        std::visit(NumberSetter{m_value, type}, scalar);
    }
}

Array* Given::newArray(const Place& place, CimType type, const std::vector<CimScalar>& elements) {
    const auto count = static_cast<Count>(elements.size());
    Array* array =
        made(call(place.broker, place.broker.eft, &BrokerEncTable::newArray, count, typeCode(type), nullptr),
             "an array");
    for (Count i = 0; i < count; ++i) {
        const Given element(place, type, elements[i]);
        requireTaken(call(array, &ArrayTable::setElementAt, i, element.value(), element.type()),
                     "an element");
    }
    return array;
}

}  // namespace cmpi
