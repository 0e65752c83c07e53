// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <memory>
#include <string>
#include <vector>

struct gnutls_x509_crt_int;

namespace trust {

struct FreeCertificate {
    void operator()(gnutls_x509_crt_int* certificate) const;
};
using Certificate = std::unique_ptr<gnutls_x509_crt_int, FreeCertificate>;

/// A certificate that is trusted for what it signs itself: no chain is followed, and who issued it does not
/// matter.
struct Key {
    std::string name;  ///< of its file, without the ending
    Certificate certificate;
};

/// The certificates of a folder (*.pem, *.crt, *.der; PEM or DER, whatever the ending says), by the names of
/// their files. A file of PEM may have several. Other files are not looked at.
/// @throws Refusal  KeysFolderBad for a folder or a file that others could change, that cannot be read, or
///                  that is something else; for more than 256 files
std::vector<Key> readKeys(const std::string& folder);

}  // namespace trust
