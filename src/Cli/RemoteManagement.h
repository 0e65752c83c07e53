// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>
#include <vector>

#include "CimXml/Request.h"
#include "CimXml/Response.h"
#include "Cli/HttpClient.h"
#include "Cli/Management.h"

namespace cli {

/// The model of any WBEM server that serves these classes, over CIM-XML.
class RemoteManagement : public Management {
  public:
    RemoteManagement(const ServerUrl& url, const ServerSettings& settings);

    std::vector<core::InstanceValue> enumerateInstances(const std::string& className) override;
    std::vector<core::CimPath> enumerateInstanceNames(const std::string& className) override;
    core::InstanceValue getInstance(const core::CimPath& path) override;
    std::vector<core::InstanceValue> associators(const core::CimPath& path,
                                                 const core::AssociationFilter& by) override;
    std::vector<core::CimPath> associatorNames(const core::CimPath& path,
                                               const core::AssociationFilter& by) override;
    core::MethodResult invokeMethod(const core::CimPath& path, const std::string& method,
                                    const std::vector<core::Argument>& arguments) override;
    void deleteInstance(const core::CimPath& path) override;
    std::vector<core::ClassDeclaration> classes() override;
    bool runsJobs() const override { return false; }
    bool sharesFiles() const override { return isLoopback_; }

  private:
    cimxml::IntrinsicResult callIntrinsic(const std::string& operation,
                                          std::vector<cimxml::Parameter> parameters);
    /// Some operations answer with host and namespace, some with neither: all paths read as those in process.
    void complete(core::CimPath& path) const;
    /// Sends the call; a CIM error in the answer is thrown as core::CimError.
    cimxml::Response send(cimxml::Request request, const std::string& object);

    HttpClient client_;
    std::string namespace_;
    bool isLoopback_;
    unsigned messages_ = 0;
};

}  // namespace cli
