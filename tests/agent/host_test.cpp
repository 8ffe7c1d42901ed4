#include <strings.h>

#include "classes/CIM_RegisteredProfile.h"
#include "classes/IBMSD_ComputerSystem.h"
#include "runtime/Thread_Context.h"
#include "tests/agent/Simulated_Host.h"

using namespace cimple;
using namespace nvrtest;
using testing::Contains;
using testing::Not;
using testing::SizeIs;

namespace {

/// What other providers of the server publish.
struct Published {
    std::vector<Ref<Instance>> systems;
    std::vector<Ref<Instance>> profiles;
    bool throws = false;
};

Ref<Instance> computer_system(const char* name)
{
    Ref<IBMSD_ComputerSystem> made(create_as<IBMSD_ComputerSystem>(true));
    made->CreationClassName.set("IBMSD_ComputerSystem");
    made->Name.set(name);
    return Ref<Instance>(made.release());
}

Ref<Instance> profile(const char* name)
{
    Ref<CIM_RegisteredProfile> made(create_as<CIM_RegisteredProfile>(true));
    made->InstanceID.set(name);
    made->RegisteredName.set(name);
    made->__name_space = "root/pg_interop";
    return Ref<Instance>(made.release());
}

/// A server's answers to up-calls.
class Context : public Thread_Context {
public:
    explicit Context(const Published& published) : m_published(published) {}

    Thread_Context* thread_create_hook(void*) override { return new Context(m_published); }
    void thread_start_hook() override {}
    void thread_exit_hook() override {}
    Instance_Enumerator_Rep* instance_enumerator_create(const char* name_space, const Instance* model) override
    {
        if (m_published.throws) throw std::runtime_error("server");
        m_next = 0;
        m_open = nullptr;
        if (strcasecmp(name_space, "root/ibmse") == 0 && model->meta_class == &IBMSD_ComputerSystem::meta)
            m_open = &m_published.systems;
        if (strcasecmp(name_space, "root/pg_interop") == 0 && model->meta_class == &CIM_RegisteredProfile::meta)
            m_open = &m_published.profiles;
        return m_open && !m_open->empty() ? reinterpret_cast<Instance_Enumerator_Rep*>(this) : nullptr;
    }
    void instance_enumerator_destroy(Instance_Enumerator_Rep*) override { m_open = nullptr; }
    bool instance_enumerator_more(Instance_Enumerator_Rep*) override { return m_open && m_next < m_open->size(); }
    void instance_enumerator_next(Instance_Enumerator_Rep*) override { m_next++; }
    Instance* instance_enumerator_get(Instance_Enumerator_Rep*) override
    {
        Instance* instance = (*m_open)[m_next].get();
        ref(instance);
        return instance;
    }
    Instance* get_instance(const char*, const Instance*) override { return nullptr; }
    int create_instance(const char*, const Instance*) override { return -1; }
    int delete_instance(const char*, const Instance*) override { return -1; }
    int modify_instance(const char*, const Instance*) override { return -1; }
    int invoke_method(const char*, const Instance*, Instance*) override { return -1; }
    void allow_unload(bool) override {}
    bool get_username(String&) override { return false; }

private:
    const Published& m_published;
    const std::vector<Ref<Instance>>* m_open = nullptr;
    std::size_t m_next = 0;
};

class ForeignHost : public SimulatedHost {
protected:
    ForeignHost()
    {
        Thread_Context::push(&m_context);
        EXPECT_EQ(load(), 0);
    }
    ~ForeignHost() override
    {
        settle();
        unload();
        Thread_Context::pop();
    }
    Published published;

private:
    Context m_context{published};
};

} // namespace

