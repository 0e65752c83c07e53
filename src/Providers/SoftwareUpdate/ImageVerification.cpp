// Whether an image may be installed on an adapter that nobody else services meanwhile: the static half of
// Quenx_ConcreteJob.
#include "Providers/SoftwareUpdate/AdapterClaim.h"
#include "Providers/SoftwareUpdate/ImageExamination.h"
#include "Providers/SoftwareUpdate/Quenx_ConcreteJob.h"
#include "Providers/SoftwareUpdate/UpdateExceptions.h"
#include "Providers/SoftwareUpdate/VerifyJobResult.h"
#include "Utils/Log.h"

std::vector<utils::FirmwareType> Quenx_ConcreteJob::getTargetTypes(
    std::vector<unsigned short>& installOptions, std::vector<std::string>& installOptionValues) {
    try {
        return requestedTypes(installOptions, installOptionValues);
    } catch (const utils::EInvalidParameter&) {
        m_servicedAdapter = std::string();
        throw;
    }
}

void Quenx_ConcreteJob::checkAndVerifyImage(std::string adapterName, std::string& uri,
                                            std::vector<unsigned short>& installOptions,
                                            std::vector<std::string>& installOptionValues,
                                            std::unique_ptr<std::uint8_t[]>& image, std::uint32_t& imageSize,
                                            std::vector<utils::FirmwareType>& imageTypes) {
    QUENX_DEBUG("Here");
    AdapterClaim claim(adapterName);
    try {
        PreparedImage prepared = examineImage(adapterName, uri, installOptions, installOptionValues);
        image = std::move(prepared.bytes);
        imageSize = prepared.size;
        imageTypes = std::move(prepared.types);
    } catch (const utils::Exception& failure) {
        if (isRefusal(failure)) claim.release();
        throw;
    }
    claim.leave();
}
