// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <array>

#include "Host/Operations/Operations.h"

namespace host {

namespace {

using cimxml::IntrinsicResult;
using Kind = ParameterKind;

constexpr ParameterSpec kClassName{"ClassName", Kind::ClassName};
constexpr ParameterSpec kClassRequired{"ClassName", Kind::ClassName, true};
constexpr ParameterSpec kInstanceName{"InstanceName", Kind::InstanceName, true};
constexpr ParameterSpec kObjectName{"ObjectName", Kind::ObjectName, true};
constexpr ParameterSpec kLocalOnly{"LocalOnly", Kind::Boolean};
constexpr ParameterSpec kDeepInheritance{"DeepInheritance", Kind::Boolean};
constexpr ParameterSpec kQualifiers{"IncludeQualifiers", Kind::Boolean};
constexpr ParameterSpec kClassOrigin{"IncludeClassOrigin", Kind::Boolean};
constexpr ParameterSpec kPropertyList{"PropertyList", Kind::TextList};
constexpr ParameterSpec kAssocClass{"AssocClass", Kind::ClassName};
constexpr ParameterSpec kResultClass{"ResultClass", Kind::ClassName};
constexpr ParameterSpec kRole{"Role", Kind::Text};
constexpr ParameterSpec kResultRole{"ResultRole", Kind::Text};
constexpr ParameterSpec kFilterLanguage{"FilterQueryLanguage", Kind::Text};
constexpr ParameterSpec kFilter{"FilterQuery", Kind::Text};
constexpr ParameterSpec kTimeout{"OperationTimeout", Kind::Number};
constexpr ParameterSpec kContinue{"ContinueOnError", Kind::Boolean};
constexpr ParameterSpec kCount{"MaxObjectCount", Kind::Number};
constexpr ParameterSpec kContext{"EnumerationContext", Kind::Text, true};

constexpr ParameterSpec kGetClass[] = {kClassRequired, kLocalOnly, kQualifiers, kClassOrigin, kPropertyList};
constexpr ParameterSpec kEnumerateClasses[] = {kClassName, kDeepInheritance, kLocalOnly, kQualifiers,
                                               kClassOrigin};
constexpr ParameterSpec kEnumerateClassNames[] = {kClassName, kDeepInheritance};
constexpr ParameterSpec kGetInstance[] = {kInstanceName, kLocalOnly, kQualifiers, kClassOrigin,
                                          kPropertyList};
constexpr ParameterSpec kEnumerateInstances[] = {kClassRequired, kLocalOnly,   kDeepInheritance,
                                                 kQualifiers,    kClassOrigin, kPropertyList};
constexpr ParameterSpec kEnumerateInstanceNames[] = {kClassRequired};
constexpr ParameterSpec kDeleteInstance[] = {kInstanceName};
constexpr ParameterSpec kCreateInstance[] = {{"NewInstance", Kind::Instance, true}};
constexpr ParameterSpec kModifyInstance[] = {
    {"ModifiedInstance", Kind::Instance, true}, kQualifiers, kPropertyList};
constexpr ParameterSpec kAssociators[] = {kObjectName, kAssocClass, kResultClass, kRole,
                                          kResultRole, kQualifiers, kClassOrigin, kPropertyList};
constexpr ParameterSpec kAssociatorNames[] = {kObjectName, kAssocClass, kResultClass, kRole, kResultRole};
constexpr ParameterSpec kReferences[] = {kObjectName, kResultClass, kRole,
                                         kQualifiers, kClassOrigin, kPropertyList};
constexpr ParameterSpec kReferenceNames[] = {kObjectName, kResultClass, kRole};
constexpr ParameterSpec kGetQualifier[] = {{"QualifierName", Kind::Text, true}};
constexpr ParameterSpec kExecQuery[] = {{"QueryLanguage", Kind::Text, true}, {"Query", Kind::Text, true}};
constexpr ParameterSpec kOpenInstances[] = {kClassRequired, kDeepInheritance, kClassOrigin,
                                            kPropertyList,  kFilterLanguage,  kFilter,
                                            kTimeout,       kContinue,        kCount};
constexpr ParameterSpec kOpenPaths[] = {kClassRequired, kFilterLanguage, kFilter,
                                        kTimeout,       kContinue,       kCount};
constexpr ParameterSpec kOpenAssociators[] = {kInstanceName, kAssocClass,  kResultClass,  kRole,
                                              kResultRole,   kClassOrigin, kPropertyList, kFilterLanguage,
                                              kFilter,       kTimeout,     kContinue,     kCount};
constexpr ParameterSpec kOpenAssociatorPaths[] = {kInstanceName, kAssocClass,     kResultClass, kRole,
                                                  kResultRole,   kFilterLanguage, kFilter,      kTimeout,
                                                  kContinue,     kCount};
constexpr ParameterSpec kOpenReferences[] = {kInstanceName, kResultClass,    kRole,   kClassOrigin,
                                             kPropertyList, kFilterLanguage, kFilter, kTimeout,
                                             kContinue,     kCount};
constexpr ParameterSpec kOpenReferencePaths[] = {kInstanceName, kResultClass, kRole,     kFilterLanguage,
                                                 kFilter,       kTimeout,     kContinue, kCount};
constexpr ParameterSpec kPull[] = {kContext, kCount};
constexpr ParameterSpec kClose[] = {kContext};

IntrinsicResult refuseQuery(const OperationContext&, const Parameters& parameters) {
    throw core::CimError(core::CimStatus::QueryLanguageNotSupported,
                         "queries in " + parameters.text("QueryLanguage") + " are not supported");
}

/// Every operation that is served, with what a caller must be allowed. Handlers do not ask again. Whatever is
/// not here, such as changing classes, qualifiers or single properties, is answered as not supported.
constexpr std::array kOperations{
    Operation{"GetClass", Privilege::Read, kGetClass, getClass},
    Operation{"EnumerateClasses", Privilege::Read, kEnumerateClasses, enumerateClasses},
    Operation{"EnumerateClassNames", Privilege::Read, kEnumerateClassNames, enumerateClassNames},
    Operation{"GetInstance", Privilege::Read, kGetInstance, getInstance},
    Operation{"EnumerateInstances", Privilege::Read, kEnumerateInstances, enumerateInstances},
    Operation{"EnumerateInstanceNames", Privilege::Read, kEnumerateInstanceNames, enumerateInstanceNames},
    Operation{"DeleteInstance", Privilege::Administer, kDeleteInstance, deleteInstance},
    Operation{"CreateInstance", Privilege::Administer, kCreateInstance, createInstance},
    Operation{"ModifyInstance", Privilege::Administer, kModifyInstance, modifyInstance},
    Operation{"Associators", Privilege::Read, kAssociators, associators},
    Operation{"AssociatorNames", Privilege::Read, kAssociatorNames, associatorNames},
    Operation{"References", Privilege::Read, kReferences, references},
    Operation{"ReferenceNames", Privilege::Read, kReferenceNames, referenceNames},
    Operation{"GetQualifier", Privilege::Read, kGetQualifier, getQualifier},
    Operation{"EnumerateQualifiers", Privilege::Read, {}, enumerateQualifiers},
    Operation{"ExecQuery", Privilege::Read, kExecQuery, refuseQuery},
    Operation{"OpenEnumerateInstances", Privilege::Read, kOpenInstances, openEnumeration},
    Operation{"OpenEnumerateInstancePaths", Privilege::Read, kOpenPaths, openEnumeration},
    Operation{"OpenAssociatorInstances", Privilege::Read, kOpenAssociators, openEnumeration},
    Operation{"OpenAssociatorInstancePaths", Privilege::Read, kOpenAssociatorPaths, openEnumeration},
    Operation{"OpenReferenceInstances", Privilege::Read, kOpenReferences, openEnumeration},
    Operation{"OpenReferenceInstancePaths", Privilege::Read, kOpenReferencePaths, openEnumeration},
    Operation{"PullInstancesWithPath", Privilege::Read, kPull, pullEnumeration},
    Operation{"PullInstancePaths", Privilege::Read, kPull, pullEnumeration},
    Operation{"PullInstances", Privilege::Read, kPull, pullEnumeration},
    Operation{"CloseEnumeration", Privilege::Read, kClose, closeEnumeration},
};

/// Methods install firmware or may do so; they are one entry, since classes come with the providers.
constexpr Privilege kMethodPrivilege = Privilege::Administer;

}  // namespace

const Operation* findOperation(std::string_view name) {
    const auto* found = std::find_if(kOperations.begin(), kOperations.end(), [&](const Operation& operation) {
        return core::sameName(operation.name, name);
    });
    return found == kOperations.end() ? nullptr : found;
}

Privilege methodPrivilege() {
    return kMethodPrivilege;
}

}  // namespace host
