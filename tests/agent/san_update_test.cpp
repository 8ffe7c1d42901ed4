// The SAN side: what the targets behind the simulated ports become.

#include <set>
#include <stdexcept>

#include "classes/NVRHBA_StorageVolume.h"
#include "inventory/NVR_Data.h"
#include "inventory/Port.h"
#include "inventory/Target.h"
#include "runtime/Selection.h"
#include "tests/agent/Other_Adapter.h"
#include "tests/agent/expect_rows.h"

using namespace cimple;
using namespace nvrtest;
using testing::Contains;
using testing::ElementsAre;
using testing::Not;
using testing::SizeIs;

namespace {

/// One port that sees one target with the given units.
std::string units(const std::string& tables)
{
    return "allow_twins = true\n[[adapter]]\n[[target]]\nluns = 0\n" + tables;
}

std::string unit(const std::string& keys)
{
    return units("[[target.lun]]\n" + keys);
}

/// The map's own first element.
Instance* first(const Instance_Map& map)
{
    return map.empty() ? nullptr : map[0];
}

constexpr const char* target_wwpn = "50060E8005A10000";

class SANUpdate : public LoadedHost {
protected:
    /// The only volume, disk, ... of a scenario of one unit.
    Ref<Instance> only_unit(const Instance_Map& map, const std::string& keys)
    {
        scenario(unit(keys));
        return onlySAN(map);
    }
    std::vector<std::string> all(const Instance_Map& map, const char* property)
    {
        std::vector<std::string> values;
        for (const Ref<Instance>& instance : san(map))
            values.push_back(value(instance.get(), property));
        return values;
    }

    /// Runs the update alone, over maps and an inventory that the test may have changed.
    uint32 update()
    {
        ProviderAgent& a = agent(); // found before its locks are held, as everywhere
        words();
        Auto_Mutex maps(a.m_SANMapsReadyMutex);
        Auto_Mutex data(a.m_DataMutex);
        return a.updateSANMaps();
    }
    void refresh() { san(agent().m_NVRHBA_SCSIProtocolEndpoint_map); }
    /// The words of the last updateSANMaps, without those of the clearing.
    std::vector<std::string> update_words()
    {
        std::vector<std::string> all = words();
        const auto begin = std::find(all.begin(), all.end(), "PERF: updateSANMaps: Entry");
        const auto end = std::find(begin, all.end(), "PERF: updateSANMaps: cleanExit");
        return {std::find(begin, end, "Exiting clearSANMaps()"), end};
    }

    std::vector<Instance_Map*> maps()
    {
        ProviderAgent& a = agent();
        return {&a.m_NVRHBA_SCSIProtocolEndpoint_map,
                &a.m_NVRHBA_LocalHostedAccessPoint_map,
                &a.m_NVRHBA_StorageVolume_map,
                &a.m_NVRHBA_TapeDrive_map,
                &a.m_NVRHBA_LogicalDisk_map,
                &a.m_NVRHBA_SCSIArbitraryLogicalUnit_map,
                &a.m_NVRHBA_StorageExtent_map,
                &a.m_NVRHBA_StorageVolumeSystemDevice_map,
                &a.m_NVRHBA_TapeDriveSystemDevice_map,
                &a.m_NVRHBA_LogicalDiskSystemDevice_map,
                &a.m_NVRHBA_SCSIArbitraryLogicalUnitSystemDevice_map,
                &a.m_NVRHBA_StorageExtentSystemDevice_map,
                &a.m_NVRHBA_SCSIInitiatorTargetStorageVolumePath_map,
                &a.m_NVRHBA_SCSIInitiatorTargetTapeDrivePath_map,
                &a.m_NVRHBA_SCSIInitiatorTargetLogicalDiskPath_map,
                &a.m_NVRHBA_SCSIInitiatorTargetArbitraryLogicalUnitPath_map,
                &a.m_NVRHBA_SCSIInitiatorTargetStorageExtentPath_map};
    }
    std::size_t instances()
    {
        std::size_t count = 0;
        for (const Instance_Map* map : maps())
            count += map->size();
        return count;
    }
};

} // namespace

TEST_F(SANUpdate, AnEndpointShowsTheTargetBehindThePort)
{
    scenario(unit("number = 5\nserial = \"S0001\"\nos_device_name = \"/dev/sdx\"\n"));
    refresh();
    expect_rows(onlySAN(agent().m_NVRHBA_SCSIProtocolEndpoint_map).get(),
                {
                    {"TargetWWPN", target_wwpn},
                    {"TargetWWNN", "50060E8005A1FF00"},
                    {"Description", "NORVANE  VIRTUAL-DISK     Revision 0401 Serial Number S0001"},
                    {"SystemCreationClassName", "CIM_ComputerSystem"},
                    {"SystemName", value(first(agent().m_CIM_ComputerSystem_map), "Name")},
                    {"CreationClassName", "NVRHBA_SCSIProtocolEndpoint"},
                    {"ElementName", "VIRTUAL-DISK    "},
                    {"Name", "10000000C9A00001:50060E8005A10000:0005000000000000"},
                    {"ProtocolType", "18"},
                    {"ProtocolIFType", "56"},
                    {"ConnectionType", "2"},
                    {"Role", "3"},
                    {"EnabledDefault", "5"},
                    {"EnabledState", "0"},
                    {"RequestedState", "0"},
                    {"OperationalStatus", "{0}"},
                    {"FCID", value(first(agent().m_NVRHBA_SCSIProtocolEndpoint_map), "FCID")},
                    {"SCSIBusNumber", "0"},
                    {"SCSITargetNumber", "0"},
                    {"OtherIdentifyingInfo", "{/dev/sdx}"},
                    {"IdentifyingDescriptions", "{OS Device Name}"},
                });
    const Target& target = *agent().m_pData->getPorts()[0]->getTarget(0);
    EXPECT_EQ(value(first(agent().m_NVRHBA_SCSIProtocolEndpoint_map), "FCID"), std::to_string(target.FcId));
    EXPECT_NE(target.FcId, 0u);
}

