// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareUpdate/ImageVerification.h"

#include <algorithm>
#include <cerrno>
#include <new>
#include <optional>
#include <span>

#include "Framework/Requests/PolicyDecision.h"
#include "MidAPI/ma.h"
#include "Providers/SoftwareUpdate/ImageTrust.h"
#include "Providers/SoftwareUpdate/MethodResults.h"
#include "Providers/SoftwareUpdate/Quenx_ConcreteJob.h"
#include "Providers/SoftwareUpdate/Quenx_SoftwareInstallationService.h"
#include "Providers/SoftwareUpdate/Quenx_SoftwareInstallationServiceCapabilities.h"
#include "Providers/SoftwareUpdate/UpdateReport.h"
#include "Utils/Log.h"
#include "Utils/Os/Linux/PatientReading.h"
#include "Utils/Os/Linux/SMASHv2Config.h"
#include "Utils/Os/Linux/linux.h"
#include "Utils/Uri.h"
#include "Utils/Utils.h"

namespace {

using Id = core::ReasonId;
using Buffer = std::unique_ptr<std::uint8_t[]>;

// The functions that the log names, whichever helper here writes the line: those who search it know the
// operations of the job.
constexpr const char* kGetTargetTypes = "getTargetTypes";
constexpr const char* kCheckAndVerifyImage = "checkAndVerifyImage";

/// The index of the name in the table of target types; logs the comparison.
std::optional<utils::FirmwareType> findTargetType(const std::string& name) {
    constexpr auto& kNames = Quenx_SoftwareInstallationServiceCapabilities::TargetTypesDescription;
    for (std::size_t index = 0; index < kNames.size(); ++index) {
        utils::formatDebugLog(__FILE__, kGetTargetTypes, __LINE__, "index: %d", static_cast<int>(index));
        utils::formatDebugLog(__FILE__, kGetTargetTypes, __LINE__, "compare with %s", kNames[index]);
        if (name == kNames[index]) return static_cast<utils::FirmwareType>(index);
    }
    return std::nullopt;
}

/// Appends the types that one value lists. An empty piece is the nameless type 0, and repeated types stay.
void appendTargetTypes(const std::string& value, std::vector<utils::FirmwareType>& types) {
    for (const std::string& piece : utils::split(value, InstallOption::kTargetTypeSeparator)) {
        const std::string name = utils::trim(piece);
        utils::formatDebugLog(__FILE__, kGetTargetTypes, __LINE__, "TeargetType: %s", name.c_str());
        const auto type = findTargetType(name);
        if (!type) {
            core::NotedCall::noteReason(Id::ImageTypeUnknown);
            throw utils::EInvalidParameter(utils::formatStr(
                "Invalid parameter detected for TargetTypes. %s is not recognized", name.c_str()));
        }
        types.push_back(*type);
        utils::formatDebugLog(__FILE__, kGetTargetTypes, __LINE__, "added new image type - #%d",
                              static_cast<int>(*type));
    }
}

}  // namespace

std::vector<utils::FirmwareType> getTargetTypes(const std::vector<std::uint16_t>& options,
                                                const std::vector<std::string>& values) {
    std::vector<utils::FirmwareType> types;
    QUENX_DEBUG("InstallOptions Size: %d", static_cast<int>(options.size()));
    QUENX_DEBUG("InstallOptionsValues Size: %d", static_cast<int>(values.size()));
    for (std::size_t i = 0; i < options.size(); ++i) {
        if (options[i] != InstallOption::TargetTypes) continue;
        QUENX_DEBUG("InstallOptions contains TargetTypes on %d position", static_cast<int>(i));
        // Values belong to options by their position, so no other value can stand in.
        if (i >= values.size()) {
            QUENX_DEBUG("No TargetTypes detected in values");
            return types;
        }
        QUENX_DEBUG("InstallOptionsValues contains %d elements", static_cast<int>(values.size()));
        appendTargetTypes(values[i], types);
        if (types.empty()) {
            QUENX_DEBUG("Values does not contain any TargetTypes");
            return types;
        }
    }
    for (const utils::FirmwareType type : types) {
        // One number for two places, as those who search the log know the line.
        QUENX_DEBUG("Return result[%d]=%%d", static_cast<int>(type));
    }
    if (types.empty()) QUENX_DEBUG("No TargetTypes defined");
    return types;
}

