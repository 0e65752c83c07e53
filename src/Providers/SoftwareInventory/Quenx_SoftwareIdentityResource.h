// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Providers/ClassObjects.h"
#include "Providers/Schema/CIM_SoftwareIdentityResource.h"
#include "Providers/Schema/InventoryInterfaces.h"
#include "Providers/SoftwareInventory/Firmware.h"

/// A firmware file in one of the configured directories.
class Quenx_SoftwareIdentityResource : public CIM_SoftwareIdentityResource,
                                       public inventory::SoftwareIdentityResource {
  public:
    static const core::CimClassInfo classInfo;

    explicit Quenx_SoftwareIdentityResource(inventory::FirmwareFile file);
    std::string getClassName() const override;
    ~Quenx_SoftwareIdentityResource() override;

    /// The file's path.
    virtual std::string getUniqId() const;
    virtual void refresh();

    std::string getFirmwareFileID() const override;
    std::string getAccessInfo() const override;

  private:
    const inventory::FirmwareFile m_file;
};

/// Serves a resource for each file.
class Quenx_SoftwareIdentityResourceClass
    : public CachedClass<Quenx_SoftwareIdentityResource, inventory::FirmwareFile> {
  public:
    explicit Quenx_SoftwareIdentityResourceClass(std::shared_ptr<inventory::FirmwareCatalog> catalog);
    utils::SafeList<core::CimInstance*>::Iterator getInstances() override;

  private:
    const std::shared_ptr<inventory::FirmwareCatalog> m_catalog;
};
