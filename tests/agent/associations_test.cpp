// The builders of associations: every row of their table, with good ends, known ends and missing ends.

#include <cstring>

#include "agent/associations.h"
#include "agent/instance_table.h"
#include "runtime/Meta_Class.h"
#include "tests/agent/expect_rows.h"

using namespace cimple;
using namespace nvrtest;
using testing::Contains;
using testing::ElementsAre;
using testing::IsEmpty;

namespace {

/// The words of a row, as a client of the log reads them.
struct Expected {
    Link link;
    const char* class_name;
    const char* trace;   // with "some text"; null: none
    const char* failure; // null: "Insert Failed : m_<class>_map"
    const char* missing; // null: the common words
};

constexpr const char* insert_failed = "Insert Failed";

const Expected table[] = {
    {Link::ComputerSystemConformsToProfile, "ComputerSystemConformsToProfile",
     "inside createComputerSystemConformsToProfile", nullptr, nullptr},
    {Link::RecordLogConformsToProfile, "RecordLogConformsToProfile",
     "Generating NVRHBA_RecordLogConformsToProfile (some text)", nullptr, nullptr},
    {Link::FCHBADriverParamServiceAffectsSystem, "FCHBADriverParamServiceAffectsSystem",
     "Generating FCHBASDriverParamServiceAffectsSystem (some text)", nullptr,
     "Unable to create instance of NVRHBA_FCHBADriverParamServiceAffectsSystem"},
    {Link::HostedFCHBADriverParamService, "HostedFCHBADriverParamService",
     "Generating HostedFCHBADriverParamService (some text)", nullptr,
     "Unable to create instance of NVRHBA_HostedFCHBADriverParamService"},
    {Link::FCHBAWWNServiceAffectsFCPort, "FCHBAWWNServiceAffectsFCPort",
     "createAssociationsAffectedAffectingElem_FCHBAWWNService_FCPort_FCHBAWWNServiceAffectsFCPort", insert_failed,
     nullptr},
    {Link::FCHBAWWNServiceAffectsSystem, "FCHBAWWNServiceAffectsSystem",
     "createAssociationsAffectedAffectingElem_FCHBAWWNService_ComputerSystem_FCHBAWWNServiceAffectsSystem",
     insert_failed, nullptr},
    {Link::HostedFCHBAWWNService, "HostedFCHBAWWNService",
     "ProviderAgent::createAssociationAntDep_ComputerSystem_FCHBAWWNService_HostedFCHBAWWNService", insert_failed,
     nullptr},
    {Link::BootBIOSServiceAffectsSystem, "BootBIOSServiceAffectsSystem", nullptr, insert_failed, nullptr},
    {Link::HostedBootBIOSService, "HostedBootBIOSService", nullptr, insert_failed, nullptr},
    {Link::HostedInstallationService, "HostedInstallationService",
     "Hosted Service, Norvane Firmware Installation Service: some text", insert_failed, nullptr},
    {Link::InstallServiceAffectsSystem, "InstallServiceAffectsSystem", "Install Service Affects System: some text",
     insert_failed, nullptr},
    {Link::InstallServiceConformsToProfile, "InstallServiceConformsToProfile", nullptr, insert_failed, nullptr},
    {Link::InstalledSoftwareIdentity, "InstalledSoftwareIdentity",
     "Generating NVRHBA_InstalledSoftwareIdentity (some text)", nullptr, nullptr},
    {Link::SoftwareConformsToProfile, "SoftwareConformsToProfile",
     "Generating NVRHBA_SoftwareConformsToProfile (some text)", nullptr, nullptr},
    {Link::PortControllerConformsToProfile, "PortControllerConformsToProfile",
     "Generating NVRHBA_PortControllerConformsToProfile (some text)", nullptr, nullptr},
    {Link::FCPortConformsToProfile, "FCPortConformsToProfile", "Generating NVRHBA_FCPortConformsToProfile (some text)",
     nullptr, nullptr},
    {Link::ProviderUseOfLog, "ProviderUseOfLog", nullptr, insert_failed, nullptr},
    {Link::RecordLogCapabilities, "RecordLogCapabilities", nullptr, insert_failed, nullptr},
    {Link::FCHBADriverParamServiceAffectsFCPort, "FCHBADriverParamServiceAffectsFCPort",
     "Generating FCHBASetDriverParamServiceAffectsFCPort (some text)", nullptr,
     "Unable to create instance of NVRHBA_FCHBADriverParamServiceAffectsFCPort"},
    {Link::BootBIOSServiceAffectsFCPort, "BootBIOSServiceAffectsFCPort", nullptr, insert_failed, nullptr},
    {Link::ElementCapabilities, "ElementCapabilities", nullptr, insert_failed, nullptr},
    {Link::InstallServiceAffectsFCPort, "InstallServiceAffectsFCPort", nullptr, insert_failed, nullptr},
    {Link::FCTagServiceAffectsPort, "FCTagServiceAffectsPort",
     "createAssoc_FCTagService_FCPort: Creating NVRHBA_FCTagServiceAffectsPort ",
     "Insert into m_NVRHBA_FCTagServiceAffectsPort_map Failed", nullptr},
    {Link::ElementSoftwareIdentity, "ElementSoftwareIdentity", "Generating NVRHBA_ElementSoftwareIdentity (some text)",
     "Insert Failed : m_NVRHBA_FCPortSoftwareIdentity_map", nullptr},
    {Link::ProviderSoftwareIdentity, "ProviderSoftwareIdentity",
     "Generating NVRHBA_ProviderSoftwareIdentity (some text)", nullptr, nullptr},
    {Link::FCTagElementSoftwareIdentity, "FCTagElementSoftwareIdentity", nullptr,
     "Insert Failed (CNA): m_NVRHBA_FCTagElementSoftwareIdentity_map", nullptr},
    {Link::PCIElementConformsToProfile, "PCIElementConformsToProfile", nullptr, nullptr,
     "Failed to create NVRHBA_PCIElementConformsToProfile"},
    {Link::SystemDevice, "SystemDevice", nullptr, nullptr, "Failed to create NVRHBA_SystemDevice"},
    {Link::TransceiverComponent, "TransceiverComponent", nullptr, "Insert Failed : m_Component_map", nullptr},
    {Link::ElementFlashImageSoftwareIdentity, "ElementFlashImageSoftwareIdentity", nullptr,
     "Insert Failed : m_NVRHBA_ElementFlashImageSoftwareIdentityInst_map ",
     "Failed to create ElementFlashImageSoftwareIdentityInst"},
    {Link::HostedDumpService, "HostedDumpService", nullptr, nullptr, "Failed to create NVRHBA_HostedDumpService"},
    {Link::DumpServiceAffectsElement, "DumpServiceAffectsElement", nullptr, nullptr,
     "Failed to create NVRHBA_DumpServiceAffectsElement"},
    {Link::ElementDumpData, "ElementDumpData", nullptr, nullptr, "Failed to create NVRHBA_ElementDumpData for fc port"},
    {Link::HostedResourcePool, "HostedResourcePool", nullptr, nullptr, "Failed to create HostedResourcePool"},
    {Link::VPortHostedDependency, "VPortHostedDependency", nullptr, nullptr, "Failed to create VPortHostedDependency"},
    {Link::ElementAllocatedFromPool, "ElementAllocatedFromPool", nullptr, nullptr,
     "Failed to create ElementAllocatedFromPool"},
    {Link::ServiceAvailableToElement, "ServiceAvailableToElement", nullptr,
     "Insert Failed : NVRHBA_ServiceAvailableToElement_map", nullptr},
    {Link::DiagElementSoftwareIdentity, "DiagElementSoftwareIdentity", nullptr,
     "Insert Failed : NVRHBA_DiagElementSoftwareIdentity_map", nullptr},
    {Link::DiagElementSettingData, "DiagElementSettingData", nullptr, "Insert Failed : NVRHBA_DiagElementSettingData",
     nullptr},
    {Link::DiagElementCapabilities, "DiagElementCapabilities",
     "NVRHBA_DiagElementCapabilities instance (NIC) is created", "Insert Failed : NVRHBA_FCHBAElementCapabilities_map",
     nullptr},
    {Link::JobElementSettingData, "JobElementSettingData", nullptr, "Insert Failed : NVRHBA_JobElementSettingData",
     nullptr},
    {Link::UseOfLog, "UseOfLog", nullptr, "Insert Failed : UseOfLog_map", nullptr},
    {Link::AvailableDiagnosticService, "AvailableDiagnosticService", nullptr,
     "Insert Failed : NVRHBA_AvailableDiagnosticService_map", nullptr},
    {Link::ServiceAffectsElement, "ServiceAffectsElement", nullptr, "Insert Failed : NVRHBA_ServiceAffectsElement_map",
     nullptr},
    {Link::DiagServiceConformsToProfile, "DiagServiceConformsToProfile", nullptr,
     "Insert failed : NVRHBA_ServiceConformsToProfile_map", nullptr},
    {Link::DiagHostedService, "DiagHostedService", nullptr, "Insert failed : NVRHBA_DiagHostedService_map", nullptr},
    {Link::OwningJobElement, "OwningJobElement", nullptr, "Insert Failed: NVRHBA_OwningJobElement",
     "Unable to create NVRHBA_OwningJobElement"},
    {Link::AffectedJobElement, "AffectedJobElement", nullptr, "Insert Failed: NVRHBA_AffectedJobElement",
     "Unable to create NVRHBA_AffectedJobElement"},
    {Link::LogManagesRecord, "LogManagesRecord", nullptr, "Insert Failed : NVRHBA_LogManagesRecord",
     "Failed to create NVRHBA_LogManagesRecord"},
    {Link::CorrespondingSettingDataRecord, "CorrespondingSettingDataRecord", nullptr,
     "Insert Failed : NVRHBA_CorrespondingSettingDataRecord", "Failed to create NVRHBA_CorrespondingSettingDataRecord"},
    {Link::RecordAppliesToElement, "RecordAppliesToElement", nullptr, "Insert Failed : RecordAppliesToElement",
     "Failed to create NVRHBA_RecordAppliesToElement"},
};

/// The words of a link; one that the table lacks has no word of its own.
Expected expected_of(Link link, const Meta_Class* meta_class)
{
    for (const Expected& row : table)
        if (row.link == link) return row;
    return {link, meta_class->name + std::strlen("NVRHBA_"), nullptr, nullptr, nullptr};
}

const char* name_space_of(Link link)
{
    if (link == Link::ProviderSoftwareIdentity) return "";
    return link == Link::ReferencedProfile || link == Link::BaseServerReferencedProfile ? "root/pg_interop"
                                                                                        : "root/norvane";
}

/// Of the class that the reference leads to, with a value in each text key.
Ref<Instance> make_end(const Meta_Class* association, const char* reference, const char* key)
{
    const Meta_Feature* feature = find_feature(association, reference, META_FLAG_REFERENCE);
    EXPECT_NE(feature, nullptr) << reference;
    Ref<Instance> made(create(as_reference(feature)->meta_class, true));
    for (std::size_t i = 0; i < made->meta_class->num_meta_features; i++) {
        const Meta_Feature* each = made->meta_class->meta_features[i];
        if (!(each->flags & META_FLAG_KEY) || !(each->flags & META_FLAG_PROPERTY)) continue;
        const Meta_Property* property = as_property(each);
        if (property->type != STRING) continue;
        *static_cast<String*>(feature_at(made.get(), property->offset)) = key;
        null_of(made.get(), property) = 0;
    }
    return made;
}

class Associations : public SimulatedHost {
protected:
    Associations()
    {
        EXPECT_EQ(load(), 0);
        plain(agent().m_NVRHBA_FCPort_map);
        agent().clearAdapterMaps();
        words();
    }
    ~Associations() override { unload(); }
};

} // namespace