TEST_F(SANUpdate, ADiskIsAStorageVolume)
{
    const Ref<Instance> volume =
        only_unit(agent().m_NVRHBA_StorageVolume_map,
                  "number = 5\nserial = \"S0001\"\nos_device_name = \"/dev/sdx\"\nblocks = 1000\nblock_size = 4096\n");
    expect_rows(volume.get(), {
                                  {"SystemCreationClassName", "CIM_ComputerSystem"},
                                  {"SystemName", value(first(agent().m_CIM_ComputerSystem_map), "Name")},
                                  {"CreationClassName", "NVRHBA_StorageVolume"},
                                  {"DeviceID", "10000000C9A00001_50060E8005A10000_600C9A0F05A1FF000000000000000005_"
                                               "0005000000000000"},
                                  {"Description", "NORVANE  VIRTUAL-DISK     Revision 0401 Serial Number S0001"},
                                  {"ElementName", "Storage Volume: 5"},
                                  {"Name", "0C9A0F05A1FF000000000000000005"},
                                  {"NameFormat", "9"},
                                  {"NameNamespace", "2"},
                                  {"OtherNameFormat", "null"},
                                  {"OtherNameNamespace", "null"},
                                  {"BlockSize", "4096"},
                                  {"NumberOfBlocks", "999"},
                                  {"Capacity", "4091904"},
                                  {"CapacityUnit", "Byte"},
                                  {"OperationalStatus", "{0}"},
                                  {"OtherIdentifyingInfo", "{/dev/sdx,NORVANE  VIRTUAL-DISK     Revision 0401}"},
                                  {"IdentifyingDescriptions", "{OS Device Name,Standard SCSI inquiry data}"},
                                  {"DeviceType", "0"},
                                  {"DataOrganization", "null"},
                              });
}

TEST_F(SANUpdate, ATapeIsATapeDrive)
{
    expect_rows(only_unit(agent().m_NVRHBA_TapeDrive_map,
                          "number = 2\ndevice_type = 1\nos_device_name = \"/dev/st7\"\nblocks = 11\n")
                    .get(),
                {
                    {"CreationClassName", "NVRHBA_TapeDrive"},
                    {"DeviceID", "10000000C9A00001_50060E8005A10000_600C9A0F05A1FF000000000000000002_"
                                 "0002000000000000"},
                    {"ElementName", "Tape Drive 2"},
                    {"Name", "/dev/st7"},
                    {"Capacity", "5120"},
                    {"CapacityUnit", "Byte"},
                    {"OtherIdentifyingInfo", "{/dev/st7,NORVANE  VIRTUAL-TAPE     0401}"},
                    {"IdentifyingDescriptions", "{OS Device Name,standard SCSI Inquery data}"},
                    {"OperationalStatus", "{0}"},
                    {"DeviceType", "1"},
                });
}

TEST_F(SANUpdate, AnObjectStoreIsALogicalDisk)
{
    expect_rows(only_unit(agent().m_NVRHBA_LogicalDisk_map,
                          "number = 2\ndevice_type = 17\nos_device_name = \"/dev/sdo\"\nblocks = 11\n")
                    .get(),
                {
                    {"CreationClassName", "NVRHBA_LogicalDisk"},
                    {"ElementName", "Object-based storage device: 2"},
                    {"Name", "0C9A0F05A1FF000000000000000002"},
                    {"Capacity", "5120"},
                    {"BlockSize", "512"},
                    {"NumberOfBlocks", "10"},
                    {"CapacityUnit", "Byte"},
                    {"OtherIdentifyingInfo", "{/dev/sdo,NORVANE  VIRTUAL-DISK     Revision 0401}"},
                    {"IdentifyingDescriptions", "{OS Device Name,Standard SCSI inquiry data}"},
                    {"OperationalStatus", "{0}"},
                    {"DataOrganization", "1"},
                    {"StatusInfo", "2"},
                    {"AdditionalAvailability", "{2}"},
                    {"DeviceType", "17"},
                    {"NameFormat", "12"}, // by default, whatever the identifier
                    {"NameNamespace", "8"},
                });
}

