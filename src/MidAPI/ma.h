// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <span>
#include <string>
#include <vector>

#include "MidAPI/Activation.h"
#include "MidAPI/AdapterTypes.h"
#include "Utils/Export.h"
#include "Utils/FirmwareTypes.h"
#include "Utils/StringArray.h"

/// The adapter API. An adapter name addresses one port (one PCI function) of a card, as enumerateAdapters()
/// returns it. Every operation may be called from any thread at any time, also for a port that another
/// thread is writing to. Where an operation has no result to report a failure with, it throws AdapterError;
/// all of them throw it when the adapters cannot be had at all (an adapter description with a mistake in
/// it).
namespace ma {

class Backend;

/// Names of all adapter ports, in the backend's order; empty when there are none. Throws AdapterError where
/// they cannot be listed.
QUENX_EXPORT utils::StringArray enumerateAdapters();

/// PCI location of a port; its string is the full address text, domain included. Functions of one card have
/// equal domain, bus and device. Throws AdapterError for an unknown name; a port that has gone may still be
/// known.
QUENX_EXPORT utils::PCIAddr getPCIAddress(std::string adapter);

/// True when the port's firmware can be updated; false for an unknown name.
QUENX_EXPORT bool getCanBeUpdated(std::string adapter);

/// Fills `components` with the firmware components on the port, in ascending order of type; the version is
/// a number that orders them: of an option ROM its code revision (0 to 65535), of a driver's "1.2.3" its
/// fields as bytes (0x01020300), and 0 where the driver's text is no such version: AdapterInfo::versions has
/// that. What is of no image type is one entry of type 0. Returns false, and fills nothing, for an unknown
/// name. Throws AdapterError when the adapter cannot be read.
QUENX_EXPORT bool getAdapterFirmwareVersion(std::string adapter,
                                            std::vector<utils::FirmwareVersionInfo>& components);

/// Verifies an image file against a port and makes of it the image to write.
/// @param file,fileSize  the file's bytes; only read
/// @param output         the caller's buffer of `fileSize` bytes; may not overlap `file`
/// @param imageSize      the size of `output` on entry; the length of the image in it on return
/// @param types          in: the types to install, in any order, type 0 ignored, none for all in the file;
///                       out: those of the prepared image, ascending; unchanged where `output` is not filled
/// @return  a PrepareStatus. Output, size and types are filled for Prepared, ImageIsOlder and
///          ImageTypesDiffer, since a caller may insist on the latter two. The reason of any other status
///          than Prepared is logged.
///
/// Sets the port's progress to 0, unless it is being written to.
QUENX_EXPORT int prepareFlashImage(std::string adapter, const std::uint8_t* file, std::uint32_t fileSize,
                                   std::uint8_t* output, std::uint32_t* imageSize,
                                   std::vector<utils::FirmwareType>& types);

/// Writes a prepared image to a port: images of the types that were prepared replace those on the port, the
/// others stay; the whole device is one where no types were named and the backend does not know the format.
/// Blocks until done. Returns true and leaves 0 and an empty text on success, false with a WriteError (or an
/// errno value above those) and its text otherwise. The old firmware is then whole, or the text says what the
/// flash holds, as far as that is known.
QUENX_EXPORT bool writeFlashImage(std::string adapter, const std::uint8_t* image, std::uint32_t imageSize,
                                  std::uint32_t& errorCode, std::string& errorText);

/// Enables the boot images of these types in the port's capability word (bit n stands for type n) and
/// disables those that the flash no longer holds. Results as writeFlashImage().
QUENX_EXPORT bool updateCapabilityWord(std::string adapter, std::vector<utils::FirmwareType> types,
                                       std::uint32_t& errorCode, std::string& errorText);

/// Percentage, 0 to 100, of the update of this port: 0 from a prepare to its write, 100 once the new image is
/// in the flash for certain; AdapterInfo::resetNeeded says what it takes to run it. Never goes back during a
/// write, and stays until the next prepare. 0 for an unknown name.
QUENX_EXPORT std::uint16_t getFlashImageUpdateProgress(std::string adapter);

/// Sets the boot protocol of a port. Returns false when that failed.
QUENX_EXPORT bool setBootType(std::string adapter, BootType type);

/// The name of the backend that reaches the adapters, as AdapterInfo::backend has it.
QUENX_EXPORT std::string backendName();

/// Everything else that is known of a port. Throws AdapterError for an unknown name or an unreadable adapter.
QUENX_EXPORT AdapterInfo getAdapterInfo(std::string adapter);

/// What prepareFlashImage() would answer, in words, and what could not be checked; changes nothing. Nothing
/// from a backend whose images every caller can read, see assessImage(). Throws AdapterError for an unknown
/// name.
/// @param types  as there
QUENX_EXPORT std::optional<ImageVerdict> judgeImage(std::string adapter, std::span<const std::uint8_t> file,
                                                    const std::vector<utils::FirmwareType>& types);

/// What stands and falls with the card of a port; nothing where the backend cannot tell. Throws AdapterError
/// for an unknown name.
/// @param caller  the network address of who asks, whose connection may run over the card; empty for somebody
///                at the machine
QUENX_EXPORT CardUse getCardUse(std::string adapter, const std::string& caller);

/// Puts the firmware in force that is in the port's flash, which resets the card: never done but by this
/// call. Blocks until the card's interfaces are back, or have been waited for. Throws AdapterError for an
/// unknown name.
QUENX_EXPORT Activation activate(std::string adapter, const ActivationRequest& request);

/// Selects the backend: for programs that have options or settings for it. Throws AdapterError, which names
/// what is wrong (in a description also the line) and what would be right; the backend in use then stays.
/// Without this call the first operation selects one, as if nothing were said.
///
/// A backend or a description that is said counts; where neither is, the variables QUENX_BACKEND and
/// QUENX_ADAPTERS do, and an empty one is an error. Without a name, or with "auto", it is
///   1. the simulator, where a description is named; one that is missing or wrong is an error
///   2. the backend whose adapters the machine has
///   3. the simulator, where /etc/quenx-adapters.toml is installed
///   4. none of the machine's adapters: the list is empty
/// The simulated adapters keep their flash in QUENX_ADAPTER_STATE, or else in /var/lib/quenx/adapters.
QUENX_EXPORT void selectBackend(const BackendChoice& choice);

/// The folder in which the adapters keep what they are, where they are files; empty for real ones. Throws
/// AdapterError where there is no backend.
QUENX_EXPORT std::string stateFolder();

/// What the backend in use looked for and what it found: sentences for people. Empty when it does not tell.
QUENX_EXPORT std::string describeSearch();

/// Replaces the backend (for tests, and for embedders that bring their own); null goes back to the one that
/// the environment and the machine lead to. Operations that have begun end on the backend on which they
/// began. Returns the previous one, null when none was chosen yet.
QUENX_EXPORT std::shared_ptr<Backend> setBackend(std::shared_ptr<Backend> backend);

}  // namespace ma