TEST_F(Associations, EachTiesItsEndsOnceAndSaysSo)
{
    for (int i = 0; i < static_cast<int>(Link::count); i++) {
        const Link_Row& made_by = link_row(static_cast<Link>(i));
        Instance_Map& map = made_by.map(agent());
        const Expected row = expected_of(made_by.link, map.meta_class());
        SCOPED_TRACE(row.class_name);
        EXPECT_EQ(std::string("NVRHBA_") + row.class_name, map.meta_class()->name);
        const Ref<Instance> first = make_end(map.meta_class(), made_by.first, "first");
        const Ref<Instance> second = make_end(map.meta_class(), made_by.second, "second");
        words();

        const Instance* made = associate(agent(), row.link, first.get(), second.get(), "some text");
        ASSERT_NE(made, nullptr);
        EXPECT_STREQ(made->__name_space.c_str(), name_space_of(row.link));
        if (row.trace)
            EXPECT_THAT(words(), ElementsAre(row.trace));
        else
            EXPECT_THAT(words(), IsEmpty());
        const auto held = [&](const char* name) {
            return reference_of(made, as_reference(find_feature(made->meta_class, name, META_FLAG_REFERENCE)));
        };
        EXPECT_NE(held(made_by.first), first.get()) << "the association owns clones";
        EXPECT_TRUE(identical(held(made_by.first), first.get()));
        EXPECT_TRUE(identical(held(made_by.second), second.get()));

        EXPECT_EQ(associate(agent(), row.link, first.get(), second.get(), "some text"), nullptr);
        EXPECT_EQ(words().back(),
                  row.failure ? row.failure : std::string("Insert Failed : m_NVRHBA_") + row.class_name + "_map");
        EXPECT_EQ(map.size(), 1u);

        const char* missing = row.missing ? row.missing : "Could not create the instance of the Association class";
        EXPECT_EQ(associate(agent(), row.link, nullptr, second.get(), "some text"), nullptr);
        EXPECT_EQ(words().back(), missing);
        EXPECT_EQ(associate(agent(), row.link, first.get(), nullptr, "some text"), nullptr);
        EXPECT_EQ(words().back(), missing);
        EXPECT_EQ(map.size(), 1u);
    }
}