TEST_F(SANUpdate, AnEnclosureIsAnArbitraryUnitWithoutCapacity)
{
    expect_rows(only_unit(agent().m_NVRHBA_SCSIArbitraryLogicalUnit_map,
                          "number = 2\ndevice_type = 13\nos_device_name = \"/dev/sg2\"\nblocks = 11\n")
                    .get(),
                {
                    {"CreationClassName", "NVRHBA_SCSIArbitraryLogicalUnit"},
                    {"ElementName", "Enclosure services 2"},
                    {"DeviceType", "13"},
                    {"OtherDeviceType", "Peripheral devices type is 0x0D"},
                    {"Name", "/dev/sg2"},
                    {"OtherIdentifyingInfo", "{/dev/sg2,NORVANE  VIRTUAL-DISK     Revision 0401}"},
                    {"IdentifyingDescriptions", "{OS Device Name,Standard SCSI inquiry data}"},
                    {"OperationalStatus", "{0}"},
                    {"Capacity", "null"},
                    {"CapacityUnit", "null"},
                });
}

TEST_F(SANUpdate, AnythingElseIsAStorageExtent)
{
    expect_rows(only_unit(agent().m_NVRHBA_StorageExtent_map,
                          "number = 2\ndevice_type = 5\nos_device_name = \"/dev/sr0\"\nblocks = 11\n")
                    .get(),
                {
                    {"CreationClassName", "NVRHBA_StorageExtent"},
                    {"ElementName", "CD/DVD 2"},
                    {"Name", "0C9A0F05A1FF000000000000000002"},
                    {"Capacity", "5120"},
                    {"BlockSize", "512"},
                    {"NumberOfBlocks", "10"},
                    {"CapacityUnit", "Byte"},
                    {"OtherIdentifyingInfo", "{/dev/sr0,NORVANE  VIRTUAL-DISK     Revision 0401}"},
                    {"IdentifyingDescriptions", "{Standard SCSI inquiry data,OS Device Name}"},
                    {"OperationalStatus", "{0}"},
                    {"DeviceType", "5"},
                });
}

TEST_F(SANUpdate, EachDeviceTypeFindsItsClass)
{
    std::string tables;
    for (int type = 0; type < 32; type++)
        tables += "[[target.lun]]\nnumber = " + std::to_string(type) + "\ndevice_type = " + std::to_string(type) + "\n";
    scenario(units(tables));
    EXPECT_THAT(all(agent().m_NVRHBA_StorageVolume_map, "DeviceType"), ElementsAre("0", "14"));
    EXPECT_THAT(all(agent().m_NVRHBA_TapeDrive_map, "DeviceType"), ElementsAre("1"));
    EXPECT_THAT(all(agent().m_NVRHBA_SCSIArbitraryLogicalUnit_map, "DeviceType"), ElementsAre("12", "13", "16"));
    EXPECT_THAT(all(agent().m_NVRHBA_LogicalDisk_map, "DeviceType"), ElementsAre("17"));
    EXPECT_THAT(all(agent().m_NVRHBA_StorageExtent_map, "ElementName"),
                ElementsAre("Printer 2", "Processor 3", "Write-once device 4", "CD/DVD 5", "Scanner 6",
                            "Optical memory device 7", "Jukebox 8", "Communications device 9", "Unknown device 10",
                            "Unknown device 11", "Optical card reader/writer 15", "Unknown device 18",
                            "Unknown device 19", "Unknown device 20", "Unknown device 21", "Unknown device 22",
                            "Unknown device 23", "Unknown device 24", "Unknown device 25", "Unknown device 26",
                            "Unknown device 27", "Unknown device 28", "Unknown device 29", "Unknown device 30",
                            "Unknown device 31"));
    EXPECT_THAT(all(agent().m_NVRHBA_SCSIProtocolEndpoint_map, "Name"), SizeIs(32));
}

TEST_F(SANUpdate, AUnitIsTiedToTheHostTheEndpointAndTheInitiator)
{
    scenario(units("[[target.lun]]\nnumber = 0\n[[target.lun]]\nnumber = 1\ndevice_type = 1\n"
                   "[[target.lun]]\nnumber = 2\ndevice_type = 17\n[[target.lun]]\nnumber = 3\ndevice_type = 12\n"
                   "[[target.lun]]\nnumber = 4\ndevice_type = 4\n"));
    refresh();
    ProviderAgent& a = agent();
    const std::string host = value(first(a.m_CIM_ComputerSystem_map), "Name");
    const struct {
        const Instance_Map &units, &devices, &paths;
        const char* lun;
    } rows[] = {
        {a.m_NVRHBA_StorageVolume_map, a.m_NVRHBA_StorageVolumeSystemDevice_map,
         a.m_NVRHBA_SCSIInitiatorTargetStorageVolumePath_map, "0000000000000000"},
        {a.m_NVRHBA_TapeDrive_map, a.m_NVRHBA_TapeDriveSystemDevice_map,
         a.m_NVRHBA_SCSIInitiatorTargetTapeDrivePath_map, "0001000000000000"},
        {a.m_NVRHBA_LogicalDisk_map, a.m_NVRHBA_LogicalDiskSystemDevice_map,
         a.m_NVRHBA_SCSIInitiatorTargetLogicalDiskPath_map, "0002000000000000"},
        {a.m_NVRHBA_SCSIArbitraryLogicalUnit_map, a.m_NVRHBA_SCSIArbitraryLogicalUnitSystemDevice_map,
         a.m_NVRHBA_SCSIInitiatorTargetArbitraryLogicalUnitPath_map, "0003000000000000"},
        {a.m_NVRHBA_StorageExtent_map, a.m_NVRHBA_StorageExtentSystemDevice_map,
         a.m_NVRHBA_SCSIInitiatorTargetStorageExtentPath_map, "0004000000000000"},
    };
    for (const auto& row : rows) {
        SCOPED_TRACE(row.units.meta_class()->name);
        const std::string id = value(onlySAN(row.units).get(), "DeviceID");
        const Ref<Instance> device = onlySAN(row.devices);
        expect_rows(device.get(), {});
        EXPECT_EQ(end(device.get(), "GroupComponent", "Name"), host);
        EXPECT_EQ(end(device.get(), "PartComponent", "DeviceID"), id);
        const Ref<Instance> path = onlySAN(row.paths);
        expect_rows(path.get(), {});
        EXPECT_EQ(end(path.get(), "LogicalUnit", "DeviceID"), id);
        EXPECT_EQ(end(path.get(), "Target", "Name"), std::string(first_wwpn) + ":" + target_wwpn + ":" + row.lun);
        EXPECT_EQ(end(path.get(), "Initiator", "Name"), first_wwpn);
    }
    const Instances hosted = san(a.m_NVRHBA_LocalHostedAccessPoint_map);
    ASSERT_THAT(hosted, SizeIs(5));
    for (std::size_t i = 0; i < 5; i++) {
        expect_rows(hosted[i].get(), {});
        EXPECT_EQ(end(hosted[i].get(), "Antecedent", "Name"), host);
        EXPECT_EQ(end(hosted[i].get(), "Dependent", "Name"),
                  std::string(first_wwpn) + ":" + target_wwpn + ":" + rows[i].lun);
    }
}