TEST_F(ForeignHost, IsTakenFromTheServerAndNamedByItsOwnClassAndNamespace)
{
    published.systems = {computer_system("rack-7"), computer_system("rack-8")};
    const Instances ports = plain(agent().m_NVRHBA_FCPort_map);
    ASSERT_THAT(ports, SizeIs(1));
    EXPECT_EQ(value(ports[0].get(), "SystemCreationClassName"), "IBMSD_ComputerSystem");
    EXPECT_EQ(value(ports[0].get(), "SystemName"), "rack-7");
    EXPECT_FALSE(agent().m_bOwnComputerSystem);
    const Instances devices = plain(agent().m_NVRHBA_FCPortSystemDevice_map);
    ASSERT_THAT(devices, SizeIs(1));
    EXPECT_EQ(end(devices[0].get(), "GroupComponent", "Name"), "rack-7");
    const Meta_Feature* group = find_feature(devices[0]->meta_class, "GroupComponent", META_FLAG_REFERENCE);
    EXPECT_STREQ(reference_of(devices[0].get(), as_reference(group))->__name_space.c_str(), "root/ibmse");
    EXPECT_TRUE(plain(agent().m_NVRHBA_ComputerSystemConformsToProfile_map).empty());
    const auto said = words();
    EXPECT_THAT(said, Contains("up-call - found the correct CIM_ComputerSystem to link"));
    EXPECT_EQ(std::count(said.begin(), said.end(), "This is IBM/VMWare comp Sys - do nothing"), 13);
    EXPECT_THAT(said, Not(Contains("up-call method failed")));
}

TEST_F(ForeignHost, AnotherClassIsNoHost)
{
    published.systems = {profile("no system")};
    plain(agent().m_NVRHBA_FCPort_map);
    EXPECT_TRUE(agent().m_bOwnComputerSystem);
    EXPECT_THAT(words(), Contains("up-call method failed"));
}

TEST_F(ForeignHost, ABaseServerProfileIsReferencedByEachProfile)
{
    published.profiles = {profile("SMI-S"), profile("base server")};
    const Instances tied = plain(agent().m_NVRHBA_BaseServerReferencedProfile_map);
    EXPECT_THAT(tied, SizeIs(10));
    EXPECT_THAT(plain(agent().m_NVRHBA_ReferencedProfile_map), SizeIs(11));
    EXPECT_EQ(end(tied[0].get(), "Antecedent", "RegisteredName"), "base server");
    EXPECT_STREQ(tied[0]->__name_space.c_str(), "root/pg_interop");
    const auto said = words();
    EXPECT_THAT(said, contains_in_order({"up-call to enumerate CIM_RegisteredProfile Passed",
                                         "up-call - found the correct CIM_RegisteredProfile to link"}));
    // "FC HBA" is tied to two profiles, so its reference to the Base Server is refused once.
    EXPECT_EQ(std::count(said.begin(), said.end(), "Insert Failed : m_NVRHBA_BaseServerReferencedProfile_map"), 1);

    refresh();
    EXPECT_THAT(plain(agent().m_NVRHBA_BaseServerReferencedProfile_map), SizeIs(10));
    EXPECT_THAT(words(), Contains("Destroying the Base Server Profile instance"));
}

TEST_F(ForeignHost, AHostOnceGeneratedKeepsItsConformanceWhenAForeignOneAppears)
{
    plain(agent().m_NVRHBA_FCPort_map);
    EXPECT_TRUE(agent().m_bOwnComputerSystem);
    published.systems = {computer_system("rack-7")};
    refresh();
    const Instances conforms = plain(agent().m_NVRHBA_ComputerSystemConformsToProfile_map);
    ASSERT_THAT(conforms, SizeIs(13));
    EXPECT_EQ(end(conforms[0].get(), "ManagedElement", "Name"), "rack-7");
}

TEST_F(ForeignHost, AServerThatThrowsCostsTheMapsAndNotTheProcess)
{
    published.throws = true;
    EXPECT_TRUE(plain(agent().m_NVRHBA_FCPort_map).empty());
    EXPECT_THAT(words(), contains_in_order({"No FC card found", "PERF: Building SAN Data..."}));
    published.throws = false;
    refresh();
    EXPECT_THAT(plain(agent().m_NVRHBA_FCPort_map), SizeIs(1));
}
