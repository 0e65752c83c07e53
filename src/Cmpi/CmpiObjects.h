// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Cmpi/CmpiValues.h"

/// The objects of the interface. Each is a pair of pointers: what its maker keeps, and a table of functions,
/// which take the object itself first. A slot may be null, whatever level the table states. Where a function
/// takes a Status pointer it may be null. Objects that a getter returns may be inside their parent.
namespace cmpi {

/// One object: never look at `hdl`, call through `ft`.
template <class Table>
struct Encapsulated {
    void* hdl;
    const Table* ft;
};

struct ContextTable {
    int ftVersion;
    Status (*release)(Context*);
    Context* (*clone)(const Context*, Status*);
    Data (*getEntry)(const Context*, const char* name, Status*);
    Data (*getEntryAt)(const Context*, Count, String** name, Status*);
    Count (*getEntryCount)(const Context*, Status*);
    Status (*addEntry)(const Context*, const char* name, const Value*, Type);
};
struct Context : Encapsulated<ContextTable> {};

struct ResultTable {
    int ftVersion;
    Status (*release)(Result*);
    Result* (*clone)(const Result*, Status*);
    Status (*returnData)(const Result*, const Value*, Type);
    Status (*returnInstance)(const Result*, const Instance*);
    Status (*returnObjectPath)(const Result*, const ObjectPath*);
    Status (*returnDone)(const Result*);
    Status (*returnError)(const Result*, const Error*);  // 2.0
};
struct Result : Encapsulated<ResultTable> {};

struct StringTable {
    int ftVersion;
    Status (*release)(String*);
    String* (*clone)(const String*, Status*);
    const char* (*getCharPtr)(const String*, Status*);
};
struct String : Encapsulated<StringTable> {};

struct ArrayTable {
    int ftVersion;
    Status (*release)(Array*);
    Array* (*clone)(const Array*, Status*);
    Count (*getSize)(const Array*, Status*);
    Type (*getSimpleType)(const Array*, Status*);
    Data (*getElementAt)(const Array*, Count, Status*);
    Status (*setElementAt)(Array*, Count, const Value*, Type);
};
struct Array : Encapsulated<ArrayTable> {};

struct EnumerationTable {
    int ftVersion;
    Status (*release)(Enumeration*);
    Enumeration* (*clone)(const Enumeration*, Status*);
    Data (*getNext)(const Enumeration*, Status*);
    Boolean (*hasNext)(const Enumeration*, Status*);
    Array* (*toArray)(const Enumeration*, Status*);
};
struct Enumeration : Encapsulated<EnumerationTable> {};

struct InstanceTable {
    int ftVersion;
    Status (*release)(Instance*);
    Instance* (*clone)(const Instance*, Status*);
    Data (*getProperty)(const Instance*, const char* name, Status*);
    Data (*getPropertyAt)(const Instance*, Count, String** name, Status*);
    Count (*getPropertyCount)(const Instance*, Status*);
    Status (*setProperty)(const Instance*, const char* name, const Value*, Type);
    ObjectPath* (*getObjectPath)(const Instance*, Status*);
    Status (*setPropertyFilter)(Instance*, const char** properties, const char** keys);
    Status (*setObjectPath)(Instance*, const ObjectPath*);  // 2.0
    Status (*setPropertyWithOrigin)(const Instance*, const char* name, const Value*, Type,
                                    const char* origin);  // 2.0
};
struct Instance : Encapsulated<InstanceTable> {};

struct ObjectPathTable {
    int ftVersion;
    Status (*release)(ObjectPath*);
    ObjectPath* (*clone)(const ObjectPath*, Status*);
    Status (*setNameSpace)(ObjectPath*, const char*);
    String* (*getNameSpace)(const ObjectPath*, Status*);
    Status (*setHostname)(ObjectPath*, const char*);
    String* (*getHostname)(const ObjectPath*, Status*);
    Status (*setClassName)(ObjectPath*, const char*);
    String* (*getClassName)(const ObjectPath*, Status*);
    Status (*addKey)(ObjectPath*, const char* name, const Value*, Type);
    Data (*getKey)(const ObjectPath*, const char* name, Status*);
    Data (*getKeyAt)(const ObjectPath*, Count, String** name, Status*);
    Count (*getKeyCount)(const ObjectPath*, Status*);
    Status (*setNameSpaceFromObjectPath)(ObjectPath*, const ObjectPath*);
    Status (*setHostAndNameSpaceFromObjectPath)(ObjectPath*, const ObjectPath*);
    Data (*getClassQualifier)(const ObjectPath*, const char* qualifier, Status*);
    Data (*getPropertyQualifier)(const ObjectPath*, const char* property, const char* qualifier, Status*);
    Data (*getMethodQualifier)(const ObjectPath*, const char* method, const char* qualifier, Status*);
    Data (*getParameterQualifier)(const ObjectPath*, const char* method, const char* parameter,
                                  const char* qualifier, Status*);
    String* (*toString)(const ObjectPath*, Status*);
};
struct ObjectPath : Encapsulated<ObjectPathTable> {};

struct ArgsTable {
    int ftVersion;
    Status (*release)(Args*);
    Args* (*clone)(const Args*, Status*);
    Status (*addArg)(const Args*, const char* name, const Value*, Type);
    Data (*getArg)(const Args*, const char* name, Status*);
    Data (*getArgAt)(const Args*, Count, String** name, Status*);
    Count (*getArgCount)(const Args*, Status*);
};
struct Args : Encapsulated<ArgsTable> {};

struct DateTimeTable {
    int ftVersion;
    Status (*release)(DateTime*);
    DateTime* (*clone)(const DateTime*, Status*);
    /// Microseconds since 1970-01-01 00:00 UTC, or those of an interval.
    unsigned long long (*getBinaryFormat)(const DateTime*, Status*);
    /// The 25 characters of DSP0004 5.2.4.
    String* (*getStringFormat)(const DateTime*, Status*);
    Boolean (*isInterval)(const DateTime*, Status*);
};
struct DateTime : Encapsulated<DateTimeTable> {};

}  // namespace cmpi
