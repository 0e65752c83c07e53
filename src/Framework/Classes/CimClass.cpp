#include "Framework/Classes/CimClass.h"

namespace core {

CimClass::CimClass() = default;

utils::SafeList<CimInstance*>::Iterator CimClass::getInstances() {
    using List = utils::SafeList<CimInstance*>;
    return List::Iterator(std::make_unique<List::SimpleIteratorImplementation>(nullptr));
}

void CimClass::createInstance(CimInstance*) {}

void CimClass::enableIndications() {}

void CimClass::disableIndications() {}

CimClass::~CimClass() = default;

}  // namespace core
