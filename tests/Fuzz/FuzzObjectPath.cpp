#include <string>

#include "Framework/Model/CimValue.h"
#include "Fuzz/Require.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const std::string text(data, data + size);
    core::CimPath path(text);
    if (!path.isValid()) {
        require(path.toString() == text && !path.names(path) && !path.isInstancePath());
        return 0;
    }
    // What is written is read back as the same path, and written the same.
    require(path.names(path));
    const std::string written = path.toString();
    const core::CimPath again(written);
    require(again.isValid() && again.names(path) && path.names(again) && again.toString() == written);
    require(again.getHost() == path.getHost() && again.getNamespace() == path.getNamespace());
    path.completeNamespace("/root/cimv2/");
    require(path.names(again) && core::CimPath(path.toString()).names(path));
    return 0;
}
