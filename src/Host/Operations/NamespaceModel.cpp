#include "Host/Operations/NamespaceModel.h"

namespace host {

core::ClassChain NamespaceModel::findClass(const std::string& className) const {
    try {
        return getClass(className);
    } catch (const core::CimError& error) {
        if (error.status() != core::CimStatus::NotFound) throw;
        return {};
    }
}

core::ClassChain NamespaceModel::requireClass(const std::string& className) const {
    core::ClassChain chain = findClass(className);
    if (chain.empty()) {
        throw core::CimError(core::CimStatus::InvalidClass, "no class \"" + className + "\" in " + name());
    }
    return chain;
}

}  // namespace host
