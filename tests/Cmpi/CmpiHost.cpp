// SPDX-License-Identifier: Apache-2.0
// An object manager in a process of its own: installs an image on the first port, follows the job to its end,
// and leaves. Arguments: the front's library, the policy, the providers' configuration, the image.
#include <chrono>
#include <iostream>
#include <thread>

#include "Cmpi/LoadedFront.h"
#include "Utils/Os/Linux/PolicyFile.h"
#include "Utils/Os/Linux/SMASHv2Config.h"

int main(int, char** argv) {
    utils::systemPolicyFile = argv[2];
    const utils::SMASHv2Config configuration(argv[3]);
    test::LoadedFront front(argv[1], test::Dialect::Sfcb);
    const core::MethodResult called =
        front.install(std::string("file://") + argv[4], front.first("Quenx_EthernetPort"));
    std::cout << "returned " << called.returnValue << std::endl;
    const auto job = *called.outputs.at(0).value.get<core::CimPath>();
    const auto state = [&] { return front.ask({"get", job}).instances.at(0).number("JobState"); };
    while (state() < 7)
        std::this_thread::sleep_for(std::chrono::milliseconds(20));
    std::cout << "ended with " << state() << std::endl;
    for (const char* className : {"CIM_SoftwareIdentity", "CIM_Dependency", "Quenx_RecordLog"})
        front.ask({"instances", core::CimPath(className, {})});
    front.ask({"delete", job});
    // What was deleted is still being destroyed for a moment, which may end between two of the answers.
    std::string answer;
    while ((answer = front.cleanup()).find("50") != std::string::npos)
        std::this_thread::sleep_for(std::chrono::milliseconds(20));
    std::cout << "then:" << answer << std::endl;
}
