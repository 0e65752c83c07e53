// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>

/// The Common Manageability Programming Interface (The Open Group, C061), through which object managers call
/// providers: level 2.0, in declarations of our own. Here are its values. The names are the standard's
/// without CMPI in front; the layout is that of plain C on the platform, and checked in CmpiLayout.cpp.
namespace cmpi {

using Boolean = unsigned char;  ///< 0 or 1
using Count = unsigned int;
using Type = unsigned short;
using State = unsigned short;

struct Args;
struct Array;
struct Context;
struct DateTime;
struct Enumeration;
struct Error;
struct Instance;
struct ObjectPath;
struct Predicate;
struct Result;
struct SelectCond;
struct SelectExp;
struct String;
struct SubCond;

/// Codes of types. That of an array is its elements' with kArray.
inline constexpr Type kNull = 0x0000;
inline constexpr Type kBoolean = 0x0002;
inline constexpr Type kChar16 = 0x0003;
inline constexpr Type kReal32 = 0x0008;
inline constexpr Type kReal64 = 0x000c;
inline constexpr Type kUint8 = 0x0080;
inline constexpr Type kUint16 = 0x0090;
inline constexpr Type kUint32 = 0x00a0;
inline constexpr Type kUint64 = 0x00b0;
inline constexpr Type kSint8 = 0x00c0;
inline constexpr Type kSint16 = 0x00d0;
inline constexpr Type kSint32 = 0x00e0;
inline constexpr Type kSint64 = 0x00f0;
inline constexpr Type kInstance = 0x1000;
inline constexpr Type kReference = 0x1100;
inline constexpr Type kString = 0x1600;    ///< a String object
inline constexpr Type kChars = 0x1700;     ///< C text: the pointer to the value is the text itself
inline constexpr Type kDateTime = 0x1800;  ///< a DateTime object
inline constexpr Type kArray = 0x2000;

/// Bits of a value's state. They combine, and object managers choose them differently: only test for bits.
inline constexpr State kNullValue = 0x0100;
inline constexpr State kKeyValue = 0x0200;
inline constexpr State kNotFound = 0x0400;
inline constexpr State kBadValue = 0x8000;

/// C text with a length.
struct ValuePtr {
    void* ptr;
    Count length;
};

/// One value; its type code, kept beside it, says which member. The object behind a pointer belongs to the
/// object manager.
union Value {
    Boolean boolean;
    unsigned short char16;
    float real32;
    double real64;
    std::uint8_t uint8;
    std::uint16_t uint16;
    std::uint32_t uint32;
    unsigned long long uint64;
    std::int8_t sint8;
    std::int16_t sint16;
    std::int32_t sint32;
    long long sint64;
    Instance* inst;
    ObjectPath* ref;
    Args* args;
    SelectExp* filter;
    Enumeration* enumeration;
    String* string;
    Array* array;
    DateTime* dateTime;
    char* chars;
    ValuePtr dataPtr;
};

/// A value with its type and state. Passed by value, so it must stay trivial.
struct Data {
    Type type;
    State state;
    Value value;
};

/// Up to 29 the status codes of CIM operations (DSP0200 5.5), then those of the interface.
enum class ReturnCode : int {
    Ok = 0,
    Failed = 1,
    AccessDenied = 2,
    InvalidParameter = 4,
    InvalidClass = 5,
    NotFound = 6,
    NotSupported = 7,
    NoSuchProperty = 12,
    TypeMismatch = 13,
    MethodNotFound = 17,
    DoNotUnload = 50,  ///< an answer to cleanup: not now
    NeverUnload = 51,  ///< an answer to cleanup: not before the shutdown
    InvalidHandle = 60,
    InvalidDataType = 61,
    ErrorSystem = 100,
    Error = 200,
};

/// How a call ended. Passed by value, so it must stay trivial.
struct Status {
    ReturnCode rc;
    String* msg;  ///< may be null
};

}  // namespace cmpi