TEST_F(SANUpdate, TheOrderIsThatOfPortsTargetsAndUnits)
{
    scenario("[[adapter]]\n[[adapter]]\n[[target]]\nluns = 2\n[[target]]\nluns = 2\n");
    const std::string ports[] = {"10000000C9A00001:", "10000000C9A00002:"};
    const std::string targets[] = {"50060E8005A10000:", "50060E8005A10001:"};
    const std::string luns[] = {"0000000000000000", "0001000000000000"};
    std::vector<std::string> expected;
    for (const std::string& port : ports)
        for (const std::string& target : targets)
            for (const std::string& lun : luns)
                expected.push_back(port + target + lun);
    EXPECT_EQ(all(agent().m_NVRHBA_SCSIProtocolEndpoint_map, "Name"), expected);
    const auto ids = all(agent().m_NVRHBA_StorageVolume_map, "DeviceID");
    EXPECT_THAT(std::set<std::string>(ids.begin(), ids.end()), SizeIs(8)) << "a unit has an instance for each way";
    for (std::size_t i = 0; i < ids.size(); i++)
        EXPECT_EQ(ids[i].substr(0, 16) + ":" + ids[i].substr(17, 16) + ":" + ids[i].substr(ids[i].size() - 16),
                  expected[i]);
}

TEST_F(SANUpdate, AllIsToldInTheLog)
{
    scenario(units("[[target.lun]]\nnumber = 0\nos_lun = 7\n"
                   "[[target.lun]]\nnumber = 1\ndevice_type = 1\nidentifier = \"600102\"\n"));
    refresh();
    EXPECT_EQ(update(), 0u);
    const std::string way = "10000000C9A00001_50060E8005A10000_";
    const std::string volume = way + "600C9A0F05A1FF000000000000000000_0000000000000000";
    const std::string tape = way + "_0001000000000000";
    EXPECT_THAT(update_words(),
                ElementsAre("Exiting clearSANMaps()", "Norvane-FC2162-0", "*********************************",
                            "*********************************", "Creating classes for port 0.", "10000000C9A00001",
                            "Creating classes for target 0 of 2.",
                            "Generating NVRHBA_LocalHostedAccessPoint (Local Hosted Access Point "
                            "10000000C9A00001:50060E8005A10000:0000000000000000)",
                            "Target 0 is of type 0.", "Entered", "creating NVRHBA_StorageVolume",
                            "StorageVolumeInstance->DeviceID = " + volume,
                            "Generating NVRHBA_StorageVolumeSystemDevice (Storage Volume: " + volume + ")",
                            "creating NVRHBA_SCSIInitiatorTargetStorageVolumePath - Storage Volume",
                            "Creating classes for target 1 of 2.",
                            "Generating NVRHBA_LocalHostedAccessPoint (Local Hosted Access Point "
                            "10000000C9A00001:50060E8005A10000:0001000000000000)",
                            "Target 1 is of type 1.", "Entered", "INVALID Descriptor",
                            "Generating NVRHBA_TapeDriveSystemDevice (Tape Drive: " + tape + ")",
                            "creating NVRHBA_SCSIInitiatorTargetTapeDrivePath - Tape Drive"));
}