namespace {

/// The file of an image, on a file system that may not answer.
class ImageFile {
  public:
    explicit ImageFile(const std::string& uri) : m_uri(uri) {}

    /// Finds the local path that the URI names and reads the whole file: opened once, it cannot be exchanged
    /// meanwhile. One that is larger than allowed is opened, but not read.
    void read() {
        const utils::Uri parsed(m_uri);
        if (!parsed.IsUriSupported())
            throw EInvalidUri(utils::formatStr("URI: %s is invalid", m_uri.c_str()));
        m_path = parsed.getSourcePath();
        m_limits = utils::AutoSingleton<utils::SMASHv2Config>::getInstance()->getImageLimits();
        errno = 0;
        m_file = look();
        const bool isMissing = errno == ENOENT || errno == ENOTDIR;
        if (!parsed.IsUriAccesible(m_file)) {
            core::NotedCall::noteReason(isMissing ? Id::FileMissing : Id::FileNotOpened);
            throw EUriDoesNotExist(utils::formatStr("URI: %s is invalid", m_uri.c_str()));
        }
        requireAllowedPlace(m_uri, m_file);
    }

    /// The adapter API counts in 32 bits.
    std::uint32_t measure() const {
        const auto size = static_cast<std::uint32_t>(os::getFileSize(m_path, m_file));
        if (m_limits.largest != 0 && size > m_limits.largest) {
            QUENX_ERROR("%s has %u bytes, more than the %u that LargestImage allows", m_path.c_str(), size,
                        m_limits.largest);
            refuse(Id::FileTooLarge);
        }
        if (const std::int64_t most = largestAllowedImage(); most != 0 && m_file.size > most)
            refuseTooLarge(m_uri, m_file.size);
        return size;
    }

    Buffer takeBytes() {
        if (m_file.isWithoutMemory) throw std::bad_alloc();
        // The file may have shrunk since it was measured.
        if (m_file.count != static_cast<std::size_t>(m_file.size)) refuse(Id::FileNotRead);
        return std::move(m_file.bytes);
    }

    /// Of the file that was opened, where that is known.
    const std::string& path() const { return m_file.realPath.empty() ? m_path : m_file.realPath; }

  private:
    [[noreturn]] void refuse(Id reason) const {
        core::NotedCall::noteReason(reason);
        throw EImageReadError(utils::formatStr("Image read error: %s (%s)", m_uri.c_str(), m_path.c_str()));
    }
    os::FileLook look() const {
        constexpr std::uint32_t kLargest = INT32_MAX;
        os::Patience patience(m_limits.silence);
        try {
            std::optional<os::FileLook> found = os::lookAtFile(
                m_path, m_limits.largest != 0 ? std::min(m_limits.largest, kLargest) : kLargest, patience);
            if (found) return std::move(*found);
        } catch (const std::bad_alloc&) {
            // As Uri::IsUriAccesible() has it: a look that fails, for whatever reason, finds no file.
            return {};
        }
        if (patience.hungFiles != 0) {
            QUENX_ERROR("%s is not read: %u other files are on file systems that do not answer",
                        m_path.c_str(), patience.hungFiles);
        } else if (patience.isUsedUp) {
            QUENX_ERROR("%s is not read: its file system is too slow, with pauses of %d seconds in all",
                        m_path.c_str(), static_cast<int>(patience.total.count() / 1000));
        } else {
            QUENX_ERROR("%s is not read: its file system did not answer for %d seconds, now or earlier",
                        m_path.c_str(), static_cast<int>(m_limits.silence.count()));
        }
        refuse(patience.isUsedUp ? Id::FileSystemSlow : Id::FileSystemSilent);
    }

