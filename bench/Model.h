// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <dlfcn.h>

#include <cstddef>
#include <string>
#include <vector>

#include "InstantAdapters.h"
#include "Providers/SoftwareUpdate/Quenx_ConcreteJobClass.h"
#include "Providers/SoftwareUpdate/SoftwareUpdateAgent.h"

namespace bench {

/// Both providers, ports, and jobs that are spread over them.
class Model {
  public:
    Model(std::size_t ports, std::size_t jobs, JobStateVal state = JobStateNew, std::size_t images = 1)
        : m_adapters(ports, images) {
        std::string uri = m_adapters.imageUri();
        std::vector<std::uint16_t> options = {5};
        std::vector<std::string> values;
        auto* registry = static_cast<Quenx_ConcreteJobClass*>(
            utils::Singleton<ConcreteJobFactory>::getInstance()->getCimClass());
        for (std::size_t i = 0; i < jobs; ++i) {
            Quenx_ConcreteJob::m_servicedAdapter = std::string();
            auto* job = new Quenx_ConcreteJob(InstantAdapters::portName(i % ports), static_cast<int>(i), uri,
                                              options, values);
            registry->addJob(job);
            if (state != JobStateNew) job->setJobState(state);
        }
        Quenx_ConcreteJob::m_servicedAdapter = std::string();
    }
    ~Model() { dlclose(m_inventory); }
    Model(const Model&) = delete;
    Model& operator=(const Model&) = delete;

    const std::string& imageUri() const { return m_adapters.imageUri(); }

  private:
    InstantAdapters m_adapters;
    void* m_inventory = dlopen(QUENX_INVENTORY_LIBRARY, RTLD_NOW | RTLD_LOCAL);
    core::SoftwareUpdateAgent m_agent;
};

}  // namespace bench
