// SPDX-License-Identifier: Apache-2.0
#include "Framework/Requests/AnswerMeter.h"

namespace core {

namespace {

thread_local AnswerMeter* currentMeter = nullptr;

/// What the text takes beside the object itself.
std::size_t heapOf(const std::string& text) {
    static const std::size_t kInside = std::string().capacity();
    return text.capacity() > kInside ? text.capacity() + 1 : 0;
}

std::size_t heapOf(const CimScalar& value);

std::size_t heapOf(const CimPath& path) {
    std::size_t bytes = heapOf(path.getHost()) + heapOf(path.getNamespace()) + heapOf(path.getClassName()) +
                        path.getKeys().capacity() * sizeof(CimKey);
    for (const CimKey& key : path.getKeys())
        bytes += heapOf(key.name) + heapOf(key.value);
    return bytes;
}

std::size_t heapOf(const CimScalar& value) {
    if (const auto* text = std::get_if<std::string>(&value)) return heapOf(*text);
    const auto* path = std::get_if<CimPath>(&value);
    return path == nullptr ? 0 : heapOf(*path);
}

std::size_t heapOf(const CimValue& value) {
    if (const CimScalar* scalar = value.scalar()) return heapOf(*scalar);
    const std::vector<CimScalar>* elements = value.elements();
    if (elements == nullptr) return 0;
    std::size_t bytes = elements->capacity() * sizeof(CimScalar);
    for (const CimScalar& element : *elements)
        bytes += heapOf(element);
    return bytes;
}

}  // namespace

std::size_t bytesOf(const CimPath& path) {
    return sizeof path + heapOf(path);
}

std::size_t bytesOf(const InstanceValue& instance) {
    std::size_t bytes =
        sizeof instance + heapOf(instance.path) + instance.properties.capacity() * sizeof(PropertyValue);
    for (const PropertyValue& property : instance.properties)
        bytes += heapOf(property.name) + heapOf(property.referenceClass) + heapOf(property.value);
    return bytes;
}

AnswerMeter::~AnswerMeter() = default;

AnswerMeter::Scope::Scope(AnswerMeter& meter) {
    currentMeter = &meter;
}

AnswerMeter::Scope::~Scope() {
    currentMeter = nullptr;
}

AnswerMeter* AnswerMeter::current() {
    return currentMeter;
}

}  // namespace core
