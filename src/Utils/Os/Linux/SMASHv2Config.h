// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <chrono>
#include <cstdint>
#include <istream>
#include <memory>
#include <string>

#include "Utils/Export.h"
#include "Utils/Os/Linux/Mutex.h"
#include "Utils/Singleton.h"
#include "Utils/StringArray.h"

/// The keys and defaults of the configuration, and the registry-style paths that platforms with a registry
/// use.
QUENX_EXPORT extern const char* const SMASHv2_BASE_REG_PATH;
QUENX_EXPORT extern const char* const SMASHv2_NAMESPACE_KEY;
QUENX_EXPORT extern const char* const SMASHv2_DEFAUL_NAMESPACE;
QUENX_EXPORT extern const char* const SMASHv2_SEMAPHORE_TIMEOUT_KEY;
QUENX_EXPORT extern const char* const VANTEX_REG_PATH;
QUENX_EXPORT extern const char* const SMASHv2_CUSTOMIZATION_KEY;
QUENX_EXPORT extern const char* const SMASHv2_FWFILE_PATH_KEY;
/// The OEM customisation values that forbid downgrades.
QUENX_EXPORT extern const std::int32_t m_OEMCustomizationValues[1];

namespace utils {

/// Bounds for reading an image.
struct ImageLimits {
    std::chrono::seconds silence{30};  ///< the longest wait for its file system to answer
    std::uint32_t largest = 0;         ///< bytes; 0 for no bound
};

/// The settings of /etc/quenx-cimprovider.conf. Every getter reads the file again, so an edited file takes
/// effect at the next query. A setting that is missing or malformed keeps the value last read; the list of
/// directories is built anew each time. Any thread may query; a file that cannot be read is not an error.
///
/// `AutoSingleton<SMASHv2Config>::getInstance()` gives the current one. One constructed with another path is
/// current while it lives.
class QUENX_EXPORT SMASHv2Config : public AutoSingleton<SMASHv2Config> {
  public:
    /// Sets the defaults; does not read the file.
    explicit SMASHv2Config(std::string path);

    ~SMASHv2Config() override;
    /// The CIM namespace, which begins with "root".
    virtual std::string getNamespace();
    virtual std::uint32_t getLockerTimeout();
    /// False once the file has shown a customisation that forbids downgrades, for the life of this object.
    virtual bool isDowngradeEnabled();
    /// The directories of firmware files, each one existing, in file order.
    virtual StringArray getFirmwareFilesPaths();
    /// Reads the file. Never throws.
    virtual void initialize();

    /// True if a call that would keep the adapter claim that it took gives it back (key
    /// ReleaseClaimAfterCheck, 0 or 1): CheckSoftwareIdentity, the registry's verifyOrCreateNewJob() without
    /// `create`, and a failure that is not a refusal.
    bool getReleaseClaimAfterCheck();

    /// How images are read (keys ImageReadTimeout, whole seconds, 1 to 86400, and LargestImage, bytes).
    ImageLimits getImageLimits();
    /// Gives ImageReadTimeout another value for as long as the file has none, instead of 30 seconds.
    void setDefaultImageReadTimeout(std::chrono::seconds silence);

    /// Where a front puts images that its clients send, one folder for each; empty for nowhere. The inventory
    /// looks there, too. No key sets it: the front does.
    void setUploadDirectory(std::string path);
    std::string getUploadDirectory();

    static const char* GetSingletonName() { return "SMASHv2Config"; }
    static std::unique_ptr<SMASHv2Config> CreateSingleton();

  private:
    /// What only this system knows. Read apart, since a look at these must not change what others keep, nor
    /// wait for the directories of firmware files.
    struct OwnSettings {
        bool releaseClaimAfterCheck = false;
        ImageLimits imageLimits;
    };

    void takeSetting(const std::string& key, std::istream& words, StringArray& directories)
        QUENX_REQUIRES(m_mutex);
    OwnSettings readOwnSettings();
    void takeOwnSetting(const std::string& key, const std::string& word) QUENX_REQUIRES(m_ownMutex);

    Mutex m_mutex;
    std::uint16_t m_oemCustomization QUENX_GUARDED_BY(m_mutex) = 0;
    const std::string m_path;
    std::string m_namespace QUENX_GUARDED_BY(m_mutex);
    std::uint32_t m_lockerTimeout QUENX_GUARDED_BY(m_mutex) = 300000;
    bool m_downgradeBlocked QUENX_GUARDED_BY(m_mutex) = false;
    StringArray m_firmwarePaths QUENX_GUARDED_BY(m_mutex);
    Mutex m_ownMutex;
    OwnSettings m_own QUENX_GUARDED_BY(m_ownMutex);
    std::string m_uploadDirectory QUENX_GUARDED_BY(m_ownMutex);
};

extern template class Singleton<SMASHv2Config>;
extern template class AutoSingleton<SMASHv2Config>;

}  // namespace utils
