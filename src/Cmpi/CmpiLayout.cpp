// SPDX-License-Identifier: Apache-2.0
// The layout that every object manager's own declarations have: a slip here would be a crash in there.
#include <cstddef>
#include <type_traits>

#include "Cmpi/Cmpi.h"

namespace cmpi {

namespace {

/// The place of a member, counted in pointers.
#define SLOT_OF(table, member) (offsetof(table, member) / sizeof(void*))

/// Tables whose last slot has this number, with one slot from their middle.
#define HAS_SLOTS(table, middle, middleSlot, last, lastSlot)                                      \
    static_assert(SLOT_OF(table, middle) == (middleSlot) && SLOT_OF(table, last) == (lastSlot) && \
                  sizeof(table) == ((lastSlot) + 1) * sizeof(void*) && std::is_standard_layout_v<table>)

HAS_SLOTS(ContextTable, getEntryAt, 4, addEntry, 6);
HAS_SLOTS(ResultTable, returnDone, 6, returnError, 7);
HAS_SLOTS(StringTable, clone, 2, getCharPtr, 3);
HAS_SLOTS(ArrayTable, getSimpleType, 4, setElementAt, 6);
HAS_SLOTS(EnumerationTable, hasNext, 4, toArray, 5);
HAS_SLOTS(InstanceTable, getObjectPath, 7, setPropertyWithOrigin, 10);
HAS_SLOTS(ObjectPathTable, getKeyAt, 11, toString, 19);
HAS_SLOTS(ArgsTable, getArg, 4, getArgCount, 6);
HAS_SLOTS(DateTimeTable, getStringFormat, 4, isInterval, 5);
HAS_SLOTS(SelectExpTable, getDOC, 5, evaluateUsingAccessor, 7);
HAS_SLOTS(SelectCondTable, getCountAndType, 3, getSubCondAt, 4);
HAS_SLOTS(SubCondTable, getPredicateAt, 4, getPredicate, 5);
HAS_SLOTS(PredicateTable, getData, 3, evaluateUsingAccessor, 4);
HAS_SLOTS(ErrorTable, getCIMStatusCode, 15, setMessageArguments, 26);

HAS_SLOTS(BrokerEncTable, classPathIsA, 10, getMessage2, 20);
HAS_SLOTS(BrokerExtTable, newMutex, 12, signalCondition, 20);
HAS_SLOTS(BrokerMemTable, cmpiFree, 7, freeSelectExp, 14);
HAS_SLOTS(Broker, eft, 2, mft, 4);

// Two ints at the front, which share a slot of 64 bits and take two of 32.
constexpr std::size_t kHead = 2 * sizeof(int) / sizeof(void*) - 1;
HAS_SLOTS(BrokerTable, execQuery, 11 + kHead, getProperty, 19 + kHead);
static_assert(SLOT_OF(BrokerTable, deliverIndication) == 5 + kHead);
HAS_SLOTS(InstanceMITable, createInstance, 6 + kHead, execQuery, 9 + kHead);
HAS_SLOTS(AssociationMITable, associators, 3 + kHead, referenceNames, 6 + kHead);
HAS_SLOTS(MethodMITable, cleanup, 2 + kHead, invokeMethod, 3 + kHead);
HAS_SLOTS(PropertyMITable, getProperty, 4 + kHead, setPropertyWithOrigin, 5 + kHead);
HAS_SLOTS(IndicationMITable, activateFilter, 5 + kHead, disableIndications, 8 + kHead);

constexpr bool kIs64 = sizeof(void*) == 8;
static_assert(sizeof(ValuePtr) == (kIs64 ? 16 : 8));
static_assert(sizeof(Value) == (kIs64 ? 16 : 8));
// In a structure, x86 with 32 bits puts eight-byte members at any multiple of four.
static_assert(offsetof(Data, value) == (kIs64 ? 8 : 4) && sizeof(Data) == (kIs64 ? 24 : 12));
static_assert(offsetof(Status, msg) == sizeof(void*) && sizeof(Status) == 2 * sizeof(void*));
static_assert(sizeof(ObjectPath) == 2 * sizeof(void*) && std::is_trivial_v<Data> &&
              std::is_trivial_v<Status>);

}  // namespace

}  // namespace cmpi
