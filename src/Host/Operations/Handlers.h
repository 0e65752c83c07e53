#pragma once

#include "Host/Operations/Operation.h"

/// The handlers of the operation table, each in the file of its group.
namespace host {

// ClassOperations.cpp
cimxml::IntrinsicResult getClass(const OperationContext& context, const Parameters& parameters);
cimxml::IntrinsicResult enumerateClasses(const OperationContext& context, const Parameters& parameters);
cimxml::IntrinsicResult enumerateClassNames(const OperationContext& context, const Parameters& parameters);
cimxml::IntrinsicResult getQualifier(const OperationContext& context, const Parameters& parameters);
cimxml::IntrinsicResult enumerateQualifiers(const OperationContext& context, const Parameters& parameters);

// InstanceOperations.cpp
cimxml::IntrinsicResult getInstance(const OperationContext& context, const Parameters& parameters);
cimxml::IntrinsicResult enumerateInstances(const OperationContext& context, const Parameters& parameters);
cimxml::IntrinsicResult enumerateInstanceNames(const OperationContext& context, const Parameters& parameters);
cimxml::IntrinsicResult deleteInstance(const OperationContext& context, const Parameters& parameters);
cimxml::IntrinsicResult createInstance(const OperationContext& context, const Parameters& parameters);
cimxml::IntrinsicResult modifyInstance(const OperationContext& context, const Parameters& parameters);

// AssociationOperations.cpp
cimxml::IntrinsicResult associators(const OperationContext& context, const Parameters& parameters);
cimxml::IntrinsicResult associatorNames(const OperationContext& context, const Parameters& parameters);
cimxml::IntrinsicResult references(const OperationContext& context, const Parameters& parameters);
cimxml::IntrinsicResult referenceNames(const OperationContext& context, const Parameters& parameters);

// PullOperations.cpp
cimxml::IntrinsicResult openEnumeration(const OperationContext& context, const Parameters& parameters);
cimxml::IntrinsicResult pullEnumeration(const OperationContext& context, const Parameters& parameters);
cimxml::IntrinsicResult closeEnumeration(const OperationContext& context, const Parameters& parameters);

// Refusals.cpp
cimxml::IntrinsicResult notSupported(const OperationContext& context, const Parameters& parameters);
cimxml::IntrinsicResult refuseQuery(const OperationContext& context, const Parameters& parameters);

}  // namespace host
