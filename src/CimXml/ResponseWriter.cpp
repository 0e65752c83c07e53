// SPDX-License-Identifier: Apache-2.0
#include <concepts>
#include <numeric>

#include "CimXml/ElementCodec.h"
#include "CimXml/Response.h"
#include "Framework/Requests/AnswerMeter.h"

namespace cimxml {

namespace {

using ClassOrigins = std::map<std::string, std::string>;

const ClassOrigins* originsOf(const Origins* origins, const std::string& className) {
    // A list may hold instances of several classes, so there is a table for each.
    if (origins == nullptr) return nullptr;
    const auto found = origins->find(core::foldName(className));
    return found == origins->end() ? nullptr : &found->second;
}

void writeProperty(XmlWriter& writer, const core::PropertyValue& property, const ClassOrigins* origins) {
    const std::string_view element = propertyElement(property.value.type, property.value.isArray);
    startProperty(writer, property.name, property.value.type, property.value.isArray);
    if (element == "PROPERTY.REFERENCE" && !property.referenceClass.empty())
        writer.attribute("REFERENCECLASS", property.referenceClass);
    if (origins != nullptr) {
        const auto found = origins->find(core::foldName(property.name));
        if (found != origins->end()) writer.attribute("CLASSORIGIN", found->second);
    }
    writer.content();
    writeValue(writer, property.value);
    writer.end(element);
}

/// INSTANCE. Null properties are written as elements without a value; class origins where they are known.
void writeInstance(XmlWriter& writer, const core::InstanceValue& instance, const Origins* origins) {
    const std::string& className = instance.path.getClassName();
    const ClassOrigins* known = originsOf(origins, className);
    writer.start("INSTANCE").attribute("CLASSNAME", className).content();
    for (const core::PropertyValue& property : instance.properties)
        writeProperty(writer, property, known);
    writer.end("INSTANCE");
}

/// Writes the objects of one result, each in the element of its kind.
struct ResultWriter {
    XmlWriter& writer;
    const IntrinsicResult& result;
    const std::string& host;

    void write(const core::InstanceValue& instance) const {
        const bool hasPath = result.kind != ResultKind::Instance;
        if (hasPath) writer.open(resultElement(result.kind));
        if (hasPath) writePath(instance.path);
        writeInstance(writer, instance, result.origins.get());
        if (hasPath) writer.end(resultElement(result.kind));
    }

    void write(const core::CimPath& path) const {
        const bool isObjectPath = result.kind == ResultKind::ObjectPaths;
        if (isObjectPath) writer.open("OBJECTPATH");
        writePath(path);
        if (isObjectPath) writer.end("OBJECTPATH");
    }

    void write(const core::ClassDeclaration& declaration) const { writeClass(writer, declaration); }
    void write(const std::string& className) const { writeClassName(writer, className); }
    void write(const core::QualifierDeclaration& declaration) const {
        writeQualifierDeclaration(writer, declaration);
    }

  private:
    /// Only an enumeration answers for one namespace and host, which the client knows already.
    void writePath(const core::CimPath& path) const {
        if (result.kind == ResultKind::NamedInstances || result.kind == ResultKind::InstanceNames) {
            writeInstanceName(writer, path);
        } else {
            writeInstancePath(writer, path, host);
        }
    }
};

/// Writes what is inside IMETHODRESPONSE or METHODRESPONSE.
struct ContentWriter {
    XmlWriter& writer;
    const Response& response;
    const std::function<void()>& wrote;

