// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Cmpi/CmpiObjects.h"

/// The objects of queries, and errors as objects (CIM_Error).
namespace cmpi {

/// Gives the value of a property to a condition that is being evaluated.
using Accessor = Data (*)(const char* property, void* parameter);

struct SelectExpTable {
    int ftVersion;
    Status (*release)(SelectExp*);
    SelectExp* (*clone)(const SelectExp*, Status*);
    Boolean (*evaluate)(const SelectExp*, const Instance*, Status*);
    String* (*getString)(const SelectExp*, Status*);
    SelectCond* (*getDOC)(const SelectExp*, Status*);
    SelectCond* (*getCOD)(const SelectExp*, Status*);
    Boolean (*evaluateUsingAccessor)(const SelectExp*, Accessor, void*, Status*);
};
struct SelectExp : Encapsulated<SelectExpTable> {};

struct SelectCondTable {
    int ftVersion;
    Status (*release)(SelectCond*);
    SelectCond* (*clone)(const SelectCond*, Status*);
    Count (*getCountAndType)(const SelectCond*, int* type, Status*);
    SubCond* (*getSubCondAt)(const SelectCond*, Count, Status*);
};
struct SelectCond : Encapsulated<SelectCondTable> {};

struct SubCondTable {
    int ftVersion;
    Status (*release)(SubCond*);
    SubCond* (*clone)(const SubCond*, Status*);
    Count (*getCount)(const SubCond*, Status*);
    Predicate* (*getPredicateAt)(const SubCond*, Count, Status*);
    Predicate* (*getPredicate)(const SubCond*, const char* name, Status*);
};
struct SubCond : Encapsulated<SubCondTable> {};

struct PredicateTable {
    int ftVersion;
    Status (*release)(Predicate*);
    Predicate* (*clone)(const Predicate*, Status*);
    Status (*getData)(const Predicate*, Type*, int* operation, String** left, String** right);
    Boolean (*evaluateUsingAccessor)(const Predicate*, Accessor, void*, Status*);
};
struct Predicate : Encapsulated<PredicateTable> {};

struct ErrorTable {  // 2.0
    int ftVersion;
    Status (*release)(Error*);
    Error* (*clone)(const Error*, Status*);
    int (*getErrorType)(const Error*, Status*);
    String* (*getOtherErrorType)(const Error*, Status*);
    String* (*getOwningEntity)(const Error*, Status*);
    String* (*getMessageID)(const Error*, Status*);
    String* (*getMessage)(const Error*, Status*);
    int (*getPerceivedSeverity)(const Error*, Status*);
    int (*getProbableCause)(const Error*, Status*);
    String* (*getProbableCauseDescription)(const Error*, Status*);
    Array* (*getRecommendedActions)(const Error*, Status*);
    String* (*getErrorSource)(const Error*, Status*);
    int (*getErrorSourceFormat)(const Error*, Status*);
    String* (*getOtherErrorSourceFormat)(const Error*, Status*);
    ReturnCode (*getCIMStatusCode)(const Error*, Status*);
    String* (*getCIMStatusCodeDescription)(const Error*, Status*);
    Array* (*getMessageArguments)(const Error*, Status*);
    Status (*setErrorType)(Error*, int);
    Status (*setOtherErrorType)(Error*, const char*);
    Status (*setProbableCauseDescription)(Error*, const char*);
    Status (*setRecommendedActions)(Error*, const Array*);
    Status (*setErrorSource)(Error*, const char*);
    Status (*setErrorSourceFormat)(Error*, int);
    Status (*setOtherErrorSourceFormat)(Error*, const char*);
    Status (*setCIMStatusCodeDescription)(Error*, const char*);
    Status (*setMessageArguments)(Error*, const Array*);
};
struct Error : Encapsulated<ErrorTable> {};

}  // namespace cmpi
