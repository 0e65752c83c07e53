// SPDX-License-Identifier: Apache-2.0
#include "CimXml/Message.h"
#include "CimXml/Request.h"
#include "CimXml/ValueWriter.h"

namespace cimxml {

namespace {

template <class T>
T heldAs(core::CimType type, const core::CimScalar& value) {
    if constexpr (std::is_same_v<T, core::CimPath>) {
        // A reference may also be held as the text that somebody typed.
        const auto* path = std::get_if<core::CimPath>(&value);
        return path != nullptr ? *path : core::CimPath(core::scalarText(type, value));
    } else {
        return core::scalarText(type, value);
    }
}

template <class T>
void fill(RawValue& raw, const core::CimValue& value) {
    if (const core::CimScalar* scalar = value.scalar()) {
        raw.data = heldAs<T>(value.type, *scalar);
    } else if (const std::vector<core::CimScalar>* elements = value.elements()) {
        std::vector<T> items;
        for (const core::CimScalar& element : *elements)
            items.push_back(heldAs<T>(value.type, element));
        raw.data = std::move(items);
    }
}

struct RawWriter {
    XmlWriter& writer;

    void operator()(std::monostate) const {}
    void operator()(const std::string& text) const { writer.open("VALUE").text(text).end("VALUE"); }
    void operator()(const core::CimPath& path) const { writeReference(writer, path); }
    void operator()(const std::vector<std::string>& texts) const { writeTexts(writer, texts); }
    void operator()(const std::vector<core::CimPath>& paths) const {
        writer.open("VALUE.REFARRAY");
        for (const core::CimPath& path : paths)
            writeReference(writer, path);
        writer.end("VALUE.REFARRAY");
    }
};

/// Intrinsic parameters name classes and instances without a namespace of their own.
struct ParameterWriter {
    XmlWriter& writer;

    void operator()(std::monostate) const {}
    void operator()(const std::string& text) const { RawWriter{writer}(text); }
    void operator()(const std::vector<std::string>& texts) const { RawWriter{writer}(texts); }
    void operator()(const ClassName& name) const {
        writer.start("CLASSNAME").attribute("NAME", name.name).empty();
    }
    void operator()(const core::CimPath& path) const { writeInstanceName(writer, path); }
    void operator()(const InstanceBody& body) const {
        if (body.path) writer.open("VALUE.NAMEDINSTANCE");
        if (body.path) writeInstanceName(writer, *body.path);
        writer.start("INSTANCE").attribute("CLASSNAME", body.className).content().end("INSTANCE");
        if (body.path) writer.end("VALUE.NAMEDINSTANCE");
    }
};

struct CallWriter {
    XmlWriter& writer;

    void operator()(const IntrinsicCall& call) const {
        // Intrinsic operations act on a namespace, so it stands in front and paths go without one.
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
        for (const RawArgument& argument : call.arguments) {
            writer.start("PARAMVALUE").attribute("NAME", argument.name);
            if (argument.value.type) writer.attribute("PARAMTYPE", core::typeName(*argument.value.type));
            writer.content();
            std::visit(RawWriter{writer}, argument.value.data);
            writer.end("PARAMVALUE");
        }
        writer.end("METHODCALL");
    }
};

}  // namespace

RawValue rawValueOf(const core::CimValue& value) {
    RawValue raw;
    raw.type = value.type;
    if (value.type == core::CimType::Reference) {
        fill<core::CimPath>(raw, value);
    } else {
        fill<std::string>(raw, value);
    }
    return raw;
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
