// SPDX-License-Identifier: Apache-2.0
#include "Framework/Model/CimInstance.h"

#include <algorithm>
#include <iterator>
#include <numeric>
#include <set>
#include <unordered_map>

#include "Framework/Model/CimClassInfo.h"
#include "Framework/Model/CimError.h"
#include "Framework/Model/CimPropertyList.h"
#include "Framework/Model/CimValue.h"
#include "Utils/Os/Linux/Mutex.h"

namespace core {

namespace {

thread_local DeclarationRecorder* currentRecorder = nullptr;

}  // namespace

/// Which of the registered properties are served, as indices in the order of declaration: of every name the
/// last one, since that is the most derived.
struct CimInstance::Shape {
    explicit Shape(const std::vector<CimProperty*>& properties) {
        for (CimProperty* property : properties)
            signature.emplace_back(property);
        std::set<std::string> seen;
        for (std::size_t i = properties.size(); i-- > 0;) {
            if (seen.insert(foldName(properties[i]->getName())).second) served.push_back(i);
        }
        std::reverse(served.begin(), served.end());
        std::copy_if(served.begin(), served.end(), std::back_inserter(keys),
                     [&](std::size_t i) { return properties[i]->isKey(); });
    }

    bool isOf(const std::vector<CimProperty*>& properties) const {
        return std::ranges::equal(signature, properties, [](const Signature& known, CimProperty* property) {
            return known.isOf(*property);
        });
    }

    struct Signature {
        explicit Signature(CimProperty* property)
            : name(property->getName()),
              type(property->getType()),
              isArray(property->isArray()),
              isKey(property->isKey()) {}

        bool isOf(CimProperty& property) const {
            return isKey == property.isKey() && type == property.getType() && isArray == property.isArray() &&
                   name == property.getName();
        }

        std::string name;
        CimType type;
        bool isArray;
        bool isKey;
    };