    void operator()(const ErrorResult& error) const {
        writer.start("ERROR").attribute("CODE", std::to_string(static_cast<int>(error.status)));
        writer.attribute("DESCRIPTION", error.description).empty();
    }
    /// Takes the objects out of a result that is not constant.
    template <class Result>
    requires std::same_as<std::remove_const_t<Result>, IntrinsicResult>
    void operator()(Result& result) const {
        // A void operation has no IRETURNVALUE and an empty list has an empty one: clients tell them apart.
        if (result.kind != ResultKind::Nothing) {
            writer.open("IRETURNVALUE");
            writeAll(result, result.instances);
            writeAll(result, result.paths);
            writeAll(result, result.classes);
            writeAll(result, result.classNames);
            writeAll(result, result.qualifiers);
            writer.end("IRETURNVALUE");
        }
        writeOutputs(result.outputs);
    }
    void operator()(const core::MethodResult& result) const {
        // Clients expect RETURNVALUE first and with its type.
        writer.start("RETURNVALUE").attribute("PARAMTYPE", core::typeName(result.returnType)).content();
        writer.open("VALUE").raw(std::to_string(result.returnValue)).end("VALUE").end("RETURNVALUE");
        writeOutputs(result.outputs);
    }

  private:
    template <class Objects>
    void writeAll(const IntrinsicResult& result, Objects& objects) const {
        for (auto& object : objects) {
            if constexpr (std::is_const_v<Objects>) {
                ResultWriter{writer, result, response.host}.write(object);
            } else {
                const auto taken = std::move(object);
                ResultWriter{writer, result, response.host}.write(taken);
            }
            wrote();
        }
    }

    void writeOutputs(const std::vector<core::Argument>& outputs) const {
        for (const core::Argument& output : outputs) {
            // There are clients that crash on a PARAMVALUE without a value.
            if (!output.value.isNull()) writeArgument(writer, output);
        }
    }
};

template <class AnyResponse>
std::string write(AnyResponse& response, const std::function<void(std::size_t)>& grows) {
    std::string out;
    XmlWriter writer(out);
    const std::function<void()> wrote = [&] {
        if (grows) grows(out.capacity());
    };
    const std::string_view element = response.isMethod ? "METHODRESPONSE" : "IMETHODRESPONSE";
    startEnvelope(writer, response.messageId, "SIMPLERSP");
    writer.start(element).attribute("NAME", response.name).content();
    std::visit(ContentWriter{writer, response, wrote}, response.content);
    writer.end(element);
    endEnvelope(writer, "SIMPLERSP");
    return out;
}

}  // namespace

void startProperty(XmlWriter& writer, std::string_view name, core::CimType type, bool isArray) {
    const std::string_view element = propertyElement(type, isArray);
    writer.start(element).attribute("NAME", name);
    // PROPERTY.REFERENCE has no attribute TYPE (DSP0201 5.2.4.3), and there are readers that fail on one.
    if (element != "PROPERTY.REFERENCE") writer.attribute("TYPE", core::typeName(type));
}

void writeInstance(XmlWriter& writer, const core::InstanceValue& instance) {
    writeInstance(writer, instance, nullptr);
}

void writeNamedInstance(XmlWriter& writer, const core::InstanceValue& instance) {
    const IntrinsicResult result{.kind = ResultKind::NamedInstances};
    ResultWriter{writer, result, {}}.write(instance);
}

void startResult(XmlWriter& writer, std::string_view messageId, std::string_view operation) {
    startEnvelope(writer, messageId, "SIMPLERSP");
    writer.start("IMETHODRESPONSE").attribute("NAME", operation).content().open("IRETURNVALUE");
}

void endResult(XmlWriter& writer) {
    writer.end("IRETURNVALUE").end("IMETHODRESPONSE");
    endEnvelope(writer, "SIMPLERSP");
}

std::string writeResponse(const Response& response) {
    return write(response, {});
}

std::string writeResponse(Response&& response, const std::function<void(std::size_t)>& grows) {
    return write(response, grows);
}

std::size_t bytesOf(const IntrinsicResult& result) {
    std::size_t bytes = 0;
    for (const core::InstanceValue& instance : result.instances)
        bytes += core::bytesOf(instance);
    for (const core::CimPath& path : result.paths)
        bytes += core::bytesOf(path);
    return bytes;
}

std::size_t sizeOf(const Pieces& pieces) {
    return std::accumulate(pieces.begin(), pieces.end(), std::size_t{0},
                           [](std::size_t sum, const std::string& piece) { return sum + piece.size(); });
}

}  // namespace cimxml