TEST_F(Associations, EveryRowNamesReferencesOfItsClass)
{
    for (int i = 0; i < static_cast<int>(Link::count); i++) {
        const Link_Row& row = link_row(static_cast<Link>(i));
        const Meta_Class* meta_class = row.map(agent()).meta_class();
        EXPECT_NE(find_feature(meta_class, row.first, META_FLAG_REFERENCE), nullptr) << meta_class->name;
        EXPECT_NE(find_feature(meta_class, row.second, META_FLAG_REFERENCE), nullptr) << meta_class->name;
    }
}

TEST_F(Associations, OutliveTheirEnds)
{
    const Meta_Class* meta_class = agent().m_NVRHBA_FCPortConformsToProfile_map.meta_class();
    Ref<Instance> profile = make_end(meta_class, "ConformantStandard", "profile");
    Ref<Instance> port = make_end(meta_class, "ManagedElement", "port");
    const Instance* made = associate(agent(), Link::FCPortConformsToProfile, profile.get(), port.get());
    profile.reset();
    port.reset();
    EXPECT_EQ(end(made, "ManagedElement", "DeviceID"), "port");
    EXPECT_EQ(end(made, "ConformantStandard", "InstanceID"), "profile");
}

TEST_F(Associations, AProfileIsTiedToTheBaseServerToo)
{
    const Meta_Class* meta_class = agent().m_NVRHBA_ReferencedProfile_map.meta_class();
    const Ref<Instance> profile = make_end(meta_class, "Dependent", "profile");
    const Ref<Instance> referenced = make_end(meta_class, "Antecedent", "referenced");
    ASSERT_NE(createReferencedProfile(agent(), "text", profile.get(), referenced.get()), nullptr);
    EXPECT_EQ(agent().m_NVRHBA_BaseServerReferencedProfile_map.size(), 0u);
    agent().m_NVRHBA_ReferencedProfile_map.clear();

    agent().m_pBaseServerProfile =
        make_end(agent().m_NVRHBA_BaseServerReferencedProfile_map.meta_class(), "Antecedent", "server");
    const Instance* made = createReferencedProfile(agent(), "text", profile.get(), referenced.get());
    ASSERT_NE(made, nullptr);
    EXPECT_STREQ(made->__name_space.c_str(), "root/pg_interop");
    EXPECT_EQ(end(made, "Antecedent", "InstanceID"), "referenced");
    EXPECT_EQ(end(made, "Dependent", "InstanceID"), "profile");
    ASSERT_EQ(agent().m_NVRHBA_BaseServerReferencedProfile_map.size(), 1u);
    const Instance* server = static_cast<const Instance_Map&>(agent().m_NVRHBA_BaseServerReferencedProfile_map)[0];
    EXPECT_STREQ(server->__name_space.c_str(), "root/pg_interop");
    EXPECT_EQ(end(server, "Antecedent", "InstanceID"), "server");
    EXPECT_EQ(end(server, "Dependent", "InstanceID"), "profile");
    agent().m_pBaseServerProfile.reset();
}

