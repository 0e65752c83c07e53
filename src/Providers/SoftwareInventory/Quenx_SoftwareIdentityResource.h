// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Providers/ClassObjects.h"
#include "Providers/Schema/CIM_SoftwareIdentityResource.h"
#include "Providers/Schema/ProviderInterfaces.h"
#include "Providers/SoftwareInventory/Firmware.h"

/// A firmware file in one of the configured directories.
class Quenx_SoftwareIdentityResource final : public CIM_SoftwareIdentityResource,
                                             public inventory::SoftwareIdentityResource {
  public:
    static constexpr core::CimClassInfo classInfo{"Quenx_SoftwareIdentityResource",
                                                  &CIM_SoftwareIdentityResource::classInfo};

    static constexpr bool kFollowsFromKey = true;

    explicit Quenx_SoftwareIdentityResource(inventory::FirmwareFile file);
    std::string getClassName() const override { return classInfo.name; }

    /// The file's path.
    virtual std::string getUniqId() const { return m_file.path; }
    virtual void refresh();

    std::string getFirmwareFileID() const override { return m_file.firmware.identifier; }
    /// Never percent-encoded: nothing decodes it.
    std::string getAccessInfo() const override { return "file://" + m_file.path; }

  private:
    const inventory::FirmwareFile m_file;
};

/// Serves a resource for each file.
class Quenx_SoftwareIdentityResourceClass
    : public CachedClass<Quenx_SoftwareIdentityResource, inventory::FirmwareFile> {
  public:
    explicit Quenx_SoftwareIdentityResourceClass(std::shared_ptr<inventory::FirmwareCatalog> catalog);
    core::InstanceList::Iterator getInstances() override;
    core::CimInstance* findInstance(const core::CimPath& path);

  private:
    KeyParts<inventory::FirmwareFile> readAll() const;

    const std::shared_ptr<inventory::FirmwareCatalog> m_catalog;
};