TEST_F(SANUpdate, TheOtherClassesHaveTheirWords)
{
    scenario(units("[[target.lun]]\nnumber = 0\ndevice_type = 17\n[[target.lun]]\nnumber = 1\ndevice_type = 16\n"
                   "[[target.lun]]\nnumber = 2\ndevice_type = 31\n"));
    refresh();
    const auto id = [](const Instance* unit) { return value(unit, "DeviceID"); };
    EXPECT_THAT(
        words(),
        contains_in_order({"Generating NVRHBA_LogicalDiskSystemDevice (Logical Disk: " +
                               id(first(agent().m_NVRHBA_LogicalDisk_map)) + ")",
                           "creating NVRHBA_SCSIInitiatorTargetLogicalDiskPath - Logical Disk",
                           "Generating NVRHBA_SCSIArbitraryLogicalUnitSystemDevice (SCSI Arbitrary Logical Unit: " +
                               id(first(agent().m_NVRHBA_SCSIArbitraryLogicalUnit_map)) + ")",
                           "creating NVRHBA_SCSIInitiatorTargetArbitraryLogicalUnitPath - SCSI Arbitrary Logical Unit",
                           "Generating NVRHBA_StorageExtentSystemDevice (Storage Extent: " +
                               id(first(agent().m_NVRHBA_StorageExtent_map)) + ")",
                           "creating NVRHBA_SCSIInitiatorTargetStorageExtentPath - Storage Extent",
                           "PERF: updateSANMaps: cleanExit"}));
}

TEST_F(SANUpdate, AVolumesNameFollowsItsIdentifier)
{
    const Instance_Map& map = agent().m_NVRHBA_StorageVolume_map;
    expect_rows(only_unit(map, "identifier_type = 4\nidentifier = \"0102030405060708\"\n").get(),
                {{"Name", "0102030405060708"},
                 {"NameFormat", "1"},
                 {"NameNamespace", "1"},
                 {"OtherNameFormat", "Relative target port identifier"},
                 {"OtherNameNamespace", "Relative target port idientifier"}});
}

TEST_F(SANUpdate, AnEUIIsPrintedAnew)
{
    scenario(unit("identifier_type = 2\nidentifier = \"0102030405060708090A0B0C\"\n"));
    refresh();
    EXPECT_EQ(update(), 0u);
    const std::vector<std::string> told = update_words();
    EXPECT_EQ(std::count(told.begin(), told.end(), "Entered"), 2);
    expect_rows(onlySAN(agent().m_NVRHBA_StorageVolume_map).get(),
                {{"Name", "0102030405060708090A0B0C"}, {"NameFormat", "10"}, {"NameNamespace", "3"}});
}

TEST_F(SANUpdate, AUnitWithoutIdentifierHasAnEmptyField)
{
    expect_rows(only_unit(agent().m_NVRHBA_StorageVolume_map, "page83_status = 1\n").get(),
                {{"DeviceID", "10000000C9A00001_50060E8005A10000__0000000000000000"},
                 {"Name", ""},
                 {"NameFormat", "6"},
                 {"NameNamespace", "1"},
                 {"OtherNameNamespace", "Vendor specific"}});
}

TEST_F(SANUpdate, AnIdentifierThatClaimsMoreThanItSendsIsCut)
{
    const Ref<Instance> volume =
        only_unit(agent().m_NVRHBA_StorageVolume_map, "page83 = \"00 83 00 FF 01 03 00 FF 60 AB CD\"\n");
    const std::string name = value(volume.get(), "Name");
    EXPECT_EQ(name, "ABCD" + std::string(2 * 252, '0'));
    EXPECT_EQ(value(volume.get(), "DeviceID"), "10000000C9A00001_50060E8005A10000__0000000000000000");
}

TEST_F(SANUpdate, ADeviceTypeAbove31IsCutByTheInquiry)
{
    EXPECT_EQ(value(only_unit(agent().m_NVRHBA_StorageVolume_map, "inquiry = \"E0 00 05 12 5B 00 00 00 56\"\n").get(),
                    "DeviceType"),
              "0");
}

TEST_F(SANUpdate, AUnitThatTellsNothingIsAVolumeOfUnknownMake)
{
    expect_rows(only_unit(agent().m_NVRHBA_StorageVolume_map,
                          "device_type = 1\ninquiry_status = 1\npage80_status = 1\npage83_status = 1\n"
                          "capacity_status = 1\n")
                    .get(),
                {{"Description", "Unknown Unknown Revision Unkn Serial Number Unknown"},
                 {"DeviceType", "0"},
                 {"BlockSize", "null"},
                 {"NumberOfBlocks", "null"},
                 {"Capacity", "null"},
                 {"CapacityUnit", "null"}});
}

TEST_F(SANUpdate, ACapacityNeedsBothItsFactors)
{
    refresh();
    for (const char* answer : {"00000000 00000200", "0000FFFF 00000000"}) {
        scenario(unit(std::string("capacity = \"") + answer + "\"\n"));
        agent().m_pData->buildSANData();
        EXPECT_EQ(update(), 0u);
        expect_rows(
            first(agent().m_NVRHBA_StorageVolume_map),
            {{"BlockSize", "null"}, {"NumberOfBlocks", "null"}, {"Capacity", "null"}, {"CapacityUnit", "null"}});
    }
}

TEST_F(SANUpdate, TheLargestCapacityFits)
{
    expect_rows(only_unit(agent().m_NVRHBA_StorageVolume_map, "capacity = \"FFFFFFFF FFFFFFFF\"\n").get(),
                {{"NumberOfBlocks", "4294967295"}, {"Capacity", "18446744065119617025"}});
}

