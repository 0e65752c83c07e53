// SPDX-License-Identifier: Apache-2.0
// From the object manager to the request layer.
#include <algorithm>
#include <iterator>
#include <optional>

#include "Cmpi/Slots.h"
#include "Cmpi/Values.h"
#include "Framework/Model/CimError.h"

namespace cmpi {

namespace {

using core::CimError;
using core::CimScalar;
using core::CimStatus;
using core::CimType;
using core::CimValue;

/// By CimType.
constexpr Type kCodes[] = {kBoolean, kString, kChar16, kUint8,  kUint16, kUint32,   kUint64,   kSint8,
                           kSint16,  kSint32, kSint64, kReal32, kReal64, kDateTime, kReference};

constexpr Type elementCode(Type code) {
    return static_cast<Type>(code & ~kArray);
}

std::optional<CimType> typeOf(Type code) {
    if (code == kChars) return CimType::String;
    const auto* found = std::ranges::find(kCodes, code);
    if (found == std::end(kCodes)) return std::nullopt;
    return static_cast<CimType>(found - std::begin(kCodes));
}

/// References may hold references in their keys. A client's XML could nest them until the stack is full.
constexpr int kDeepest = 8;

core::CimPath pathAt(const Place& place, const ObjectPath* path, int depth);

/// One UTF-16 unit as UTF-8. Half a pair names no character.
std::string utf8Of(unsigned short unit) {
    const auto byte = [](unsigned int value) { return static_cast<char>(value); };
    if (unit < 0x80) return {byte(unit)};
    if (unit < 0x800) return {byte(0xC0U | unit >> 6U), byte(0x80U | (unit & 0x3FU))};
    if (unit >= 0xD800 && unit < 0xE000) return "\xEF\xBF\xBD";
    return {byte(0xE0U | unit >> 12U), byte(0x80U | (unit >> 6U & 0x3FU)), byte(0x80U | (unit & 0x3FU))};
}

utils::Time timeOf(const DateTime* time) {
    // As a number, since texts may have an offset from UTC, or asterisks.
    const auto microseconds = read(time, &DateTimeTable::getBinaryFormat);
    const bool isInterval = read(time, &DateTimeTable::isInterval) != 0;
    return isInterval ? utils::Time(microseconds) : utils::Time::fromEpoch(microseconds);
}

std::uint64_t unsignedOf(CimType type, const Value& value) {
    switch (type) {
        case CimType::Uint8:
            return value.uint8;
        case CimType::Uint16:
            return value.uint16;
        case CimType::Uint32:
            return value.uint32;
        default:
            return value.uint64;
    }
}

std::int64_t signedOf(CimType type, const Value& value) {
    switch (type) {
        case CimType::Sint8:
            return value.sint8;
        case CimType::Sint16:
            return value.sint16;
        case CimType::Sint32:
            return value.sint32;
        default:
            return value.sint64;
    }
}

/// Whether the value is a pointer, and null, or a string without a text: some object managers say null so.
bool isNullPointer(const Data& data) {
    if (data.type == kString) return call(data.value.string, &StringTable::getCharPtr, nullptr) == nullptr;
    return ((data.type & kArray) != 0 || data.type >= kInstance) && data.value.string == nullptr;
}

CimScalar scalarFrom(const Place& place, CimType type, const Data& data, int depth) {
    const Value& value = data.value;
    if (core::isUnsigned(type)) return unsignedOf(type, value);
    if (core::isSigned(type)) return signedOf(type, value);
    switch (type) {
        case CimType::Boolean:
            return value.boolean != 0;
        case CimType::Char16:
            return utf8Of(value.char16);
        case CimType::Real32:
            return static_cast<double>(value.real32);
        case CimType::Real64:
            return value.real64;
        case CimType::Datetime:
            return timeOf(value.dateTime);
        case CimType::Reference:
            return pathAt(place, value.ref, depth);
        default:
            return data.type == kChars ? textOf(value.chars) : textOf(value.string);
    }
}

CimType requireType(Type code) {
    if (const auto type = typeOf(code)) return *type;
    throw CimError(CimStatus::InvalidParameter, code == kInstance
                                                    ? "an embedded instance is taken nowhere here"
                                                    : "no CIM type has the code " + std::to_string(code));
}

CimValue arrayFrom(const Place& place, CimType type, const Array* array) {
    std::vector<CimScalar> elements;
    const Count size = read(array, &ArrayTable::getSize);
    for (Count i = 0; i < size; ++i) {
        Status status{};
        const Data element = call(array, &ArrayTable::getElementAt, i, &status);
        if (status.rc != ReturnCode::Ok || !isGood(element) || isNullPointer(element) ||
            typeOf(element.type) != type) {
            throw CimError(CimStatus::InvalidParameter,
                           "element " + std::to_string(i) + " of an array is null, or of another type");
        }
        elements.push_back(scalarFrom(place, type, element, 0));
    }
    return CimValue::arrayOf(type, std::move(elements));
}

core::CimPath pathAt(const Place& place, const ObjectPath* path, int depth) {
    if (depth > kDeepest)
        throw CimError(CimStatus::InvalidParameter, "references are nested too deep in a path");
    std::vector<core::CimKey> keys;
    const Count count = call(path, &ObjectPathTable::getKeyCount, nullptr);
    for (Count i = 0; i < count; ++i) {
        String* name = nullptr;
        Status status{};
        const Data key = call(path, &ObjectPathTable::getKeyAt, i, &name, &status);
        // As if it had not been sent: the count of keys then tells the client.
        if (status.rc != ReturnCode::Ok || !isGood(key) || isNullPointer(key)) continue;
        keys.push_back({textOf(name), scalarFrom(place, requireType(key.type), key, depth + 1)});
    }
    core::CimPath result(textOf(call(path, &ObjectPathTable::getClassName, nullptr)), std::move(keys));
    const std::string nameSpace = textOf(call(path, &ObjectPathTable::getNameSpace, nullptr));
    if (!core::sameName(nameSpace, place.requested)) result.setNamespace(nameSpace);
    return result;
}

}  // namespace

Type typeCode(core::CimType type, bool isArray) {
    const Type code = kCodes[static_cast<std::size_t>(type)];
    return isArray ? static_cast<Type>(code | kArray) : code;
}

core::CimPath pathFrom(const Place& place, const ObjectPath* path) {
    return pathAt(place, path, 0);
}

CimValue valueFrom(const Place& place, const Data& data) {
    const bool isArray = (data.type & kArray) != 0;
    if (!isGood(data) || isNullPointer(data) || data.type == kNull)
        return CimValue::null(typeOf(elementCode(data.type)).value_or(CimType::String), isArray);
    const CimType type = requireType(elementCode(data.type));
    if (isArray) return arrayFrom(place, type, data.value.array);
    return CimValue::of(type, scalarFrom(place, type, data, 0));
}

}  // namespace cmpi
