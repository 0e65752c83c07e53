// SPDX-License-Identifier: Apache-2.0
#include "CimXml/ClassCodec.h"
#include "CimXml/Message.h"
#include "CimXml/Response.h"
#include "CimXml/ValueWriter.h"

namespace cimxml {

namespace {

using ClassOrigins = std::map<std::string, std::string>;

const ClassOrigins* originsOf(const Origins* origins, const std::string& className) {
    // A list may hold instances of several classes, so there is a table for each.
    if (origins == nullptr) return nullptr;
    const auto found = origins->find(core::foldName(className));
    return found == origins->end() ? nullptr : &found->second;
}

std::string_view elementOf(const core::CimValue& value) {
    if (value.isArray) return "PROPERTY.ARRAY";
    return value.type == core::CimType::Reference ? "PROPERTY.REFERENCE" : "PROPERTY";
}

void writeProperty(XmlWriter& writer, const core::PropertyValue& property, const ClassOrigins* origins) {
    const std::string_view element = elementOf(property.value);
    writer.start(element).attribute("NAME", property.name);
    // PROPERTY.REFERENCE has no attribute TYPE, and there are readers that fail on an unknown attribute.
    if (element == "PROPERTY.REFERENCE") {
        if (!property.referenceClass.empty()) writer.attribute("REFERENCECLASS", property.referenceClass);
    } else {
        writer.attribute("TYPE", core::typeName(property.value.type));
    }
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

/// Writes IRETURNVALUE of one result.
class ReturnValueWriter {
  public:
    ReturnValueWriter(XmlWriter& writer, const IntrinsicResult& result, const std::string& host)
        : m_writer(writer), m_result(result), m_host(host) {}

    void write() const {
        // A void operation has no IRETURNVALUE and an empty list has an empty one: clients tell them apart.
        if (m_result.kind == ResultKind::Nothing) return;
        m_writer.open("IRETURNVALUE");
        for (const core::InstanceValue& instance : m_result.instances)
            writeOne(instance);
        for (const core::CimPath& path : m_result.paths)
            writeOne(path);
        for (const core::ClassDeclaration& declaration : m_result.classes)
            writeClass(m_writer, declaration);
        for (const std::string& name : m_result.classNames) {
            m_writer.start("CLASSNAME").attribute("NAME", name).empty();
        }
        for (const core::QualifierDeclaration& declaration : m_result.qualifiers) {
            writeQualifierDeclaration(m_writer, declaration);
        }
        m_writer.end("IRETURNVALUE");
    }

  private:
    void writeOne(const core::InstanceValue& instance) const {
        const std::string_view wrapper = wrapperOfInstance();
        if (!wrapper.empty()) {
            m_writer.open(wrapper);
            // Only an enumeration answers for one namespace and host, which the client knows already.
            if (m_result.kind == ResultKind::NamedInstances) {
                writeInstanceName(m_writer, instance.path);
            } else {
                writeInstancePath(m_writer, instance.path, m_host);
            }
        }
        writeInstance(m_writer, instance, m_result.origins.get());
        if (!wrapper.empty()) m_writer.end(wrapper);
    }

    void writeOne(const core::CimPath& path) const {
        if (m_result.kind == ResultKind::InstanceNames) {
            writeInstanceName(m_writer, path);
            return;
        }
        const bool wrapped = m_result.kind == ResultKind::ObjectPaths;
        if (wrapped) m_writer.open("OBJECTPATH");
        writeInstancePath(m_writer, path, m_host);
        if (wrapped) m_writer.end("OBJECTPATH");
    }

    std::string_view wrapperOfInstance() const {
        switch (m_result.kind) {
            case ResultKind::NamedInstances:
                return "VALUE.NAMEDINSTANCE";
            case ResultKind::ObjectsWithPath:
                return "VALUE.OBJECTWITHPATH";
            case ResultKind::InstancesWithPath:
                return "VALUE.INSTANCEWITHPATH";
            default:
                return "";
        }
    }

    XmlWriter& m_writer;
    const IntrinsicResult& m_result;
    const std::string& m_host;
};

/// Writes what is inside IMETHODRESPONSE or METHODRESPONSE.
struct ContentWriter {
    XmlWriter& writer;
    const Response& response;

    void operator()(const ErrorResult& error) const {
        writer.start("ERROR").attribute("CODE", std::to_string(static_cast<int>(error.status)));
        writer.attribute("DESCRIPTION", error.description).empty();
    }
    void operator()(const IntrinsicResult& result) const {
        ReturnValueWriter(writer, result, response.host).write();
        writeOutputs(result.outputs);
    }
    void operator()(const core::MethodResult& result) const {
        // Clients expect RETURNVALUE first and with its type.
        writer.start("RETURNVALUE").attribute("PARAMTYPE", core::typeName(result.returnType)).content();
        writer.open("VALUE").raw(std::to_string(result.returnValue)).end("VALUE").end("RETURNVALUE");
        writeOutputs(result.outputs);
    }

  private:
    void writeOutputs(const std::vector<core::Argument>& outputs) const {
        for (const core::Argument& output : outputs) {
            // There are clients that crash on a PARAMVALUE without a value.
            if (!output.value.isNull()) writeParamValue(writer, output);
        }
    }
};

}  // namespace

std::string writeResponse(const Response& response) {
    std::string out;
    XmlWriter writer(out);
    const std::string_view element = response.isMethod ? "METHODRESPONSE" : "IMETHODRESPONSE";
    startEnvelope(writer, response.messageId, "SIMPLERSP");
    writer.start(element).attribute("NAME", response.name).content();
    std::visit(ContentWriter{writer, response}, response.content);
    writer.end(element);
    endEnvelope(writer, "SIMPLERSP");
    return out;
}

}  // namespace cimxml
