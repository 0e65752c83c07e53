// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <sys/types.h>

#include <ctime>

#include "Cmpi/CmpiObjects.h"
#include "Cmpi/CmpiQueries.h"

/// The object manager's side ("broker") and the provider's ("MI", management instrumentation).
namespace cmpi {

struct Broker;

/// Calls back into the object manager, on behalf of the context.
struct BrokerTable {
    unsigned int brokerCapabilities;
    unsigned int brokerVersion;
    const char* brokerName;
    Context* (*prepareAttachThread)(const Broker*, const Context*);
    Status (*attachThread)(const Broker*, const Context*);
    Status (*detachThread)(const Broker*, const Context*);
    Status (*deliverIndication)(const Broker*, const Context*, const char* nameSpace, const Instance*);
    Enumeration* (*enumerateInstanceNames)(const Broker*, const Context*, const ObjectPath*, Status*);
    Instance* (*getInstance)(const Broker*, const Context*, const ObjectPath*, const char**, Status*);
    ObjectPath* (*createInstance)(const Broker*, const Context*, const ObjectPath*, const Instance*, Status*);
    Status (*modifyInstance)(const Broker*, const Context*, const ObjectPath*, const Instance*, const char**);
    Status (*deleteInstance)(const Broker*, const Context*, const ObjectPath*);
    Enumeration* (*execQuery)(const Broker*, const Context*, const ObjectPath*, const char* query,
                              const char* language, Status*);
    Enumeration* (*enumerateInstances)(const Broker*, const Context*, const ObjectPath*, const char**,
                                       Status*);
    Enumeration* (*associators)(const Broker*, const Context*, const ObjectPath*, const char* assocClass,
                                const char* resultClass, const char* role, const char* resultRole,
                                const char** properties, Status*);
    Enumeration* (*associatorNames)(const Broker*, const Context*, const ObjectPath*, const char* assocClass,
                                    const char* resultClass, const char* role, const char* resultRole,
                                    Status*);
    Enumeration* (*references)(const Broker*, const Context*, const ObjectPath*, const char* resultClass,
                               const char* role, const char** properties, Status*);
    Enumeration* (*referenceNames)(const Broker*, const Context*, const ObjectPath*, const char* resultClass,
                                   const char* role, Status*);
    Data (*invokeMethod)(const Broker*, const Context*, const ObjectPath*, const char* method, const Args* in,
                         Args* out, Status*);
    Status (*setProperty)(const Broker*, const Context*, const ObjectPath*, const char* name, const Value*,
                          Type);
    Data (*getProperty)(const Broker*, const Context*, const ObjectPath*, const char* name, Status*);
};

/// Makes objects. In an MI function they are freed by the object manager when the function returns.
struct BrokerEncTable {
    int ftVersion;
    Instance* (*newInstance)(const Broker*, const ObjectPath*, Status*);
    ObjectPath* (*newObjectPath)(const Broker*, const char* nameSpace, const char* className, Status*);
    Args* (*newArgs)(const Broker*, Status*);
    String* (*newString)(const Broker*, const char*, Status*);
    Array* (*newArray)(const Broker*, Count, Type elements, Status*);
    DateTime* (*newDateTime)(const Broker*, Status*);
    DateTime* (*newDateTimeFromBinary)(const Broker*, unsigned long long, Boolean isInterval, Status*);
    DateTime* (*newDateTimeFromChars)(const Broker*, const char*, Status*);
    SelectExp* (*newSelectExp)(const Broker*, const char* query, const char* language, Array** projection,
                               Status*);
    Boolean (*classPathIsA)(const Broker*, const ObjectPath*, const char* className, Status*);
    String* (*toString)(const Broker*, const void*, Status*);
    Boolean (*isOfType)(const Broker*, const void*, const char*, Status*);
    String* (*getType)(const Broker*, const void*, Status*);
    String* (*getMessage)(const Broker*, const char* id, const char* otherwise, Status*, Count, ...);
    Status (*logMessage)(const Broker*, int severity, const char* id, const char*, const String*);
    Status (*trace)(const Broker*, int level, const char* component, const char*, const String*);
    Error* (*newCMPIError)(const Broker*, const char* owner, const char* id, const char*, int severity,
                           int cause, ReturnCode, Status*);         // 2.0
    Status (*openMessageFile)(const Broker*, const char*, void**);  // 2.0
    Status (*closeMessageFile)(const Broker*, void*);               // 2.0
    String* (*getMessage2)(const Broker*, const char* id, void* file, const char* otherwise, Status*, Count,
                           ...);  // 2.0
};

/// Threads and mutexes. The numbers are the slots'.
struct BrokerExtTable {
    int ftVersion;
    char* (*resolveFileName)(const char*);
    void* (*newThread)(void* (*)(void*), void*, int isDetached);
    int (*joinThread)(void*, void**);
    int (*exitThread)(void*);
    int (*cancelThread)(void*);
    int (*threadSleep)(unsigned int milliseconds);
    int (*threadOnce)(int*, void (*)());
    int (*createThreadKey)(unsigned int*, void (*)(void*));
    int (*destroyThreadKey)(unsigned int);
    void* (*getThreadSpecific)(unsigned int);
    int (*setThreadSpecific)(unsigned int, void*);
    void* (*newMutex)(int);
    void (*destroyMutex)(void*);
    void (*lockMutex)(void*);
    void (*unlockMutex)(void*);
    void* (*newCondition)(int);
    void (*destroyCondition)(void*);
    int (*condWait)(void*, void*);
    int (*timedCondWait)(void*, void*, timespec* until);
    int (*signalCondition)(void*);
};

/// Memory. What is made between mark and release goes at the release; results that were returned stay.
struct BrokerMemTable {
    int ftVersion;
    void* (*mark)(const Broker*, Status*);
    Status (*release)(const Broker*, const void* mark);
    void* (*cmpiMalloc)(const Broker*, std::size_t);
    void* (*cmpiCalloc)(const Broker*, std::size_t, std::size_t);
    void* (*cmpiRealloc)(const Broker*, void*, std::size_t);
    char* (*cmpiStrDup)(const Broker*, const char*);
    void (*cmpiFree)(const Broker*, void*);
    void (*freeInstance)(const Broker*, Instance*);
    void (*freeObjectPath)(const Broker*, ObjectPath*);
    void (*freeArgs)(const Broker*, Args*);
    void (*freeString)(const Broker*, String*);
    void (*freeArray)(const Broker*, Array*);
    void (*freeDateTime)(const Broker*, DateTime*);
    void (*freeSelectExp)(const Broker*, SelectExp*);
};

/// Valid from the first creation of an MI to the return of the last cleanup.
struct Broker {
    void* hdl;
    const BrokerTable* bft;
    const BrokerEncTable* eft;
    const BrokerExtTable* xft;  ///< may be null
    const BrokerMemTable* mft;  ///< may be null
};

/// What the provider makes: `hdl` is its own, every slot is filled.
struct InstanceMI;
struct InstanceMITable {
    int ftVersion;
    int miVersion;
    const char* miName;
    Status (*cleanup)(InstanceMI*, const Context*, Boolean isTerminating);
    Status (*enumerateInstanceNames)(InstanceMI*, const Context*, const Result*, const ObjectPath*);
    Status (*enumerateInstances)(InstanceMI*, const Context*, const Result*, const ObjectPath*, const char**);
    Status (*getInstance)(InstanceMI*, const Context*, const Result*, const ObjectPath*, const char**);
    Status (*createInstance)(InstanceMI*, const Context*, const Result*, const ObjectPath*, const Instance*);
    Status (*modifyInstance)(InstanceMI*, const Context*, const Result*, const ObjectPath*, const Instance*,
                             const char**);
    Status (*deleteInstance)(InstanceMI*, const Context*, const Result*, const ObjectPath*);
    Status (*execQuery)(InstanceMI*, const Context*, const Result*, const ObjectPath*, const char* query,
                        const char* language);
};
struct InstanceMI : Encapsulated<InstanceMITable> {};

struct AssociationMI;
struct AssociationMITable {
    int ftVersion;
    int miVersion;
    const char* miName;
    Status (*cleanup)(AssociationMI*, const Context*, Boolean isTerminating);
    Status (*associators)(AssociationMI*, const Context*, const Result*, const ObjectPath*,
                          const char* assocClass, const char* resultClass, const char* role,
                          const char* resultRole, const char** properties);
    Status (*associatorNames)(AssociationMI*, const Context*, const Result*, const ObjectPath*,
                              const char* assocClass, const char* resultClass, const char* role,
                              const char* resultRole);
    Status (*references)(AssociationMI*, const Context*, const Result*, const ObjectPath*,
                         const char* resultClass, const char* role, const char** properties);
    Status (*referenceNames)(AssociationMI*, const Context*, const Result*, const ObjectPath*,
                             const char* resultClass, const char* role);
};
struct AssociationMI : Encapsulated<AssociationMITable> {};

struct MethodMI;
struct MethodMITable {
    int ftVersion;
    int miVersion;
    const char* miName;
    Status (*cleanup)(MethodMI*, const Context*, Boolean isTerminating);
    Status (*invokeMethod)(MethodMI*, const Context*, const Result*, const ObjectPath*, const char* method,
                           const Args* in, Args* out);
};
struct MethodMI : Encapsulated<MethodMITable> {};

struct PropertyMI;
struct PropertyMITable {
    int ftVersion;
    int miVersion;
    const char* miName;
    Status (*cleanup)(PropertyMI*, const Context*, Boolean isTerminating);
    Status (*setProperty)(PropertyMI*, const Context*, const Result*, const ObjectPath*, const char* name,
                          Data);
    Status (*getProperty)(PropertyMI*, const Context*, const Result*, const ObjectPath*, const char* name);
    Status (*setPropertyWithOrigin)(PropertyMI*, const Context*, const Result*, const ObjectPath*,
                                    const char* name, Data, const char* origin);
};
struct PropertyMI : Encapsulated<PropertyMITable> {};

struct IndicationMI;
struct IndicationMITable {
    int ftVersion;
    int miVersion;
    const char* miName;
    Status (*cleanup)(IndicationMI*, const Context*, Boolean isTerminating);
    Status (*authorizeFilter)(IndicationMI*, const Context*, const SelectExp*, const char* className,
                              const ObjectPath*, const char* owner);
    Status (*mustPoll)(IndicationMI*, const Context*, const SelectExp*, const char* className,
                       const ObjectPath*);
    Status (*activateFilter)(IndicationMI*, const Context*, const SelectExp*, const char* className,
                             const ObjectPath*, Boolean isFirst);
    Status (*deActivateFilter)(IndicationMI*, const Context*, const SelectExp*, const char* className,
                               const ObjectPath*, Boolean isLast);
    Status (*enableIndications)(IndicationMI*, const Context*);
    Status (*disableIndications)(IndicationMI*, const Context*);
};
struct IndicationMI : Encapsulated<IndicationMITable> {};

/// The level of the tables here; also from which on a slot that is marked 2.0 may be called.
inline constexpr int kLevel = 200;

}  // namespace cmpi
