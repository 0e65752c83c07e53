// SPDX-License-Identifier: Apache-2.0
#include "Framework/Model/PropertyShape.h"

#include <algorithm>
#include <iterator>
#include <set>
#include <string>
#include <unordered_map>

#include "Framework/Model/CimProperty.h"
#include "Utils/Os/Linux/Thread.h"

namespace core {

namespace {

thread_local DeclarationRecorder* currentRecorder = nullptr;

PropertyShape findShape(const std::vector<CimProperty*>& properties) {
    PropertyShape shape;
    std::set<std::string> seen;
    for (std::size_t i = properties.size(); i-- > 0;) {
        if (seen.insert(foldName(properties[i]->getName())).second) shape.served.push_back(i);
    }
    std::reverse(shape.served.begin(), shape.served.end());
    std::copy_if(shape.served.begin(), shape.served.end(), std::back_inserter(shape.keys),
                 [&](std::size_t i) { return properties[i]->isKey(); });
    return shape;
}

/// What a shape depends on, as one text. Neither the class nor its name would do: two classes may add
/// properties of their own to one binding. Addresses would not do either, which another library may reuse
/// after an unload.
std::string signatureOf(const std::vector<CimProperty*>& properties) {
    std::string signature;
    signature.reserve(properties.size() * 24);
    for (const CimProperty* property : properties) {
        signature += property->getName();
        signature += property->isKey() ? '!' : ';';
    }
    return signature;
}

class ShapeCache {
  public:
    std::shared_ptr<const PropertyShape> find(const std::vector<CimProperty*>& properties) {
        const std::string signature = signatureOf(properties);
        const utils::Mutex::AutoLocker lock(m_mutex);
        auto& shape = m_shapes[signature];
        if (shape == nullptr) shape = std::make_shared<const PropertyShape>(findShape(properties));
        return shape;
    }

  private:
    utils::Mutex m_mutex;
    std::unordered_map<std::string, std::shared_ptr<const PropertyShape>> m_shapes QUENX_GUARDED_BY(m_mutex);
};

}  // namespace

std::shared_ptr<const PropertyShape> shapeOf(const std::vector<CimProperty*>& properties) {
    static ShapeCache cache;
    return cache.find(properties);
}

void recordDeclaration(const CimClassInfo& info, std::size_t propertyCount) {
    if (currentRecorder != nullptr) currentRecorder->marks.emplace_back(&info, propertyCount);
}

DeclarationRecorder::DeclarationRecorder() : m_outer(currentRecorder) {
    currentRecorder = this;
}

DeclarationRecorder::~DeclarationRecorder() {
    currentRecorder = m_outer;
}

}  // namespace core
