#include "CimXml/Request.h"

namespace cimxml {

namespace {

template <class T>
T heldAs(core::CimType type, const core::CimScalar& value) {
    if constexpr (std::is_same_v<T, core::CimPath>) {
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

const std::string& Request::name() const {
    const auto* method = std::get_if<MethodCall>(&call);
    return method != nullptr ? method->method : std::get<IntrinsicCall>(call).operation;
}

}  // namespace cimxml
