// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Providers/ClassObjects.h"
#include "Providers/Schema/CIM_SoftwareIdentity.h"
#include "Providers/Schema/InventoryInterfaces.h"
#include "Providers/SoftwareInventory/Firmware.h"

/// A firmware: one in a file that can be installed, or one component that an adapter carries.
///
/// The only version of the image format is a 16-bit code revision for each image. MajorVersion is the highest
/// of them; VersionString, and IdentityInfoValue beside IdentityInfoType "Quenx:IMG_...", have all.
class Quenx_SoftwareIdentity : public CIM_SoftwareIdentity, public inventory::SoftwareIdentity {
  public:
    static const core::CimClassInfo classInfo;

    explicit Quenx_SoftwareIdentity(inventory::Firmware firmware);
    std::string getClassName() const override;
    ~Quenx_SoftwareIdentity() override;

    virtual std::string getUniqId() const;
    virtual void refresh();

    std::string getIdentifier() const override;
    int getTypeCode() const override;
    utils::StringArray getTargetTypes() const override;

    /// The adapter on which the firmware is installed; empty for a file.
    const std::string& getAdapterName() const { return m_firmware.adapter; }

  private:
    void setVersions();
    void setKind();

    const inventory::Firmware m_firmware;
};

/// Serves an identity for each different firmware among the files, then one for each installed component.
class Quenx_SoftwareIdentityClass : public CachedClass<Quenx_SoftwareIdentity, inventory::Firmware> {
  public:
    explicit Quenx_SoftwareIdentityClass(std::shared_ptr<inventory::FirmwareCatalog> catalog);
    utils::SafeList<core::CimInstance*>::Iterator getInstances() override;

  private:
    const std::shared_ptr<inventory::FirmwareCatalog> m_catalog;
};
