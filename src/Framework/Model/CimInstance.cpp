// SPDX-License-Identifier: Apache-2.0
#include "Framework/Model/CimInstance.h"

#include <algorithm>

#include "Framework/Model/CimError.h"

namespace core {

CimInstance::CimInstance() = default;

CimInstance::~CimInstance() = default;

std::string CimInstance::getClassName() const {
    return m_classInfo == nullptr ? "" : m_classInfo->name;
}

std::string CimInstance::getCreationClassName() const {
    return getClassName();
}

unsigned int CimInstance::modifyInstance(CimPropertyList& requested) {
    const RecursiveLocker lock(m_mutex);
    // Everything is checked before anything is set: half a modification helps nobody.
    std::vector<std::pair<CimProperty*, CimProperty*>> changes;
    for (const auto& wanted : requested.getProperties()) {
        CimProperty* current = getPropertyByName(wanted->getName());
        if (current == nullptr) {
            throw CimError(CimStatus::NoSuchProperty,
                           getClassName() + " has no property " + wanted->getName());
        }
        if (current->isKey()) {
            throw CimError(CimStatus::InvalidParameter,
                           std::string(wanted->getName()) + " is a key and cannot be changed");
        }
        current->verify(wanted.get());
        changes.emplace_back(current, wanted.get());
    }
    for (const auto& [current, wanted] : changes)
        current->modify(wanted);
    return 0;
}

unsigned int CimInstance::invokeMethod(std::string name, CimPropertyList& in, CimPropertyList& out,
                                       CimInstance*& result) {
    const auto method = std::find_if(m_methods.begin(), m_methods.end(),
                                     [&](const auto& entry) { return sameName(entry.first, name); });
    if (method == m_methods.end()) {
        throw CimError(CimStatus::MethodNotAvailable,
                       getClassName() + " does not implement the method " + name);
    }
    return (this->*(method->second))(in, out, result);
}

void CimInstance::registerMethod(std::string name, Method method) {
    m_methods.emplace_back(std::move(name), method);
}

void CimInstance::setDeleted(bool deleted) {
    if (!deleted || m_deleted.exchange(true, std::memory_order_acq_rel)) return;
    if (const auto list = m_list.lock()) list->remove(this);
}

CimProperty* CimInstance::getPropertyByName(std::string_view name) const {
    const auto found =
        std::find_if(m_properties.rbegin(), m_properties.rend(),
                     [&](const CimProperty* property) { return sameName(property->getName(), name); });
    return found == m_properties.rend() ? nullptr : *found;
}

const PropertyShape& CimInstance::shape() const {
    if (m_shape == nullptr) m_shape = shapeOf(m_properties);
    return *m_shape;
}

std::vector<CimProperty*> CimInstance::select(const std::vector<std::size_t>& indices) const {
    std::vector<CimProperty*> selected;
    selected.reserve(indices.size());
    for (const std::size_t index : indices)
        selected.push_back(m_properties[index]);
    return selected;
}

std::vector<CimProperty*> CimInstance::getProperties() const {
    const RecursiveLocker lock(m_mutex);
    return select(shape().served);
}

std::shared_ptr<const CimPath> CimInstance::getPath() const {
    const RecursiveLocker lock(m_mutex);
    if (m_path == nullptr) m_path = std::make_shared<const CimPath>(CimPath::of(*this));
    return m_path;
}

void CimInstance::forgetPath() const {
    const RecursiveLocker lock(m_mutex);
    m_path.reset();
}

std::vector<CimProperty*> CimInstance::getKeys() const {
    const RecursiveLocker lock(m_mutex);
    return select(shape().keys);
}

void CimInstance::registerProperty(CimProperty* property) {
    const RecursiveLocker lock(m_mutex);
    if (m_properties.empty()) m_properties.reserve(8);  // as many as most associations have
    m_properties.push_back(property);
    m_shape.reset();
}

void CimInstance::unregisterProperty(CimProperty* property) noexcept {
    // Members go in the reverse order of their building, so this is the last one.
    const auto found = std::find(m_properties.rbegin(), m_properties.rend(), property);
    if (found != m_properties.rend()) m_properties.erase(std::next(found).base());
}

void CimInstance::declareClass(const CimClassInfo& info) {
    m_classInfo = &info;
    recordDeclaration(info, m_properties.size());
}

}  // namespace core
