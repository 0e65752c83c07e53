#include "Cli/ReturnValues.h"

#include <algorithm>
#include <array>

namespace cli {

namespace {

constexpr const char* ASK_LOG =
    "The system log has the details; set TARVEL_SMASHv2_LOG_LEVEL=2 and try again to have more of them.";

constexpr std::array<ReturnValueText, 21> TEXTS = {{
    {0, "The image can be installed.", ""},
    {1, "The service does not support this method.", "Try the other way to name the image."},
    {2, "The image could not be read or prepared.", "Check the file and try again."},
    {3, "The service did not answer in time.", "Try again."},
    {4, "The update could not be started.", "Free some memory or end some processes, and try again."},
    {5, "The service cannot use the file, the target or an option.",
     "Check that the file exists, is readable and is a whole firmware image, and that the target is one that "
     "\"quenxctl adapters\" lists."},
    {6, "The adapter is in use.", "Wait for its update to end and try again."},
    {4096, "The image is in order and the update was started.", ""},
    {4097, "The image was not made for this adapter.",
     "Get the image for this adapter's ids; \"quenxctl adapters\" shows them."},
    {4098, "The service cannot install unattended.", "Install with the adapter maker's own tool."},
    {4099, "The image is older than what is installed, or holds other image types.",
     "Use a newer image, or --force to install it all the same."},
    {4100, "The service ran into an unexpected error, most likely for want of memory.", ASK_LOG},
    {4101, "The service has not enough swap space.", "Free some memory and try again."},
    {4102, "The service cannot go from the installed version to this one.",
     "Install a version between them."},
    {4103, "The service has not enough disk space.", "Free some disk space and try again."},
    {4104, "The image was made for another operating system.", "Get the image for this system."},
    {4105, "The image needs other software that is not installed.", "Install what it needs first."},
    {4106, "The image holds nothing that can be installed on this target.",
     "Leave out --types or name types that the file holds, and name an Ethernet port as the target."},
    {4107, "The service cannot reach the image.", "Copy the image to a place that the service can read."},
    {4108, "The service does not install on collections.", "Name one Ethernet port as the target."},
    {4109, "Another update is running.", "Wait for it to end and try again."},
}};

constexpr ReturnValueText UNKNOWN = {0xFFFFFFFF,
                                     "The service answered with a value that has no known meaning.", ASK_LOG};

}  // namespace

std::span<const ReturnValueText> returnValueTexts() {
    return TEXTS;
}

const ReturnValueText& returnValueText(std::uint32_t value) {
    const auto at = std::find_if(TEXTS.begin(), TEXTS.end(),
                                 [value](const ReturnValueText& row) { return row.value == value; });
    return at == TEXTS.end() ? UNKNOWN : *at;
}

}  // namespace cli
