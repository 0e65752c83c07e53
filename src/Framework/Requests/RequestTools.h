#pragma once

#include <exception>
#include <new>
#include <string>
#include <utility>

#include "Framework/Requests/CimRequests.h"

namespace core {

/// Runs the body of a request; whatever else it throws becomes CimError, with the provider's own text.
template <class Body>
auto answering(Body&& body) {
    try {
        return std::forward<Body>(body)();
    } catch (const CimError&) {
        throw;
    } catch (const std::bad_alloc&) {
        throw;
    } catch (const std::exception& failure) {
        throw CimError(CimStatus::Failed, failure.what());
    } catch (...) {
        throw CimError(CimStatus::Failed, "the provider failed without saying why");
    }
}

/// A copy of the instance, under its lock; paths in it are completed with the namespace.
InstanceValue readInstance(CimInstance& instance, CimPath path, const PropertyFilter& filter,
                           const std::string& namespaceName);

/// The instance that the path names. CimError: not found, or invalid class when nobody serves the class.
CimInstance& requireInstance(CimBroker& broker, CimPath& path);

}  // namespace core
