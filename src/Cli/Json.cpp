// SPDX-License-Identifier: Apache-2.0
#include "Cli/Json.h"

namespace cli {

namespace {

struct ScalarToJson {
    core::CimType type;

    Json operator()(bool value) const { return value; }
    Json operator()(std::uint64_t value) const { return value; }
    Json operator()(std::int64_t value) const { return value; }
    Json operator()(double value) const { return value; }
    Json operator()(const std::string& value) const { return value; }
    Json operator()(const utils::Time& value) const { return core::scalarText(type, value); }
    Json operator()(const core::CimPath& value) const { return value.toString(); }
};

}  // namespace

Json toJson(const core::CimValue& value) {
    const ScalarToJson convert{value.type};
    if (const core::CimScalar* scalar = value.scalar()) return std::visit(convert, *scalar);
    const std::vector<core::CimScalar>* elements = value.elements();
    if (elements == nullptr) return nullptr;
    Json array = Json::array();
    for (const core::CimScalar& element : *elements)
        array.push_back(std::visit(convert, element));
    return array;
}

Json toJson(const core::InstanceValue& instance) {
    Json properties = Json::object();
    for (const core::PropertyValue& property : instance.properties) {
        properties[property.name] = toJson(property.value);
    }
    return {{"path", instance.path.toString()},
            {"class", instance.path.getClassName()},
            {"properties", std::move(properties)}};
}

Json toJson(const std::vector<Component>& components) {
    Json array = Json::array();
    for (const Component& component : components) {
        array.push_back({{"type", component.type}, {"version", component.version}});
    }
    return array;
}

Json toJson(const JobView& job) {
    const auto orNull = [](const std::string& text) { return text.empty() ? Json() : Json(text); };
    return {{"path", job.path.toString()},
            {"id", job.id},
            {"adapter", orNull(job.adapter)},
            {"startTime", job.start ? Json(core::scalarText(core::CimType::Datetime, *job.start)) : Json()},
            {"user", orNull(job.user)},
            {"state", job.state},
            {"stateName", jobStateName(job.state)},
            {"percentComplete", job.percent},
            {"errorCode", job.errorCode},
            {"errorDescription", job.errorDescription}};
}

void printJson(std::ostream& out, const Json& document) {
    out << document.dump(2, ' ', false, Json::error_handler_t::replace) << '\n';
}

}  // namespace cli