    const std::string& m_uri;
    utils::ImageLimits m_limits;
    std::string m_path;
    os::FileLook m_file;
};

[[noreturn]] void refuseWithoutForce(const std::string& uri) {
    throw EDowngradeDetected(
        utils::formatStr("Downgrade was detected for %s. Try to use FORCE_INSTALL option.", uri.c_str()));
}

/// An image with other types than the adapter has needs force, and a configuration that permits downgrades.
void judgeOtherTypes(bool force, const std::string& uri) {
    const bool enabled = utils::AutoSingleton<utils::SMASHv2Config>::getInstance()->isDowngradeEnabled();
    utils::formatDebugLog(__FILE__, kCheckAndVerifyImage, __LINE__, "DowngradeEnable: %d, ForceInstall: %d",
                          enabled, force);
    if (enabled && force) return;
    core::NotedCall::noteReason(enabled ? Id::OtherTypes : Id::OtherTypesForbidden);
    if (!enabled) {
        throw EDowngradeDetected(
            "The selected flash image cannot be used because it does not contain the same "
            "image types. Please select a flash file with matching image types.");
    }
    refuseWithoutForce(uri);
}

/// Throws the refusal that the adapter API's status stands for. Only 1 to 6 reject an image: a status that is
/// not known lets it through, as 0 does.
void judge(int status, bool force, const std::string& uri, const std::string& adapterName) {
    switch (status) {
        case ma::PrepareStatus::InvalidParameter:
            throw utils::EInvalidParameter(
                utils::formatStr("Invalid parameter detected for %s", uri.c_str()));
        case ma::PrepareStatus::ImageNotSupported:
            throw EAdapterNotSupported(utils::formatStr("Image %s is not supported for adapter %s",
                                                        uri.c_str(), adapterName.c_str()));
        case ma::PrepareStatus::ImageIsOlder:
            if (!force) refuseWithoutForce(uri);
            return;
        case ma::PrepareStatus::ImageTypesDiffer:
            judgeOtherTypes(force, uri);
            return;
        case ma::PrepareStatus::ImageNotApplicable:
            throw ENotApplicableForTarget(utils::formatStr("Not applicable for %s", uri.c_str()));
        case ma::PrepareStatus::UnspecifiedError:
            throw utils::EUnspecifiedError(
                utils::formatStr("Unspecified error occurred for %s", uri.c_str()));
        default:
            return;
    }
}

/// Has the adapter API prepare the image, and returns its status. Whatever it throws is its own failure.
int prepare(const std::string& adapterName, std::span<const std::uint8_t> source, std::uint8_t* image,
            std::uint32_t& imageSize, std::vector<utils::FirmwareType>& types) try {
    return ma::prepareFlashImage(adapterName, source.data(), static_cast<std::uint32_t>(source.size()), image,
                                 &imageSize, types);
} catch (...) {
    core::NotedCall::noteReason(Id::PreparationFailed);
    throw;
}

/// Reads, prepares and judges the image.
/// @param isAskingAdapter  set while the adapter API is at work
PreparedImage readAndPrepare(const UpdateOrder& order, bool& isAskingAdapter) {
    const auto& [adapterName, uri, options, values] = order;
    utils::formatDebugLog(__FILE__, kCheckAndVerifyImage, __LINE__, "Checking URI : '%s' ", uri.c_str());
    ImageFile file(uri);
    file.read();
    // The size that it had when it was opened: whatever happens to the file, buffers and preparation agree.
    const std::uint32_t fileSize = file.measure();
    const Buffer source = file.takeBytes();
    // Beside the preparation, which takes about as long. Ends before the bytes go, and before they are
    // judged.
    std::optional<UpdateReport::Examination> examination(
        std::in_place, std::span<const std::uint8_t>(source.get(), fileSize));
    // Before anything takes the bytes for an image: who made them is not known until then.
    requireTrust(uri, file.path(), {source.get(), fileSize}, adapterName);
    Buffer image = std::make_unique_for_overwrite<std::uint8_t[]>(fileSize);
    std::uint32_t imageSize = fileSize;
    std::vector<utils::FirmwareType> types = getTargetTypes(options, values);

    utils::formatDebugLog(__FILE__, kCheckAndVerifyImage, __LINE__, "Start preparing the image");
    isAskingAdapter = true;
    const int status = prepare(adapterName, std::span(source.get(), fileSize), image.get(), imageSize, types);
    isAskingAdapter = false;
    examination.reset();
    utils::formatDebugLog(__FILE__, kCheckAndVerifyImage, __LINE__, "Image prepared %d", status);
    const bool force =
        Quenx_SoftwareInstallationService::IsValueDefined(InstallOption::ForceInstallation, options);
    judge(status, force, uri, adapterName);
    return {std::move(image), imageSize, std::move(types)};
}

}  // namespace