TEST_F(SANUpdate, AUnitOnTwoLUNsIsTwoInstances)
{
    const std::string naa = "identifier_type = 3\nidentifier = \"60060E8005A1FF07\"\n";
    scenario(units("[[target.lun]]\nnumber = 0\n" + naa + "[[target.lun]]\nnumber = 1\n" + naa));
    const std::string route = std::string(first_wwpn) + "_" + target_wwpn + "_60060E8005A1FF07_";
    EXPECT_THAT(all(agent().m_NVRHBA_StorageVolume_map, "DeviceID"),
                ElementsAre(route + "0000000000000000", route + "0001000000000000"));
}

TEST_F(SANUpdate, AnAdapterRefreshKeepsTheOldInstancesUntilSomebodyAsks)
{
    scenario("[[adapter]]\n[[target]]\nluns = 2\n");
    refresh();
    const std::size_t before = instances();
    EXPECT_GT(before, 5u);
    agent().m_bRefreshSANData = false;
    scenario("[[adapter]]\n[[target]]\nluns = 3\n");
    SimulatedHost::refresh();
    settle();
    EXPECT_FALSE(agent().m_bIsSANMapsReady);
    EXPECT_EQ(instances(), before);
    EXPECT_THAT(all(agent().m_NVRHBA_StorageVolume_map, "Name"), SizeIs(3));
    EXPECT_TRUE(agent().m_bIsSANMapsReady);
}

TEST_F(SANUpdate, TwinsEndTheUpdateButNotTheAgent)
{
    scenario(units("[[target.lun]]\nnumber = 0\n"
                   "[[target.lun]]\nnumber = 1\nfcp_lun = \"0000000000000000\"\n[[target.lun]]\nnumber = 2\n"));
    EXPECT_THAT(all(agent().m_NVRHBA_StorageVolume_map, "ElementName"), ElementsAre("Storage Volume: 0"));
    EXPECT_TRUE(agent().m_bIsSANMapsReady);
    EXPECT_EQ(update(), 32769u);
    const std::vector<std::string> told = words();
    EXPECT_THAT(told, contains_in_order({"Creating classes for target 1 of 3.",
                                         "Insert Failed : m_NVRHBA_SCSIProtocolEndpoint_map"}));
    EXPECT_EQ(told.back(), "Insert Failed : m_NVRHBA_SCSIProtocolEndpoint_map");
    EXPECT_THAT(told, Not(Contains("PERF: updateSANMaps: cleanExit")));
    EXPECT_EQ(instances(), 5u) << "what came before stays";
}

TEST_F(SANUpdate, TwoTargetsWithTheSameEverythingEndTheUpdate)
{
    scenario("allow_twins = true\n[[adapter]]\n[[target]]\nluns = 1\n"
             "[[target]]\nwwpn = \"50060E8005A10000\"\nwwnn = \"50060E8005A1FF00\"\nluns = 1\n");
    EXPECT_THAT(all(agent().m_NVRHBA_SCSIProtocolEndpoint_map, "Name"), SizeIs(1));
    EXPECT_EQ(update(), 32769u);
}

TEST_F(SANUpdate, APortWithoutEndpointIsPassedOver)
{
    scenario("[[adapter]]\n[[adapter]]\n[[target]]\nluns = 2\n");
    refresh();
    agent().m_NVRHBA_SCSIProtocolInitiatorEndpoint_map.remove(
        first(agent().m_NVRHBA_SCSIProtocolInitiatorEndpoint_map));
    EXPECT_EQ(update(), 0u);
    EXPECT_EQ(agent().m_NVRHBA_SCSIProtocolEndpoint_map.size(), 2u);
    EXPECT_EQ(value(first(agent().m_NVRHBA_SCSIProtocolEndpoint_map), "Name").substr(0, 16), "10000000C9A00002");
    EXPECT_THAT(words(), contains_in_order({"Norvane-FC2162-0", "Creating classes for port 0.", "Norvane-FC2162-1",
                                            "Creating classes for port 0.", "10000000C9A00002"}));
    agent().m_NVRHBA_SCSIProtocolInitiatorEndpoint_map.clear();
    EXPECT_EQ(update(), 0u);
    EXPECT_EQ(instances(), 0u);
}

TEST_F(SANUpdate, AnAdapterOfAnotherKindIsPassedOver)
{
    scenario("[[adapter]]\n[[adapter]]\n[[target]]\n");
    refresh();
    auto& adapters = const_cast<std::vector<Adapter*>&>(agent().m_pData->getAdapters());
    Adapter* real = adapters[0];
    Other_Adapter other;
    adapters[0] = &other;
    EXPECT_EQ(update(), 0u);
    adapters[0] = real;
    EXPECT_THAT(words(), contains_in_order({"Skippping Adapter [Other-0] since it is not an FC Adapter",
                                            "Norvane-FC2162-1", "PERF: updateSANMaps: cleanExit"}));
    EXPECT_EQ(agent().m_NVRHBA_SCSIProtocolEndpoint_map.size(), 1u);
}

TEST_F(SANUpdate, AnInventoryThatContradictsItselfFails)
{
    refresh();
    EXPECT_GT(instances(), 0u);
    auto& adapters = const_cast<std::vector<Adapter*>&>(agent().m_pData->getAdapters());
    Other_Adapter other;
    adapters.push_back(&other);
    EXPECT_EQ(update(), 32769u);
    adapters.pop_back();
    EXPECT_EQ(instances(), 0u);
}

