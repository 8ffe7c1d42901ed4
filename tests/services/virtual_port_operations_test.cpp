// The operations on virtual ports that no refresh reaches: their targets and machines, and arguments that are null.

#include <algorithm>

#include "foundation/NVR_Common.h"
#include "services/NVR_MethodWrapper.h"
#include "simulator/nvrsim.h"
#include "tests/agent/Simulated_Host.h"

using namespace cimple;
using namespace nvrtest;
using testing::Contains;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::SizeIs;

namespace {

HBA_WWN named(const char* text)
{
    HBA_WWN wwn = {};
    EXPECT_EQ(string2HBAName(&wwn, text), 1);
    return wwn;
}

class VirtualPortOperations : public SimulatedHost {
protected:
    VirtualPortOperations()
    {
        scenario(R"(
[[adapter]]
[[adapter.port]]
attributes = { 265 = 1 }
[[adapter.port.vport]]
wwpn = "2B010000C9A000FF"
[[adapter.port.vport.vm]]
identity = "vm-one"
server = "rack1"
name = "db1"
guest_os = "Linux"
memory = 8192
[[adapter.port.vport.vm]]
identity = "vm-two"
[[target]]
luns = 3
)");
        EXPECT_EQ(load(), 0);
        words();
        vport.wwpn = named("2B010000C9A000FF");
    }
    ~VirtualPortOperations() override
    {
        settle();
        unload();
    }

    const HBA_WWN port = named(first_wwpn);
    RM_VPORTENTRY vport = {};
    std::vector<RM_VMINFO> machines;
};

} // namespace

TEST_F(VirtualPortOperations, TellTheMachinesBehindAPort)
{
    ASSERT_EQ(NVR_MethodWrapper::ListVMfromVPort(port, vport, &machines), 0);
    ASSERT_THAT(machines, SizeIs(2));
    EXPECT_EQ(fieldText(machines[0].machineName), "db1");
    EXPECT_THAT(words(),
                contains_in_order({"NVR_MethodWrapper::ListVMfromVPort 2B010000C9A000FF", "FMCMD_ListVMS: Status: 0",
                                   "VM Details: vm-one, 2B010000C9A000FF", "Server Name:  rack1",
                                   "Virtual Machine Name:  db1", "Guest OS Name:  Linux", "Memory Size:  8192",
                                   "VM Details: vm-two, 2B010000C9A000FF", "Exit the ListVMs method"}));
}

TEST_F(VirtualPortOperations, TellNoMachinesOfAnAdapterThatMapsNone)
{
    scenario("[[adapter]]\n[[adapter.port]]\nattributes = { 265 = 3 }\n[[adapter.port.vport]]\n"
             "wwpn = \"2B010000C9A000FF\"\n[[adapter.port.vport.vm]]\n");
    testing::internal::CaptureStdout();
    EXPECT_EQ(NVR_MethodWrapper::ListVMfromVPort(port, vport, &machines), 0);
    EXPECT_EQ(testing::internal::GetCapturedStdout(), "This physical WWPN does not support virtual port mappings.\n");
    EXPECT_THAT(machines, IsEmpty());
}

TEST_F(VirtualPortOperations, PassAFailureOfTheMachinesOn)
{
    fault("call = \"RM_GetVMFromVPort\", status = 2");
    EXPECT_EQ(NVR_MethodWrapper::ListVMfromVPort(port, vport, &machines), 1);
    EXPECT_THAT(words(), Contains("FMCMD_ListVMS: Status: 2"));
}

TEST_F(VirtualPortOperations, ReadNoMoreMachinesThanFit)
{
    fault("call = \"RM_GetVMFromVPort\", status = 7, value = 4, times = 1");
    fault("call = \"RM_GetVMFromVPort\", value = 4294967295, from = 2");
    EXPECT_EQ(NVR_MethodWrapper::ListVMfromVPort(port, vport, &machines), 0);
    EXPECT_EQ(machines.size(), 4u);
    EXPECT_EQ(fieldText(machines[0].identity), "vm-one");
}