PreparedImage examineImage(const UpdateOrder& order) {
    bool isAskingAdapter = false;
    return readAndPrepare(order, isAskingAdapter);
}

update::ImageTrust examineTrust(const std::string& uri) {
    if (core::PolicyDecision::policy().trust == utils::TrustRule::Off) return {};
    const core::NotedCall noted;
    try {
        ImageFile file(uri);
        file.read();
        const std::uint32_t size = file.measure();
        const Buffer bytes = file.takeBytes();
        requireTrust(uri, file.path(), {bytes.get(), size}, "");
        return {.isAsked = true, .key = noted.notes().signedBy};
    } catch (const utils::Exception& refusal) {
        return {.isAsked = true, .reason = noted.notes().reason, .why = withoutNames(refusal.what())};
    }
}

VerifiedImage verifyImage(const UpdateOrder& order) {
    utils::formatDebugLog(__FILE__, kCheckAndVerifyImage, __LINE__, "Here");
    AdapterClaim claim(Quenx_ConcreteJob::m_servicedAdapter);
    // Before the first look at the image: preparing it may take seconds, and the verdict holds only while
    // nobody else writes to the adapter.
    claim.take(order.adapterName);
    bool isAskingAdapter = false;
    try {
        PreparedImage image = readAndPrepare(order, isAskingAdapter);
        return {std::move(claim), std::move(image)};
    } catch (const utils::Exception& exception) {
        // A refusal says that nothing was done to the adapter, so others may have it. An exception of the
        // adapter API does not say so, even where it has the type of a refusal.
        if (isRefusal(exception) && !isAskingAdapter)
            claim.release();
        else
            claim.releaseIfConfigured();
        throw;
    } catch (...) {
        claim.releaseIfConfigured();
        throw;
    }
}

std::vector<utils::FirmwareType> Quenx_ConcreteJob::getTargetTypes(
    std::vector<std::uint16_t>& installOptions, std::vector<std::string>& installOptionValues) {
    try {
        return ::getTargetTypes(installOptions, installOptionValues);
    } catch (const utils::EInvalidParameter&) {
        AdapterClaim(m_servicedAdapter).release();
        throw;
    }
}

void Quenx_ConcreteJob::checkAndVerifyImage(std::string adapterName, std::string& uri,
                                            std::vector<std::uint16_t>& installOptions,
                                            std::vector<std::string>& installOptionValues,
                                            std::unique_ptr<std::uint8_t[]>& image, std::uint32_t& imageSize,
                                            std::vector<utils::FirmwareType>& imageTypes) {
    // The claim object goes and the adapter stays claimed: the caller answers for it.
    PreparedImage prepared = verifyImage({adapterName, uri, installOptions, installOptionValues}).image;
    image = std::move(prepared.bytes);
    imageSize = prepared.size;
    imageTypes = std::move(prepared.types);
}
