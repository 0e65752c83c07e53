// SPDX-License-Identifier: Apache-2.0
#include "Framework/Requests/Reasons.h"

#include <algorithm>

#include "Utils/Utils.h"

namespace core {

namespace {

using Id = ReasonId;

constexpr std::string_view kPrefix = "QX-";

// The return values of the methods that install. Here as numbers, since the framework knows no provider.
constexpr std::uint32_t kUnspecified = 2;
constexpr std::uint32_t kFailed = 4;
constexpr std::uint32_t kInvalid = 5;
constexpr std::uint32_t kInUse = 6;
constexpr std::uint32_t kUnsupported = 4097;
constexpr std::uint32_t kDowngrade = 4099;
constexpr std::uint32_t kNoMemory = 4100;
constexpr std::uint32_t kNotApplicable = 4106;
constexpr std::uint32_t kCollection = 4108;

constexpr Reason kReasons[] = {
    {Id::ArgumentsWrong, "An argument is missing, null or of another type than declared.",
     "Give every argument that the method declares, and either Target or Collection."},
    {Id::OptionsNotSupported, "InstallOptions lacks 5 (Update), or has one that is not supported.",
     "Give 5, and beside it only 3 (Force Installation); InstallFromURI takes 32768 (target types), too.",
     kInvalid},
    {Id::ImageTypeUnknown, "An image type among the options is not known.",
     "Name types that the image has; \"quenxctl check\" lists them.", kInvalid},
    {Id::TargetUnknown, "The target does not exist.", "\"quenxctl adapters\" lists the adapters.", kInvalid},
    {Id::TargetOfOtherKind, "The target is neither a port nor a card.",
     "Name an Ethernet port or its controller as the target.", kNotApplicable},
    {Id::TargetWithoutAdapter, "The target has no adapter that can be updated.",
     "\"quenxctl adapters\" lists those that can.", kInvalid},
    {Id::SourceUnknown, "The software identity that is to be installed does not exist.",
     "\"quenxctl identities\" lists those that can be installed.", kInvalid},
    {Id::SourceNoIdentity, "The source is no software identity.",
     "Name one that \"quenxctl identities\" lists.", kInvalid},
    {Id::SourceNoImage, "The software identity is no image, but firmware on an adapter.",
     "Name one that has a file; \"quenxctl identities\" shows which.", kInvalid},
    {Id::SourceWithoutFile, "The software identity has no file any more.",
     "Put its file back, or install from a file.", kInvalid},
    {Id::SourceWithoutTypes, "The software identity has no image types.",
     "Use another image: this one has nothing to install.", kInvalid},
    {Id::LookUpFailed, "Source or target could not be looked up.",
     "The system log may have the details. Try again.", kUnspecified},
    {Id::CollectionsNotSupported, "Collections are not supported.", "Name one Ethernet port as the target.",
     kCollection},

    {Id::UriInvalid, "The URI of the image is not valid, or of a scheme that is not supported.",
     "Write it as file:///directory/file.", kInvalid},
    {Id::FileMissing, "There is no such image file.",
     "Check the path; images are files on the machine of the service.", kInvalid},
    {Id::FileNotOpened, "The image file cannot be opened, or is no file.",
     "Make it readable for the service, and name a file.", kInvalid},
    {Id::FileNotRead, "The image file could not be read to its end.",
     "Check the medium and that nobody writes to the file, and try again.", kUnspecified},
    {Id::FileTooLarge, "The image file is larger than LargestImage in the configuration allows.",
     "Name a firmware image, or raise the limit.", kUnspecified},
    {Id::FileSystemSilent, "The file system of the image does not answer.", "Copy the image to a local disk.",
     kUnspecified},
    {Id::FileSystemSlow, "The file system of the image is too slow.", "Copy the image to a local disk.",
     kUnspecified},

    {Id::ImageDamaged, "The file is no complete firmware image.", "Name a complete firmware image.",
     kInvalid},
    {Id::ImageNotSupported, "The image is not for this adapter, or the adapter cannot be updated.",
     "Get the image that was made for the adapter's ids.", kUnsupported},
    {Id::ImageOlder, "The image is older than the installed firmware.",
     "Use a newer image, or install this one with --force.", kDowngrade},
    {Id::OtherTypesForbidden, "The image has other types than the adapter, which the configuration forbids.",
     "Use an image with the same types.", kDowngrade},
    {Id::OtherTypes, "The image has other types than the adapter.",
     "Use an image with the same types, or install this one with --force.", kDowngrade},
    {Id::ImageNotApplicable, "The image has nothing of what was asked for.",
     "Leave out the types, or name some that the image has.", kNotApplicable},
    {Id::AdapterNotRead, "The adapter's firmware cannot be read now.",
     "Look at the adapter with \"quenxctl adapters\", and try again.", kUnspecified},
    {Id::PreparationFailed, "The driver of the adapter failed over the image.",
     "The system log may have the details.", kUnspecified},

    {Id::AdapterUpdating, "The adapter is being updated.", "Wait for its update to end, then try again.",
     kInUse},
    {Id::AdapterHeldByCheck, "An earlier check has left the adapter claimed.",
     "Free it with \"quenxctl release\".", kInUse},
    {Id::OtherAdapterUpdating, "Another adapter is being updated.",
     "Wait for that update to end, then try again: one runs at a time.", kUnspecified},
    {Id::OtherAdapterHeldByCheck, "An earlier check has left another adapter claimed.",
     "Free it with \"quenxctl release\".", kUnspecified},
    {Id::WorkerNotStarted, "The thread that writes the flash could not be started.",
     "Free some memory or end some processes, then try again.", kFailed},
    {Id::NoMemory, "There was not enough memory.", "Free some memory, then try again.", kNoMemory},
    {Id::NoMemoryToPrepare, "There was not enough memory to prepare the update.",
     "Free some memory, then try again.", kUnspecified},

    {Id::PolicyUnreadable, "The policy of the machine cannot be obeyed.",
     "Mend the line that the message names."},
    {Id::NotAdministrator, "The user may only read.",
     "Use a name that may do this: an administrator of quenx-cimd, and where there is a policy one that it "
     "has."},
    {Id::HistoryRequired, "The policy requires a history of updates, and none can be written.",
     "Make its folder writable again, or set \"history\" in the policy to \"wanted\".", kUnspecified},

    {Id::OutsideImageDirectories, "The image lies outside the directories that the policy allows.",
     "Put it below one of \"image_directories\".", kUnsupported},
    {Id::LargerThanPolicy, "The image is larger than the policy allows.",
     "Name a firmware image, or raise \"largest_image\".", kUnsupported},
    {Id::NotSigned, "The image has no signature.", "Put its signature or its signed manifest beside it.",
     kUnsupported},
    {Id::SignatureWrong, "The signature does not verify.", "Get image and signature anew from their source.",
     kUnsupported},
    {Id::KeyUnknown, "The image is signed with a key that is not trusted.",
     "Put the signer's certificate into \"trust_keys\", if it is to be trusted.", kUnsupported},
    {Id::CertificateNotValid, "The signer's certificate was not valid when the image was signed.",
     "Have the image signed with a certificate that is valid.", kUnsupported},
    {Id::ManifestForOtherImage, "The manifest does not name this image.",
     "Put the manifest that was made for the image beside it.", kUnsupported},
    {Id::ManifestDiffers, "The manifest has another size or sum than the image.",
     "Get image and manifest anew from their source.", kUnsupported},
    {Id::ManifestForOtherDevice, "The manifest does not allow this device.",
     "Get the image that was made for the adapter's ids.", kUnsupported},
    {Id::BelowLowestVersion, "The version is below the lowest that is allowed.", "Use a newer image.",
     kUnsupported},
    {Id::NoVerifier, "The policy asks for signatures, and this program cannot verify any.",
     "Use quenxctl, quenx-cimd or libQuenx_Cmpi.so, with libQuenx_Trust.so installed.", kUnsupported},
    {Id::KeysFolderBad, "The folder of the trusted keys cannot be used.",
     "Make it and its files root's, and writable by nobody else.", kUnsupported},
    {Id::ManifestBad, "The signed manifest cannot be read.",
     "Have whoever signed it mend the line that the message names.", kUnsupported},

    {Id::FlashAdapterGone, "The adapter went before it was written to.",
     "Check that it is still in its slot and has its driver.", std::nullopt, 1},
    {Id::FlashImageBad, "The adapter did not take the image.", "Check the image, and install it again.",
     std::nullopt, 2},
    {Id::FlashNotUpdatable, "The adapter's firmware cannot be updated.",
     "\"quenxctl adapters\" shows which adapters can be updated.", std::nullopt, 3},
    {Id::FlashBrokeOff, "The flash broke off with an error of the driver.",
     "The system log may have the details. Look at the adapter, and install again.", std::nullopt, 4},
    {Id::FlashBusy, "Another process writes to the adapter, or has updated it meanwhile.",
     "Wait until it is done, then check the image again.", std::nullopt, 5},
    {Id::FlashFailed, "The adapter could not be written to.", "Mend what the text names, and install again.",
     std::nullopt, 6},
    {Id::FlashWithoutEffect, "The update ended without an error, but the adapter has other versions.",
     "Check the system log, then install again with --force."},
    {Id::Interrupted, "The process that wrote the flash ended during the update.",
     "Look at the adapter, and install again."},
};

}  // namespace

std::span<const Reason> allReasons() {
    return kReasons;
}

const Reason* findReason(ReasonId id) {
    const auto* found = std::ranges::find(kReasons, id, &Reason::id);
    return found == std::end(kReasons) ? nullptr : found;
}

std::string reasonCode(ReasonId id) {
    if (id == ReasonId::None) return "";
    return utils::formatStr("%.*s%04u", static_cast<int>(kPrefix.size()), kPrefix.data(),
                            static_cast<unsigned>(id));
}

ReasonId parseReasonCode(std::string_view code) {
    if (!code.starts_with(kPrefix)) return ReasonId::None;
    const auto number = utils::parseNumber<std::uint16_t>(code.substr(kPrefix.size()));
    return static_cast<ReasonId>(number.value_or(0));
}

ReasonId reasonOfErrorCode(std::uint32_t errorCode) {
    const std::optional<std::uint32_t> served = errorCode & 0xFFFF;
    const auto* found = std::ranges::find(kReasons, served, &Reason::errorCode);
    return found == std::end(kReasons) ? ReasonId::FlashFailed : found->id;
}

}  // namespace core
