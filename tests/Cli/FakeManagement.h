#pragma once

#include <deque>
#include <map>
#include <sstream>
#include <string>
#include <vector>

#include "Cli/Context.h"
#include "Cli/Management.h"

namespace test {

/// A model made of tables: what each class enumerates, what each method answers, and how a job goes on.
class FakeManagement : public cli::Management {
  public:
    std::map<std::string, std::vector<core::InstanceValue>> instances;
    std::map<std::string, std::vector<core::InstanceValue>> associated;  ///< by path
    std::vector<core::InstanceValue> associatedAfterJob;  ///< what the port has then; none: as before
    core::MethodResult answer;
    std::deque<core::InstanceValue> jobStates;  ///< one for each look; the last one stays
    unsigned unanswered = 0;                    ///< so many looks get no answer

    std::string calledMethod;
    std::vector<core::Argument> arguments;

    std::vector<core::InstanceValue> enumerateInstances(const std::string& className) override;
    std::vector<core::CimPath> enumerateInstanceNames(const std::string& className) override;
    core::InstanceValue getInstance(const core::CimPath& path) override;
    std::vector<core::InstanceValue> associators(const core::CimPath& path,
                                                 const core::AssociationFilter& by) override;
    std::vector<core::CimPath> associatorNames(const core::CimPath&,
                                               const core::AssociationFilter&) override {
        return {};
    }
    core::MethodResult invokeMethod(const core::CimPath& path, const std::string& method,
                                    const std::vector<core::Argument>& given) override;
    void deleteInstance(const core::CimPath&) override {}
    std::vector<core::ClassDeclaration> classes() override { return {}; }
    bool runsJobs() const override { return true; }
    bool sharesFiles() const override { return true; }

    /// An argument of the last call as a person would read it; "absent" when it was not given.
    std::string argument(const std::string& name) const;
};

core::InstanceValue instance(const std::string& path, std::vector<core::PropertyValue> properties);
core::PropertyValue text(const std::string& name, const std::string& value);
core::PropertyValue texts(const std::string& name, const std::vector<std::string>& values);
core::PropertyValue number(const std::string& name, std::uint64_t value);

/// eth0 (1af4:1041, updatable) with IMG_PXE and IMG_UEFI in these versions, and eth3 that cannot be updated;
/// the service with its capabilities; a job that runs and completes.
void fillModel(FakeManagement& model, std::uint32_t pxe, std::uint32_t uefi);
/// What eth0 carries, for associatedAfterJob.
std::vector<core::InstanceValue> installed(std::uint32_t pxe, std::uint32_t uefi);
core::InstanceValue jobState(std::uint64_t state, std::uint64_t percent, std::uint64_t errorCode = 0,
                             const std::string& error = "");

/// Remembers what it is told, one word each: "start eth0", "50", "interrupted", "end 7".
class RecordingObserver : public cli::UpdateObserver {
  public:
    std::string events;

    void started(const std::string& adapter, std::uint64_t) override { add("start " + adapter); }
    void progressed(unsigned percent) override { add(std::to_string(percent)); }
    void interrupted() override { add("interrupted"); }
    void ended(const cli::JobView& job) override { add("end " + std::to_string(job.state)); }

  private:
    void add(const std::string& event) { events += (events.empty() ? "" : ", ") + event; }
};

/// A verb's surroundings over the fake model.
struct VerbRun {
    FakeManagement model;
    RecordingObserver observer;
    std::ostringstream out;
    std::ostringstream error;
    bool interrupted = false;
    cli::Context context{model, out, error, false, observer, {[] {}, [this] { return interrupted; }}};
};

}  // namespace test