    /// What a shape depends on. Neither the class nor its name would do: two classes may add properties of
    /// their own to one binding. Addresses would not do either, which another library may reuse after an
    /// unload.
    std::vector<Signature> signature;
    std::vector<std::size_t> served;
    std::vector<std::size_t> keys;  ///< those of the served ones that are keys
};

/// Found once for all instances whose properties have the same names and keys in the same order: a machine
/// may have thousands of ports.
std::shared_ptr<const CimInstance::Shape> CimInstance::findShape(
    const std::vector<CimProperty*>& properties) {
    static utils::Mutex mutex;
    // By the number of properties, which few classes share: comparing costs less than a hash of all names.
    static std::unordered_map<std::size_t, std::vector<std::shared_ptr<const Shape>>> shapes;
    const utils::Mutex::AutoLocker lock(mutex);
    auto& candidates = shapes[properties.size()];
    for (const auto& shape : candidates)
        if (shape->isOf(properties)) return shape;
    return candidates.emplace_back(std::make_shared<const Shape>(properties));
}

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

// Found by name at each call: a method takes milliseconds, and instances have three at most.
unsigned int CimInstance::invokeMethod(std::string name, CimPropertyList& in, CimPropertyList& out,
                                       CimInstance*& result) {
    const auto method =
        std::ranges::find_if(m_methods, [&](const auto& entry) { return sameName(entry.first, name); });
    if (method == m_methods.end()) {
        throw CimError(CimStatus::MethodNotAvailable,
                       getClassName() + " does not implement the method " + name);
    }
    return (this->*(method->second))(in, out, result);
}

void CimInstance::setDeleted(bool deleted) {
    // Marked before it leaves the list: iterators that hold an older snapshot pass it over from here on.
    if (!deleted || m_deleted.exchange(true, std::memory_order_acq_rel)) return;
    if (const auto list = m_list.lock()) list->remove(this);
}

CimProperty* CimInstance::getPropertyByName(std::string_view name) const {
    // From the end, where the most derived class has registered its properties.
    const auto found =
        std::find_if(m_properties.rbegin(), m_properties.rend(),
                     [&](const CimProperty* property) { return sameName(property->getName(), name); });
    return found == m_properties.rend() ? nullptr : *found;
}

const CimInstance::Shape& CimInstance::shape() const {
    if (m_shape == nullptr) m_shape = findShape(m_properties);
    return *m_shape;
}

const std::vector<std::size_t>& CimInstance::keyIndices() const {
    return shape().keys;
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
    // Shared, since thousands of associations may refer to one instance.
    if (m_path == nullptr) m_path = std::make_shared<const CimPath>(CimPath::of(*this));
    return m_path;
}

void CimInstance::forgetPath() const {
    const RecursiveLocker lock(m_mutex);
    m_path.reset();
    m_hashOfKeys.reset();
    if (const auto list = m_list.lock()) list->keyChanged();
}

std::vector<CimProperty*> CimInstance::getKeys() const {
    const RecursiveLocker lock(m_mutex);
    return select(shape().keys);
}

void CimInstance::registerProperty(CimProperty* property) {
    const RecursiveLocker lock(m_mutex);
    if (m_properties.empty()) m_properties.reserve(8);  // as many as most associations have
    m_properties.push_back(property);
    // A base class's constructor may have looked at the shape already.
    m_shape.reset();
}

void CimInstance::unregisterProperty(CimProperty* property) noexcept {
    // Members go in the reverse order of their building, so this is the last one.
    const auto found = std::find(m_properties.rbegin(), m_properties.rend(), property);
    if (found != m_properties.rend()) m_properties.erase(std::next(found).base());
}

void CimInstance::declareClass(const CimClassInfo& info) {
    // Bases come first, so the last call is that of the most derived class.
    m_classInfo = &info;
    if (currentRecorder != nullptr) currentRecorder->marks.emplace_back(&info, m_properties.size());
}

DeclarationRecorder::DeclarationRecorder() : m_outer(currentRecorder) {
    currentRecorder = this;
}

DeclarationRecorder::~DeclarationRecorder() {
    currentRecorder = m_outer;
}

CimPath CimPath::of(const CimInstance& instance) {
    CimPath path(instance.getCreationClassName(), {});
    const RecursiveLocker lock(instance.getMutex());
    for (const CimProperty* property : instance.getKeys()) {
        const CimValue value = property->getValue();
        // A null key is written as an empty text: a path has to name every key of its class (DSP0004 8.2).
        path.m_keys.push_back(
            {property->getName(), value.scalar() ? *value.scalar() : CimScalar(std::string())});
    }
    return path;
}

namespace {

/// Of the value that CimPath::of() gives the key.
std::size_t hashOfKey(const CimProperty& key) {
    if (key.isNull() || key.isArray()) return hashOf(CimCell(std::string_view()));
    return key.cellCount() != 0 ? hashOf(key.cell(0)) : hashOf(*key.getValue().scalar());
}

}  // namespace

std::size_t CimInstance::hashOfKeys() const {
    const RecursiveLocker lock(m_mutex);
    if (!m_hashOfKeys) {
        const std::vector<std::size_t>& keys = keyIndices();
        m_hashOfKeys = std::accumulate(
            keys.begin(), keys.end(), std::size_t{0},
            [this](std::size_t sum, std::size_t key) { return sum + hashOfKey(*m_properties[key]); });
    }
    return *m_hashOfKeys;
}

namespace {

/// Under the instance's lock, so texts, as most keys are, are compared where they are.
bool holds(const CimProperty& property, const CimScalar& wanted) {
    const auto* text = std::get_if<std::string>(&wanted);
    if (text != nullptr && !property.isNull() && !property.isArray() && property.cellCount() != 0) {
        const CimCell cell = property.cell(0);
        if (const auto* held = std::get_if<std::string_view>(&cell)) return *held == *text;
    }
    const CimValue value = property.getValue();
    return value.scalar() != nullptr && sameValue(wanted, *value.scalar());
}

}  // namespace

bool CimPath::isSameObjectAs(const CimInstance& instance) const {
    if (!isValid() || !sameName(m_className, instance.getCreationClassName())) return false;
    const RecursiveLocker lock(instance.getMutex());
    const std::vector<std::size_t>& keys = instance.keyIndices();
    if (keys.size() != m_keys.size()) return false;
    return std::ranges::all_of(keys, [&](std::size_t index) {
        const CimProperty& property = *instance.getAllProperties()[index];
        const CimKey* key = findByName(m_keys, property.getName());
        return key != nullptr && holds(property, key->value);
    });
}

}  // namespace core
