// SPDX-License-Identifier: Apache-2.0
#include "Framework/Model/CimValue.h"
#include "Fuzz/Fuzz.h"

void fuzz(const std::string& text) {
    core::CimPath path(text);
    if (!path.isValid()) {
        require(path.toString() == text && !path.isSameObjectAs(path) && !path.isInstancePath());
        return;
    }
    // What is written is read back as the same path, and written the same.
    require(path.isSameObjectAs(path));
    const std::string written = path.toString();
    const core::CimPath again(written);
    require(again.isValid() && again.isSameObjectAs(path) && path.isSameObjectAs(again) &&
            again.toString() == written);
    require(again.getHost() == path.getHost() && again.getNamespace() == path.getNamespace());
    path.completeNamespace("/root/cimv2/");
    require(path.isSameObjectAs(again) && core::CimPath(path.toString()).isSameObjectAs(path));
}
