// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <string_view>

#include "Utils/Export.h"

/// Why updates are refused, or fail. Every way in which that is told (JSON, the history, the audit trail, the
/// served log, docs/messages.md) takes it from the one table here.
namespace core {

/// A cause, by the number that stands for it outside. Numbers are never given to another cause, and one that
/// went is not used again: scripts and log searches know them.
enum class ReasonId : std::uint16_t {
    None = 0,  ///< nothing was refused, or nobody knows why

    // what was asked for
    ArgumentsWrong = 101,
    OptionsNotSupported = 102,
    ImageTypeUnknown = 103,
    TargetUnknown = 104,
    TargetOfOtherKind = 105,
    TargetWithoutAdapter = 106,
    SourceUnknown = 107,
    SourceNoIdentity = 108,
    SourceNoImage = 109,
    SourceWithoutFile = 110,
    SourceWithoutTypes = 111,
    LookUpFailed = 112,
    CollectionsNotSupported = 113,

    // the file
    UriInvalid = 201,
    FileMissing = 202,
    FileNotOpened = 203,
    FileNotRead = 204,
    FileTooLarge = 205,
    FileSystemSilent = 206,
    FileSystemSlow = 207,

    // the image and the adapter
    ImageDamaged = 301,
    ImageNotSupported = 302,
    ImageOlder = 303,
    OtherTypesForbidden = 304,
    OtherTypes = 305,
    ImageNotApplicable = 306,
    AdapterNotRead = 307,
    PreparationFailed = 308,

    // who has the adapter, and what the process has left
    AdapterUpdating = 401,
    AdapterHeldByCheck = 402,
    OtherAdapterUpdating = 403,
    OtherAdapterHeldByCheck = 404,
    WorkerNotStarted = 405,
    NoMemory = 406,
    NoMemoryToPrepare = 407,

    // what the policy does not let go on
    PolicyUnreadable = 501,
    NotAdministrator = 502,
    HistoryRequired = 503,

    // whether the image can be trusted
    OutsideImageDirectories = 601,
    LargerThanPolicy = 602,
    NotSigned = 603,
    SignatureWrong = 604,
    KeyUnknown = 605,
    CertificateNotValid = 606,
    ManifestForOtherImage = 607,
    ManifestDiffers = 608,
    ManifestForOtherDevice = 609,
    BelowLowestVersion = 610,
    NoVerifier = 611,
    KeysFolderBad = 612,
    ManifestBad = 613,

    // the flash
    FlashAdapterGone = 701,
    FlashImageBad = 702,
    FlashNotUpdatable = 703,
    FlashBrokeOff = 704,
    FlashBusy = 705,
    FlashFailed = 706,
    FlashWithoutEffect = 707,
    Interrupted = 710,
};

/// A row of the table.
struct Reason {
    ReasonId id;
    const char* text;    ///< what happened, in one sentence
    const char* advice;  ///< what to do
    /// What the method returns; nothing where it does not return, or an accepted update comes to nothing.
    std::optional<std::uint32_t> returnValue = {};
    /// What the job ends with.
    std::optional<std::uint32_t> errorCode = {};
};

/// All rows, by rising numbers.
QUENX_EXPORT std::span<const Reason> allReasons();
/// The row of a cause; null for None.
QUENX_EXPORT const Reason* findReason(ReasonId id);
/// "QX-0123", also of an id that another release has; empty for None.
QUENX_EXPORT std::string reasonCode(ReasonId id);
/// The other way round; None for another text.
QUENX_EXPORT ReasonId parseReasonCode(std::string_view code);
/// What a job's error code stands for, of which clients see the lower 16 bits: a failed write where no row
/// has it.
QUENX_EXPORT ReasonId reasonOfErrorCode(std::uint32_t errorCode);

}  // namespace core
