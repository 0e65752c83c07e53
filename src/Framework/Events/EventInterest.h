// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>
#include <vector>

#include "Utils/Export.h"

namespace core {

/// Somebody listens to the instances of a class and of its subclasses, as long as this lives. With the first
/// interest in a class that is served, its agents are told to enable its indications, with the end of the
/// last to disable them; events are made in between only. The agents must stay registered meanwhile. To be
/// made and ended on any thread, but not by a sink.
class QUENX_EXPORT EventInterest {
  public:
    /// CimError (invalid class) where no agent serves such a class; throws what an agent throws that does not
    /// enable its indications, and utils::Exception where the system has no thread. Nobody listens then.
    explicit EventInterest(const std::string& className);
    ~EventInterest();
    EventInterest(const EventInterest&) = delete;
    EventInterest& operator=(const EventInterest&) = delete;

  private:
    std::vector<std::string> m_classes;  ///< those that are served
};

}  // namespace core
