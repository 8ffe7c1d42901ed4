// A host that another provider publishes, and a Base Server profile: found by up-calls, they become ends of ours.
#include <algorithm>
#include <string>
#include <vector>

#include <gmock/gmock.h>

#include "tests/module/support/Rig.h"
#include "tests/support/trace.h"

using namespace nvrtest;
using testing::Contains;
using testing::IsEmpty;
using testing::Not;

namespace {

host::Instance foreign_host()
{
    host::Instance instance;
    instance.path.name_space = "root/ibmse";
    instance.path.class_name = "IBMSD_ComputerSystem";
    instance.set("CreationClassName", host::Value::string("IBMSD_ComputerSystem"));
    instance.set("Name", host::Value::string("rack 7"));
    instance.set("ElementName", host::Value::string("The server in rack 7"));
    return instance;
}

host::Instance foreign_profile(const std::string& id, const std::string& name)
{
    host::Instance instance;
    instance.path.name_space = "root/pg_interop";
    instance.path.class_name = "CIM_RegisteredProfile";
    instance.set("InstanceID", host::Value::string(id));
    instance.set("RegisteredName", host::Value::string(name));
    return instance;
}

} // namespace

class Up_Calls : public Every_Manner {};
NVR_IN_EVERY_MANNER(Up_Calls);

TEST_P(Up_Calls, AForeignComputerSystemBecomesTheHost)
{
    Rig rig({*GetParam()});
    rig.server().add_instance(foreign_host());
    const host::Answer ports = rig.enumerate("NVRHBA_FCPort");
    ASSERT_EQ(ports.instances.size(), 4u);
    for (const host::Instance& port : ports.instances) {
        EXPECT_EQ(port.get("SystemCreationClassName").as_text(), "IBMSD_ComputerSystem");
        EXPECT_EQ(port.get("SystemName").as_text(), "rack 7");
    }
    const host::Answer devices = rig.enumerate("NVRHBA_FCPortSystemDevice");
    ASSERT_EQ(devices.instances.size(), 4u);
    const host::Path* system = devices.instances[0].get("GroupComponent").as_path();
    ASSERT_TRUE(system);
    EXPECT_EQ(system->name_space, "root/ibmse");
    EXPECT_TRUE(host::same_name(system->class_name, "IBMSD_ComputerSystem")) << system->class_name;
    ASSERT_TRUE(system->find("Name"));
    EXPECT_EQ(system->find("Name")->as_text(), "rack 7");

    EXPECT_THAT(rig.enumerate("NVRHBA_ComputerSystemConformsToProfile").instances, IsEmpty());
    EXPECT_THAT(rig.words(), contains_in_order({"up-call - found the correct CIM_ComputerSystem to link",
                                                "This is IBM/VMWare comp Sys - do nothing"}));
    EXPECT_THAT(rig.words(), Not(Contains("up-call method failed")));
    EXPECT_EQ(left_beside_strings(rig.server().report()), 0u) << rig.server().report().to_text();
    EXPECT_THAT(rig.server().report().violations, IsEmpty());
}

TEST_P(Up_Calls, TheHostOfOurOwnKeepsItsConformanceWhenAForeignOneComesLater)
{
    Rig rig({*GetParam(), "small", refreshing_settings});
    const std::size_t profiles = rig.enumerate("NVRHBA_ComputerSystemConformsToProfile").instances.size();
    EXPECT_GE(profiles, 11u);
    rig.server().add_instance(foreign_host());
    rig.refresh();
    const host::Answer again = rig.enumerate("NVRHBA_ComputerSystemConformsToProfile");
    EXPECT_EQ(again.instances.size(), profiles);
    const host::Path* system = again.instances.at(0).get("ManagedElement").as_path();
    ASSERT_TRUE(system);
    EXPECT_EQ(system->name_space, "root/ibmse");
}

TEST_P(Up_Calls, ABaseServerProfileIsTiedToOurProfiles)
{
    Rig rig({*GetParam(), "small"});
    rig.server().add_instance(foreign_profile("other:1", "Something else"));
    rig.server().add_instance(foreign_profile("other:2", "base server"));
    rig.server().add_instance(foreign_profile("other:3", "Base Server"));
    const host::Answer ties = rig.enumerate("NVRHBA_BaseServerReferencedProfile");
    ASSERT_THAT(ties, succeeded());
    EXPECT_EQ(ties.instances.size(), 10u);
    for (const host::Instance& tie : ties.instances) {
        const host::Path* base = tie.get("Antecedent").as_path();
        ASSERT_TRUE(base);
        EXPECT_EQ(base->name_space, "root/pg_interop");
        ASSERT_TRUE(base->find("InstanceID"));
        EXPECT_EQ(base->find("InstanceID")->as_text(), "other:2");
    }
    // The profile "FC HBA" references two others, and is tied to the base once.
    EXPECT_EQ(rig.count_words("Insert Failed : m_NVRHBA_BaseServerReferencedProfile_map"), 1u);
    EXPECT_EQ(rig.enumerate("NVRHBA_ReferencedProfile").instances.size(), 11u);
    EXPECT_EQ(left_beside_strings(rig.server().report()), 0u) << rig.server().report().to_text();
}

TEST_P(Up_Calls, WithoutABaseServerProfileThereIsNoTie)
{
    Rig rig({*GetParam(), "small"});
    EXPECT_THAT(rig.enumerate("NVRHBA_BaseServerReferencedProfile").instances, IsEmpty());
    EXPECT_EQ(rig.enumerate("NVRHBA_ReferencedProfile").instances.size(), 11u);
}

TEST_P(Up_Calls, TheProfileThatWentIsNotTiedAnyMore)
{
    Rig rig({*GetParam(), "small", refreshing_settings});
    rig.server().add_instance(foreign_profile("other:2", "Base Server"));
    EXPECT_EQ(rig.enumerate("NVRHBA_BaseServerReferencedProfile").instances.size(), 10u);
    rig.server().clear_instances();
    rig.refresh();
    EXPECT_THAT(rig.enumerate("NVRHBA_BaseServerReferencedProfile").instances, IsEmpty());
    EXPECT_THAT(rig.words(), Contains("Destroying the Base Server Profile instance"));
}

// The fetch thread may outlive the request that started it; its up-calls need a context of their own.
TEST_P(Up_Calls, OfManyRefreshesLeaveNoContextBehind)
{
    Rig rig({*GetParam(), "small", refreshing_settings});
    rig.server().add_instance(foreign_host());
    for (int round = 0; round < 5; round++)
        rig.refresh();
    rig.stop();
    EXPECT_EQ(rig.server().report().contexts_not_detached, 0u);
    EXPECT_EQ(left_beside_strings(rig.server().report()), 0u) << rig.server().report().to_text();
}
