// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <memory>
#include <string>

#include "Control/Sha256.h"
#include "Host/Settings.h"
#include "Utils/Os/Linux/Mutex.h"
#include "Utils/Os/Linux/linux.h"

namespace host {

class Upload;

/// The folder with the images that administrators have sent: one folder for each, named by the SHA-256 of the
/// image, so that no image takes the place of another, whatever their names. When there is no room for one
/// more, the oldest go. Thread-safe.
class Spool {
  public:
    /// How many images it holds at most.
    static constexpr std::size_t kMostImages = 256;

    /// Removes what uploads have left behind that were cut off by the end of a daemon. Nothing is made.
    /// @throws std::exception for a folder that others can change; what() names it
    explicit Spool(const UploadSettings& settings);
    Spool(const Spool&) = delete;
    Spool& operator=(const Spool&) = delete;

    /// The folder of the settings; empty for none.
    const std::string& folder() const { return m_settings.directory; }

    /// Makes room for a file, and takes it in.
    /// @param place  SUM + "/" + NAME, of the image that the file is, or belongs to
    /// @param size   in bytes
    /// @param sum    SHA-256 of the file
    /// @throws ControlRefusal
    std::unique_ptr<Upload> begin(const std::string& place, std::uint64_t size, const std::string& sum);

  private:
    friend class Upload;

    /// @throws ControlRefusal  where there would be no room for the file, whatever went
    void reserve(std::uint64_t size, const std::string& place) QUENX_REQUIRES(m_mutex);
    /// Removes the oldest images until all that is reserved has room. The folder of the place stays.
    void makeRoom(std::uint64_t size, const std::string& place) QUENX_REQUIRES(m_mutex);
    std::uint64_t replacedBy(std::uint64_t size, const std::string& place) const;
    void giveBack(std::uint64_t size);

    const UploadSettings m_settings;
    utils::Mutex m_mutex;
    std::uint64_t m_reserved QUENX_GUARDED_BY(m_mutex) = 0;  ///< for uploads under way
};

/// A file on its way into the spool. One that is not finished leaves nothing behind. Used from one thread.
class Upload {
  public:
    /// @param size  reserved in the spool, which has to outlive this
    /// @throws ControlRefusal
    Upload(Spool& spool, std::string place, std::uint64_t size, std::string sum);
    ~Upload();
    Upload(const Upload&) = delete;
    Upload& operator=(const Upload&) = delete;

    /// The next piece. @throws ControlRefusal when it cannot be stored
    void add(const char* bytes, std::size_t size);
    /// Puts the file in place, once it is whole and on the medium. Returns its path. @throws ControlRefusal
    std::string finish();

  private:
    Spool& m_spool;
    const std::string m_place;
    const std::uint64_t m_size;
    const std::string m_sum;
    control::Sha256 m_hash;
    std::string m_part;  ///< the file as long as it is not whole; empty when there is none
    os::Descriptor m_file;
    std::uint64_t m_got = 0;
};

}  // namespace host
