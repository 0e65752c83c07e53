// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>
#include <vector>

#include "Cli/Context.h"
#include "Cli/ExitStatus.h"

/// The verbs of the program. Each prints its result, as text or as one JSON document; what keeps it from its
/// work is thrown as Failure or core::CimError.
namespace cli {

ExitStatus showAdapters(Context& context);

struct InstallOrder {
    std::string target;
    std::string image;     ///< a path or a URI; empty with an identity
    std::string identity;  ///< empty with an image
    std::vector<std::string> types;
    bool force = false;
};
ExitStatus install(Context& context, const InstallOrder& order);

struct CheckOrder {
    std::string target;
    std::string file;  ///< a path or a URI; on a server one that the inventory offers. Empty with an identity
    std::string identity;            ///< empty with a file
    std::vector<std::string> types;  ///< with a file, and not on a server
    bool force = false;              ///< likewise
};
ExitStatus check(Context& context, const CheckOrder& order);

ExitStatus showIdentities(Context& context);

/// Both need a server: jobs of this program's own end with it.
ExitStatus showJobs(Context& context);
ExitStatus deleteJob(Context& context, const std::string& id);

struct InstancesOrder {
    std::string className;
    bool namesOnly = false;
};
ExitStatus showInstances(Context& context, const InstancesOrder& order);

struct AssociatorsOrder {
    std::string path;
    core::AssociationFilter filter;
    bool namesOnly = false;
};
ExitStatus showAssociators(Context& context, const AssociatorsOrder& order);

ExitStatus showMof(Context& context);
/// What to do about a class that is not served.
inline constexpr const char* ASK_MOF = "\"quenxctl mof\" prints the classes that are served.";

}  // namespace cli
