#include "Framework/Model/PropertyShape.h"

#include <algorithm>
#include <iterator>
#include <map>
#include <set>
#include <string>

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

/// Shapes by the class's name and not its address, which another library may reuse after an unload.
class ShapeCache {
  public:
    std::shared_ptr<const PropertyShape> find(const CimClassInfo& info,
                                              const std::vector<CimProperty*>& properties) {
        const Key key{info.name, properties.size()};
        const utils::Mutex::AutoLocker lock(m_mutex);
        auto& shape = m_shapes[key];
        if (shape == nullptr) shape = std::make_shared<const PropertyShape>(findShape(properties));
        return shape;
    }

  private:
    using Key = std::pair<std::string, std::size_t>;

    utils::Mutex m_mutex;
    std::map<Key, std::shared_ptr<const PropertyShape>> m_shapes QUENX_GUARDED_BY(m_mutex);
};

}  // namespace

std::shared_ptr<const PropertyShape> shapeOf(const CimClassInfo* info,
                                             const std::vector<CimProperty*>& properties) {
    static ShapeCache cache;
    if (info == nullptr) return std::make_shared<const PropertyShape>(findShape(properties));
    return cache.find(*info, properties);
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