TEST_F(VirtualPortOperations, AllocateNoMoreThan16MiB)
{
    // The most that fits is asked for, one more is not.
    fault("call = \"RM_GetVMFromVPort\", status = 7, value = 32767, times = 1");
    EXPECT_EQ(NVR_MethodWrapper::ListVMfromVPort(port, vport, &machines), 0);
    EXPECT_EQ(machines.size(), 2u);
    fault("call = \"RM_GetVMFromVPort\", status = 7, value = 32768");
    EXPECT_EQ(NVR_MethodWrapper::ListVMfromVPort(port, vport, &machines), 1);
    EXPECT_THAT(words(), Contains("FMCMD_ListVMS: Unable to allocate buffer\n"));
}

TEST_F(VirtualPortOperations, TellThatTheTargetsAreListed)
{
    fault("call = \"RM_IsLocalHBA\", value = 1");
    EXPECT_EQ(NVR_MethodWrapper::ListVPortTargets(port, vport.wwpn), 0);
    EXPECT_EQ(words().back(), "Exit the ListVPortTargets method");
    EXPECT_EQ(nvrsim_calls("RM_VPListTargets"), 2u) << "three do not fit the room of the first call";
    fault("call = \"RM_VPListTargets\", status = 7, value = 4294967295");
    EXPECT_EQ(NVR_MethodWrapper::ListVPortTargets(port, vport.wwpn), 1);
    EXPECT_EQ(words().back(), "FMCMD_VportTargets: Unable to allocate buffer");
}

// The library calls a virtual port local only where it knows it as one.
TEST_F(VirtualPortOperations, AskForTargetsOfLocalNamesAlone)
{
    EXPECT_EQ(NVR_MethodWrapper::ListVPortTargets(port, named("2B010000C9A0FFFF")), 1);
    EXPECT_THAT(words(), Contains("INVALID wwpn"));
    EXPECT_EQ(NVR_MethodWrapper::ListVPortTargets(port, port), 1);
    EXPECT_THAT(words(), Contains("Unable to list virtual port's targets!"));
    fault("call = \"RM_VPListTargets\", status = 128");
    EXPECT_EQ(NVR_MethodWrapper::ListVPortTargets(port, port), 1);
    EXPECT_THAT(words(), Contains("FMCMD does not support listing virtual port targets on this host."));
}

TEST_F(VirtualPortOperations, TellNullArguments)
{
    EXPECT_EQ(NVR_MethodWrapper::ListVPorts(port, nullptr), 4);
    EXPECT_THAT(words(), Contains("Invalid input pointer"));
    EXPECT_EQ(NVR_MethodWrapper::ListVPortAttributes(port, vport.wwpn, nullptr), 4);
    EXPECT_THAT(words(), Contains("Invalid input vp attributes pointer"));
    EXPECT_EQ(NVR_MethodWrapper::ListVMfromVPort(port, vport, nullptr), 4);
    EXPECT_THAT(words(), Contains("Invalid input pointer"));
}

TEST_F(VirtualPortOperations, RefuseAPortThatIsNotLocal)
{
    fault("call = \"RM_IsLocalHBA\", status = 1");
    VPort_List list;
    RM_VPORTATTRIBUTES attributes = {};
    EXPECT_EQ(NVR_MethodWrapper::ListVPorts(port, &list), 1);
    EXPECT_EQ(NVR_MethodWrapper::ListVPortAttributes(port, vport.wwpn, &attributes), 1);
    EXPECT_EQ(NVR_MethodWrapper::ListVPortTargets(port, vport.wwpn), 1);
    EXPECT_EQ(NVR_MethodWrapper::ListVMfromVPort(port, vport, &machines), 1);
    const auto told = words();
    EXPECT_EQ(std::count(told.begin(), told.end(), "INVALID wwpn"), 4);
}
