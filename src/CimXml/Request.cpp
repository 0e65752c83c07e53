// SPDX-License-Identifier: Apache-2.0
#include "CimXml/Request.h"

#include <utility>

#include "CimXml/ElementCodec.h"

namespace cimxml {

namespace {

// Reading. Keys and arguments stay texts where the message states no type: the declaration knows better.

void readProperty(const pugi::xml_node& element, InstanceBody& body) {
    const bool isReference = isElement(element, "PROPERTY.REFERENCE");
    const bool isArray = isElement(element, "PROPERTY.ARRAY");
    if (!isReference && !isArray) expectElement(element, "PROPERTY");
    const auto type = isReference ? std::optional(core::CimType::Reference) : readType(element, "TYPE");
    core::PropertyValue& property = body.properties.emplace_back();
    property.name = requiredAttribute(element, "NAME");
    if (auto value = readValue(element, type, isArray, KeyTyping::Text)) {
        property.value = std::move(*value);
    } else if (body.mistypedProperty.empty()) {
        body.mistypedProperty = property.name;
    }
}

InstanceBody readInstanceBody(const pugi::xml_node& element) {
    InstanceBody body{requiredAttribute(element, "CLASSNAME"), std::nullopt};
    for (const pugi::xml_node& child : childElements(element))
        if (!isElement(child, "QUALIFIER")) readProperty(child, body);
    return body;
}

InstanceBody readNamedInstance(const pugi::xml_node& element) {
    const std::vector<pugi::xml_node> parts = childElements(element);
    if (parts.size() != 2) refuseElement(element, "must hold INSTANCENAME and INSTANCE");
    expectElement(parts[0], "INSTANCENAME");
    expectElement(parts[1], "INSTANCE");
    // A name without a namespace: a modification names its instance within the namespace of the call.
    InstanceBody body = readInstanceBody(parts[1]);
    body.path = readObject(parts[0], KeyTyping::Text).path;
    return body;
}

std::vector<std::string> readTexts(const pugi::xml_node& element) {
    std::vector<std::string> texts;
    for (const pugi::xml_node& child : childElements(element)) {
        expectElement(child, "VALUE");
        texts.push_back(textOf(child));
    }
    return texts;
}

/// Reads every kind of value: which one a parameter takes is the operation's to check.
ParameterValue readParameterValue(const pugi::xml_node& element) {
    if (isElement(element, "VALUE")) return textOf(element);
    if (isElement(element, "VALUE.ARRAY")) return readTexts(element);
    if (isElement(element, "VALUE.REFERENCE")) return readReference(element, KeyTyping::Text);
    if (isElement(element, "INSTANCE")) return readInstanceBody(element);
    if (isElement(element, "VALUE.NAMEDINSTANCE")) return readNamedInstance(element);
    // Only operations that are not supported take these, so a name stands for the rest.
    if (isElement(element, "CLASS") || isElement(element, "QUALIFIER.DECLARATION"))
        return ClassName{requiredAttribute(element, "NAME")};
    ObjectName object = readObject(element, KeyTyping::Text);
    if (object.isClass) return ClassName{object.path.getClassName()};
    return std::move(object.path);
}

/// Paths may leave out the namespace that the call names.
void completeNamespace(ParameterValue& value, const std::string& name) {
    if (auto* path = std::get_if<core::CimPath>(&value)) path->completeNamespace(name);
    auto* const body = std::get_if<InstanceBody>(&value);
    if (body == nullptr) return;
    if (body->path) body->path->completeNamespace(name);
    for (core::PropertyValue& property : body->properties)
        property.value.completeNamespace(name);
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
        completeNamespace(parameter.value, call.namespaceName);
    }
    return call;
}

void readArgument(const pugi::xml_node& element, MethodCall& call) {
    expectElement(element, "PARAMVALUE");
    core::Argument& argument = call.arguments.emplace_back();
    argument.name = requiredAttribute(element, "NAME");
    const auto type = readType(element, "PARAMTYPE");
    argument.isUntyped = !type;
    if (auto value = readValue(element, type, std::nullopt, KeyTyping::Text)) {
        argument.value = std::move(*value);
        argument.value.completeNamespace(call.object.getNamespace());
    } else if (call.mistypedArgument.empty()) {
        call.mistypedArgument = argument.name;
    }
}

MethodCall readMethodCall(const pugi::xml_node& element) {
    MethodCall call;
    call.method = requiredAttribute(element, "NAME");
    const std::vector<pugi::xml_node> children = childElements(element);
    if (children.empty()) refuseElement(element, "names no object");
    const pugi::xml_node& target = children.front();
    if (!isElement(target, "LOCALINSTANCEPATH") && !isElement(target, "LOCALCLASSPATH"))
        refuseElement(target, "stands where LOCALINSTANCEPATH or LOCALCLASSPATH was expected");
    call.object = readObject(target, KeyTyping::Text).path;
    // References among the keys may leave out the namespace that the path has.
    call.object.completeNamespace(call.object.getNamespace());
    for (std::size_t i = 1; i < children.size(); ++i)
        readArgument(children[i], call);
    return call;
}

// Writing.

/// Intrinsic parameters name classes and instances without a namespace of their own: the call has it.
struct ParameterWriter {
    XmlWriter& writer;

    void operator()(std::monostate) const {}
    void operator()(const std::string& text) const { writeText(writer, text); }
    void operator()(const std::vector<std::string>& texts) const {
        writer.open("VALUE.ARRAY");
        for (const std::string& text : texts)
            writeText(writer, text);
        writer.end("VALUE.ARRAY");
    }
    void operator()(const ClassName& name) const { writeClassName(writer, name.name); }
    void operator()(const core::CimPath& path) const { writeInstanceName(writer, path); }
    void operator()(const InstanceBody& body) const {
        if (body.path) writer.open("VALUE.NAMEDINSTANCE");
        if (body.path) writeInstanceName(writer, *body.path);
        writeInstance(writer, {core::CimPath(body.className, {}), body.properties});
        if (body.path) writer.end("VALUE.NAMEDINSTANCE");
    }
};

struct CallWriter {
    XmlWriter& writer;

    void operator()(const IntrinsicCall& call) const {
        writer.start("IMETHODCALL").attribute("NAME", call.operation).content();
        writeNamespace(writer, call.namespaceName);
        for (const Parameter& parameter : call.parameters) {
            writer.start("IPARAMVALUE").attribute("NAME", parameter.name).content();
            std::visit(ParameterWriter{writer}, parameter.value);
            writer.end("IPARAMVALUE");
        }
        writer.end("IMETHODCALL");
    }
    void operator()(const MethodCall& call) const {
        writer.start("METHODCALL").attribute("NAME", call.method).content();
        writeLocalPath(writer, call.object);
        for (const core::Argument& argument : call.arguments)
            writeArgument(writer, argument);
        writer.end("METHODCALL");
    }
};

}  // namespace

const std::string& Request::name() const {
    const auto* method = std::get_if<MethodCall>(&call);
    return method != nullptr ? method->method : std::get<IntrinsicCall>(call).operation;
}

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

std::string writeRequest(const Request& request) {
    std::string out;
    XmlWriter writer(out);
    startEnvelope(writer, request.messageId, "SIMPLEREQ");
    std::visit(CallWriter{writer}, request.call);
    endEnvelope(writer, "SIMPLEREQ");
    return out;
}

}  // namespace cimxml
