// SPDX-License-Identifier: Apache-2.0
#include <utility>

#include "CimXml/Message.h"
#include "CimXml/Request.h"
#include "CimXml/ValueReader.h"

namespace cimxml {

namespace {

InstanceBody readInstanceBody(const pugi::xml_node& element) {
    return {requiredAttribute(element, "CLASSNAME"), std::nullopt};
}

InstanceBody readNamedInstance(const pugi::xml_node& element) {
    const std::vector<pugi::xml_node> parts = childElements(element);
    if (parts.size() != 2) refuseElement(element, "must hold INSTANCENAME and INSTANCE");
    expectElement(parts[0], "INSTANCENAME");
    expectElement(parts[1], "INSTANCE");
    InstanceBody body = readInstanceBody(parts[1]);
    body.path = readObject(parts[0], KeyTyping::Text).path;
    return body;
}

std::vector<std::string> readList(const pugi::xml_node& element) {
    bool hasNull = false;
    std::vector<std::string> texts = readTexts(element, hasNull);
    if (hasNull) refuseElement(element, "holds a null");
    return texts;
}

ParameterValue readParameterValue(const pugi::xml_node& element) {
    // What kind of value a parameter takes is the operation's to check; here every kind is read.
    if (isElement(element, "VALUE")) return textOf(element);
    if (isElement(element, "VALUE.ARRAY")) return readList(element);
    if (isElement(element, "VALUE.REFERENCE")) return readReference(element, KeyTyping::Text);
    if (isElement(element, "INSTANCE")) return readInstanceBody(element);
    if (isElement(element, "VALUE.NAMEDINSTANCE")) return readNamedInstance(element);
    // Only operations that are refused whole take these, so a name stands for the rest.
    if (isElement(element, "CLASS") || isElement(element, "QUALIFIER.DECLARATION")) {
        return ClassName{requiredAttribute(element, "NAME")};
    }
    ObjectName object = readObject(element, KeyTyping::Text);
    if (object.isClass) return ClassName{object.path.getClassName()};
    return std::move(object.path);
}

IntrinsicCall readIntrinsicCall(const pugi::xml_node& element) {
    IntrinsicCall call;
    call.operation = requiredAttribute(element, "NAME");
    const std::vector<pugi::xml_node> children = childElements(element);
    if (children.empty()) refuseElement(element, "has no LOCALNAMESPACEPATH");
    call.namespaceName = readNamespace(children.front());
    for (std::size_t i = 1; i < children.size(); ++i) {
        expectElement(children[i], "IPARAMVALUE");
        Parameter& parameter = call.parameters.emplace_back();
        parameter.name = requiredAttribute(children[i], "NAME");
        // Some clients send each parameter and leave those empty that they do not use.
        if (childElements(children[i]).empty()) continue;
        parameter.value = readParameterValue(onlyChild(children[i]));
        if (auto* path = std::get_if<core::CimPath>(&parameter.value)) {
            path->completeNamespace(call.namespaceName);
        }
    }
    return call;
}

void completeReferences(RawValue& value, const std::string& namespaceName) {
    if (auto* path = std::get_if<core::CimPath>(&value.data)) path->completeNamespace(namespaceName);
    if (auto* paths = std::get_if<std::vector<core::CimPath>>(&value.data)) {
        for (core::CimPath& each : *paths)
            each.completeNamespace(namespaceName);
    }
}

MethodCall readMethodCall(const pugi::xml_node& element) {
    MethodCall call;
    call.method = requiredAttribute(element, "NAME");
    const std::vector<pugi::xml_node> children = childElements(element);
    if (children.empty()) refuseElement(element, "names no object");
    const pugi::xml_node& target = children.front();
    if (!isElement(target, "LOCALINSTANCEPATH") && !isElement(target, "LOCALCLASSPATH")) {
        refuseElement(target, "stands where LOCALINSTANCEPATH or LOCALCLASSPATH was expected");
    }
    ObjectName object = readObject(target, KeyTyping::Text);
    call.object = std::move(object.path);
    call.object.completeNamespace(call.object.getNamespace());
    call.isClass = object.isClass;
    // Keys and arguments stay texts where the message states no type: the declaration knows better.
    for (std::size_t i = 1; i < children.size(); ++i) {
        expectElement(children[i], "PARAMVALUE");
        RawArgument& argument = call.arguments.emplace_back();
        argument.name = requiredAttribute(children[i], "NAME");
        argument.value = readValue(children[i], "PARAMTYPE", KeyTyping::Text);
        completeReferences(argument.value, call.object.getNamespace());
    }
    return call;
}

}  // namespace

Request readRequest(std::string_view bytes) {
    pugi::xml_document document;
    Envelope envelope = openEnvelope(document, bytes, "SIMPLEREQ");
    Request request;
    request.messageId = std::move(envelope.messageId);
    if (isElement(envelope.content, "METHODCALL")) {
        request.call = readMethodCall(envelope.content);
    } else {
        expectElement(envelope.content, "IMETHODCALL");
        request.call = readIntrinsicCall(envelope.content);
    }
    return request;
}

}  // namespace cimxml
