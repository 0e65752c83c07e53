// SPDX-License-Identifier: Apache-2.0
#include "Cli/ReturnValues.h"

#include <algorithm>
#include <array>
#include <string>

namespace cli {

namespace {

constexpr const char* ASK_LOG =
    "The system log has the details; for more of them, set TARVEL_SMASHv2_LOG_LEVEL=2 and try again.";

struct ReturnValueText {
    std::uint32_t value;
    const char* meaning;
    const char* advice;
};

constexpr std::array<ReturnValueText, 21> TEXTS = {{
    {0, "The image can be installed.", ""},
    {1, "The service does not support this method.",
     "Name the image the other way: as a file, or with --identity."},
    {2, "The service could not read or prepare the image.", "Check the file and try again."},
    {3, "The service did not answer in time.", "Try again."},
    {4, "The service could not start the update.", "Free some memory or end some processes, then try again."},
    {5, "The service did not accept the image, the adapter or an option.",
     "Check that the service can read the file and that it is a complete firmware image."},
    {6, "The adapter is in use.", "Wait for its update to end, then try again."},
    {4096, "The update was started.", ""},
    {4097, "The service does not install this image on this adapter.",
     "Check with \"quenxctl adapters\" that the adapter can be updated, and get the image made for its ids."},
    {4098, "The service cannot install unattended.", "Install with the adapter maker's own tool."},
    {4099, "The image is older than the installed firmware, or has other image types.",
     "Use a newer image, or install this one with --force."},
    {4100, "The service ran out of memory or into an unexpected error.", ASK_LOG},
    {4101, "The service has too little swap space.", "Free some memory and try again."},
    {4102, "The service cannot update the installed version to this one.",
     "Install a version in between first."},
    {4103, "The service has too little disk space.", "Free some disk space and try again."},
    {4104, "The image is for another operating system.", "Get the image for this system."},
    {4105, "The image needs other software that is not installed.", "Install that software first."},
    {4106, "The image has nothing that can be installed on this target.",
     "Leave out --types or name types that the image has, and name an Ethernet port as the target."},
    {4107, "The service cannot access the image.", "Copy the image to a place that the service can read."},
    {4108, "The service does not install on collections.", "Name one Ethernet port as the target."},
    {4109, "Another update is running.", "Wait for it to end, then try again."},
}};

}  // namespace

Explanation explainReturnValue(std::uint32_t value) {
    const auto at = std::find_if(TEXTS.begin(), TEXTS.end(),
                                 [value](const ReturnValueText& row) { return row.value == value; });
    if (at != TEXTS.end()) return {at->meaning, at->advice};
    return {"The service answered with the unknown value " + std::to_string(value) + ".", ASK_LOG};
}

}  // namespace cli