TEST_F(Associations, AProfileWithoutItsOtherHalfIsNotTied)
{
    EXPECT_EQ(createReferencedProfile(agent(), "text", nullptr, nullptr), nullptr);
    EXPECT_THAT(words(), ElementsAre("Generating NVRHBA_ReferencedProfile (text)",
                                     "Generating NVRVCNA_ReferencedProfile failed (text)"));
}

TEST_F(Associations, AForeignHostConformsToNothing)
{
    agent().m_bOwnComputerSystem = false;
    EXPECT_EQ(createComputerSystemConformsToProfile(agent(), nullptr), nullptr);
    EXPECT_THAT(words(), ElementsAre("This is IBM/VMWare comp Sys - do nothing"));
}

TEST_F(Associations, WithoutItsHostTheInstallationServiceAffectsNone)
{
    const Meta_Class* meta_class = agent().m_NVRHBA_HostedInstallationService_map.meta_class();
    const Ref<Instance> host = make_end(meta_class, "Antecedent", "the host");
    const Ref<Instance> service = make_end(meta_class, "Dependent", "service");
    createAssocInstallationService(agent(), "text", host.get(), service.get());
    EXPECT_THAT(words(), ElementsAre("Hosted Service, Norvane Firmware Installation Service: text",
                                     "Install Service Affects System: the host"));
    agent().m_NVRHBA_InstallServiceAffectsSystem_map.clear();
    createAssocInstallationService(agent(), "text", host.get(), service.get());
    EXPECT_THAT(words(), ElementsAre("Hosted Service, Norvane Firmware Installation Service: text", "Insert Failed"));
    EXPECT_EQ(agent().m_NVRHBA_InstallServiceAffectsSystem_map.size(), 0u);
}