TEST_F(SANUpdate, AHostWithoutAdaptersHasAnEmptySAN)
{
    scenario("");
    refresh();
    EXPECT_EQ(update(), 0u);
    EXPECT_THAT(words(), contains_in_order({"PERF: updateSANMaps: Entry", "PERF: updateSANMaps: cleanExit"}));
    EXPECT_EQ(instances(), 0u);
}

TEST_F(SANUpdate, AMappingThatClaimsMoreThanItHoldsIsReadAsFarAsItGoes)
{
    scenario("[[adapter]]\n[[target]]\nluns = 1\n");
    fault("call = \"HBA_GetFcpTargetMapping\", value = 4294967295");
    const auto names = all(agent().m_NVRHBA_SCSIProtocolEndpoint_map, "Name");
    EXPECT_TRUE(agent().m_bIsSANMapsReady);
    EXPECT_THAT(names, SizeIs(2)) << "behind the true entry all are alike, and twins end the update";
}

TEST_F(SANUpdate, AMappingOfNoEntriesIsEmpty)
{
    fault("call = \"HBA_GetFcpTargetMapping\", value = 0");
    EXPECT_THAT(all(agent().m_NVRHBA_SCSIProtocolEndpoint_map, "Name"), SizeIs(0));
}

TEST_F(SANUpdate, AnAdapterThatVanishesLeavesItsTargetsOut)
{
    scenario("[[adapter]]\n[[adapter]]\n[[target]]\nluns = 2\n");
    refresh();
    EXPECT_THAT(all(agent().m_NVRHBA_SCSIProtocolEndpoint_map, "Name"), SizeIs(4));
    fault("call = \"HBA_OpenAdapter\", port = 0, status = 0");
    agent().m_pData->buildSANData();
    EXPECT_EQ(update(), 0u);
    EXPECT_EQ(agent().m_NVRHBA_SCSIProtocolEndpoint_map.size(), 2u);
    EXPECT_EQ(value(first(agent().m_NVRHBA_SCSIProtocolEndpoint_map), "Name").substr(0, 16), "10000000C9A00002");
}

// An adapter has one mapping, and each of its ports takes all of it.
TEST_F(SANUpdate, PortsOfOneAdapterHaveInstancesOfTheirOwn)
{
    scenario("[[adapter]]\nports = 2\n[[target]]\nseen_by = [0]\n[[target]]\nseen_by = [1]\n");
    EXPECT_THAT(all(agent().m_NVRHBA_SCSIProtocolEndpoint_map, "Name"),
                ElementsAre("10000000C9A00001:50060E8005A10000:0000000000000000",
                            "10000000C9A00001:50060E8005A10001:0000000000000000",
                            "10000000C9A00002:50060E8005A10000:0000000000000000",
                            "10000000C9A00002:50060E8005A10001:0000000000000000"));
}

TEST_F(SANUpdate, AUnitThatBothPortsOfAnAdapterSeeIsATwin)
{
    scenario("[[adapter]]\nports = 2\n[[target]]\nluns = 1\n");
    EXPECT_THAT(all(agent().m_NVRHBA_SCSIProtocolEndpoint_map, "Name"),
                ElementsAre("10000000C9A00001:50060E8005A10000:0000000000000000"));
    EXPECT_EQ(update(), 32769u);
}

TEST_F(SANUpdate, ASecondRefreshLeavesTheSameInstances)
{
    scenario("[[adapter]]\n[[adapter]]\n[[target]]\nluns = 4\n[[target.lun]]\nnumber = 1\ndevice_type = 1\n");
    refresh();
    std::vector<Ref<Instance>> before;
    for (const Instance_Map* map : maps())
        for (std::size_t i = 0; i < map->size(); i++)
            before.emplace_back(clone((*map)[i]));
    agent().m_pData->buildSANData();
    EXPECT_EQ(update(), 0u);
    std::size_t next = 0;
    for (const Instance_Map* map : maps())
        for (std::size_t i = 0; i < map->size(); i++, next++) {
            ASSERT_LT(next, before.size());
            EXPECT_TRUE(identical(before[next].get(), (*map)[i]));
        }
    EXPECT_EQ(next, before.size());
    EXPECT_EQ(next, 8u * 5);
}

TEST_F(SANUpdate, WhatIsHandedOutIsTheCallersOwn)
{
    refresh();
    const Ref<Instance> path = san(agent().m_NVRHBA_SCSIInitiatorTargetStorageVolumePath_map)[0];
    const Meta_Reference* unit = as_reference(find_feature(path->meta_class, "LogicalUnit", META_FLAG_REFERENCE));
    EXPECT_NE(reference_of(path.get(), unit), first(agent().m_NVRHBA_StorageVolume_map));
    EXPECT_NE(reference_of(path.get(), unit),
              reference_of(first(agent().m_NVRHBA_SCSIInitiatorTargetStorageVolumePath_map), unit));
    const std::string id = end(path.get(), "LogicalUnit", "DeviceID");
    {
        ProviderAgent& a = agent();
        Auto_Mutex data(a.m_DataMutex);
        a.clearSANMaps();
    }
    EXPECT_EQ(end(path.get(), "LogicalUnit", "DeviceID"), id);
    EXPECT_EQ(end(path.get(), "Initiator", "Name"), first_wwpn);
}

// --- What a caller selects
// ------------------------------------------------------------------------------------------------------------------

