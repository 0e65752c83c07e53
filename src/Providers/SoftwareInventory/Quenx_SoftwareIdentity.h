// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Providers/ClassObjects.h"
#include "Providers/Schema/CIM_SoftwareIdentity.h"
#include "Providers/Schema/ProviderInterfaces.h"
#include "Providers/SoftwareInventory/Firmware.h"

/// A firmware: one in a file that can be installed, or one component that an adapter carries.
///
/// The only version of the image format is a 16-bit code revision for each image. MajorVersion is the highest
/// of them; VersionString, and IdentityInfoValue beside IdentityInfoType "Quenx:IMG_...", have all. Of an
/// installed component whose driver tells a text, VersionString is that text, and MajorVersion and those
/// below it are the numbers in it, if it is made of numbers; IdentityInfoValue has the number of its type.
class Quenx_SoftwareIdentity final : public CIM_SoftwareIdentity, public inventory::SoftwareIdentity {
  public:
    static constexpr core::CimClassInfo classInfo{"Quenx_SoftwareIdentity", &CIM_SoftwareIdentity::classInfo};

    static constexpr bool kFollowsFromKey = true;

    explicit Quenx_SoftwareIdentity(inventory::Firmware firmware);
    std::string getClassName() const override { return classInfo.name; }

    virtual std::string getUniqId() const { return m_firmware.identifier; }
    virtual void refresh();

    std::string getIdentifier() const override { return m_firmware.identifier; }
    int getTypeCode() const override { return m_firmware.typeCode; }
    utils::StringArray getTargetTypes() const override;

    /// The adapter on which the firmware is installed; empty for a file.
    const std::string& getAdapterName() const { return m_firmware.adapter; }
    /// True for what was written to the adapter and is in force only after a reset.
    bool isDormant() const { return m_firmware.waitsFor.has_value(); }

  private:
    void setVersions();
    void setToldVersion(const std::string& text);
    void setKind();

    const inventory::Firmware m_firmware;
};

/// Serves an identity for each different firmware among the files, then one for each installed component.
class Quenx_SoftwareIdentityClass : public CachedClass<Quenx_SoftwareIdentity, inventory::Firmware> {
  public:
    explicit Quenx_SoftwareIdentityClass(std::shared_ptr<inventory::FirmwareCatalog> catalog);
    core::InstanceList::Iterator getInstances() override;
    core::CimInstance* findInstance(const core::CimPath& path);

  private:
    KeyParts<inventory::Firmware> readAll() const;

    const std::shared_ptr<inventory::FirmwareCatalog> m_catalog;
};