TEST_F(SANUpdate, ASelectionByKeyIsTheOneInstance)
{
    refresh();
    const Instances all = san(agent().m_NVRHBA_StorageVolume_map);
    ASSERT_GT(all.size(), 1u);
    struct By_Key : Selection {
        By_Key(const void* data, const Instance* wanted) : Selection(data, Values::all), wanted(wanted) {}
        const Instance* key() const override { return wanted; }
        const Instance* wanted;
    };
    Instances found;
    By_Key selection(&found, all[1].get());
    enumerateSAN(agent(), agent().m_NVRHBA_StorageVolume_map, {collect, &found});
    ASSERT_THAT(found, SizeIs(1));
    EXPECT_TRUE(identical(found[0].get(), all[1].get()));

    const Ref<Instance> stranger(clone(all[1].get()));
    static_cast<NVRHBA_StorageVolume*>(stranger.get())->DeviceID.set("nobody's");
    Instances none;
    By_Key other(&none, stranger.get());
    enumerateSAN(agent(), agent().m_NVRHBA_StorageVolume_map, {collect, &none});
    EXPECT_THAT(none, SizeIs(0));
}

TEST_F(SANUpdate, ASelectionIsAskedForEachInOrderAndGetsItsOwnInTheirOrder)
{
    refresh();
    const Instances all = san(agent().m_NVRHBA_StorageVolumeSystemDevice_map);
    ASSERT_GT(all.size(), 1u);
    struct All_But_The_First : Selection {
        explicit All_But_The_First(const void* data) : Selection(data, Values::keys) {}
        bool wants(const Instance*) override { return asked++ != 0; }
        void asked_all() override { is_complete = true; }
        std::size_t asked = 0;
        bool is_complete = false;
    };
    Instances found;
    All_But_The_First selection(&found);
    enumerateSAN(agent(), agent().m_NVRHBA_StorageVolumeSystemDevice_map, {collect, &found});
    EXPECT_EQ(selection.asked, all.size());
    EXPECT_TRUE(selection.is_complete);
    ASSERT_EQ(found.size() + 1, all.size());
    for (std::size_t i = 0; i < found.size(); i++) {
        EXPECT_TRUE(key_eq(found[i].get(), all[i + 1].get()));
        EXPECT_EQ(end(found[i].get(), "PartComponent", "Description"), "null") << "the keys are all that is looked at";
    }
}

TEST_F(SANUpdate, AReaderSharesWhatNobodyWritesAndItOutlivesTheMaps)
{
    refresh();
    Instance_Map& volumes = agent().m_NVRHBA_StorageVolume_map;
    const Instances all = san(volumes);
    ASSERT_GT(all.size(), 1u);
    EXPECT_NE(all[0].get(), volumes[0]);
    Instances read;
    const Selection reader(&read, Selection::Values::all, Selection::Handler::only_reads);
    enumerateSAN(agent(), volumes, {collect, &read});
    ASSERT_EQ(read.size(), all.size());
    EXPECT_EQ(read[0].get(), volumes[0]);
    {
        ProviderAgent& a = agent();
        Auto_Mutex data(a.m_DataMutex);
        a.clearSANMaps();
    }
    for (std::size_t i = 0; i < read.size(); i++)
        EXPECT_TRUE(identical(read[i].get(), all[i].get()));

    Instances ports;
    const Selection port_reader(&ports, Selection::Values::all, Selection::Handler::only_reads);
    enumeratePlain(agent(), agent().m_NVRHBA_FCPort_map, {collect, &ports});
    ASSERT_THAT(ports, SizeIs(1));
    EXPECT_NE(ports[0].get(), first(agent().m_NVRHBA_FCPort_map)) << "a port's status is written to where it lies";
}

TEST_F(SANUpdate, AReadersHandlerThatThrowsLosesNoCount)
{
    refresh();
    const Instance_Map& volumes = agent().m_NVRHBA_StorageVolume_map;
    int data = 0;
    const Selection reader(&data, Selection::Values::all, Selection::Handler::only_reads);
    const Enum_Handler handler{[](Instance* instance, int, void*) -> bool {
                                   unref(instance);
                                   throw std::runtime_error("handler");
                               },
                               &data};
    enumerateSAN(agent(), volumes, handler);
    EXPECT_THAT(words(), Contains("Exception in SAN CIM Provider Enumeration - do nothing"));
    const Instance* second = volumes[1];
    std::size_t holders = 1; // the map, and the associations that hold it
    for (const Instance_Map* map :
         {static_cast<Instance_Map*>(&agent().m_NVRHBA_StorageVolumeSystemDevice_map),
          static_cast<Instance_Map*>(&agent().m_NVRHBA_SCSIInitiatorTargetStorageVolumePath_map)})
        holders += map->size() / volumes.size();
    EXPECT_EQ(second->refs, holders);
}

TEST_F(SANUpdate, AnAssociationOutlivesTheMapsOfItsEnds)
{
    refresh();
    agent().m_NVRHBA_StorageVolume_map.clear();
    agent().m_NVRHBA_SCSIProtocolEndpoint_map.clear();
    const Instance* path = first(agent().m_NVRHBA_SCSIInitiatorTargetStorageVolumePath_map);
    EXPECT_NE(end(path, "LogicalUnit", "DeviceID"), "null");
    EXPECT_NE(end(path, "Target", "Name"), "null");
}
