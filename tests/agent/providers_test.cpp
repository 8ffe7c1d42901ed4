#include "agent/NVRHBA_FCPortStatistics_Provider.h"
#include "agent/NVRHBA_ProviderConfigSetting_Provider.h"
#include "agent/NVRHBA_RegisteredProfile_Provider.h"
#include "classes/NVRHBA_PortController.h"
#include "classes/NVRHBA_Realizes.h"
#include "classes/NVRHBA_StorageVolume.h"
#include "classes/derivedObjects/Derived_Provider.h"
#include "services/NVRHBA_BootBIOSService_Provider.h"
#include "services/NVRHBA_DriverParamGlobal_Provider.h"
#include "services/NVRHBA_DriverParams_Provider.h"
#include "services/NVRHBA_DumpData_Provider.h"
#include "services/NVRHBA_FCPort_Provider.h"
#include "simulator/nvrsim.h"
#include "tests/agent/Simulated_Host.h"

using namespace cimple;
using namespace nvrtest;
using testing::Contains;
using testing::Not;
using testing::SizeIs;

namespace {

class Providers : public SimulatedHost {
protected:
    ~Providers() override
    {
        settle();
        if (m_loaded) unload();
    }
    void start()
    {
        ASSERT_EQ(load(), 0);
        m_loaded = true;
    }
    template <class Provider>
    Instances enumerate(Provider& provider)
    {
        Instances all;
        EXPECT_EQ(provider.enum_instances(nullptr, {collect, &all}), 0);
        return all;
    }

private:
    bool m_loaded = false;
};

struct Realizes_Family {
    using Class = NVRHBA_Realizes;
    static constexpr const char* name = "NVRHBA_Realizes_Provider";
    static constexpr const char* file = "derivedObjects/NVRHBA_Realizes_Provider";
    static constexpr bool is_san = false;
    static auto& map(ProviderAgent& agent) { return agent.m_NVRHBA_Realizes_map; }
};

struct StorageVolume_Family {
    using Class = NVRHBA_StorageVolume;
    static constexpr const char* name = "NVRHBA_StorageVolume_Provider";
    static constexpr const char* file = "derivedObjects/NVRHBA_StorageVolume_Provider";
    static constexpr bool is_san = true;
    static auto& map(ProviderAgent& agent) { return agent.m_NVRHBA_StorageVolume_map; }
};

class ConfigSetting : public Providers {
protected:
    ConfigSetting() { start(); }

    /// What a client's modifyInstance of `current` answers.
    int modify(const char* name, uint32 current)
    {
        const auto made = setting(name);
        made->current.set(current);
        return provider.modify_instance(made.get(), made.get());
    }
    static Ref<NVRHBA_ProviderConfigSetting> setting(const char* name)
    {
        Ref<NVRHBA_ProviderConfigSetting> made(create_as<NVRHBA_ProviderConfigSetting>(true));
        made->InstanceID.set((std::string("Norvane HBA Provider:") + name).c_str());
        return made;
    }
    std::string current(std::size_t index) { return value(enumerate(provider)[index].get(), "current"); }

    NVRHBA_ProviderConfigSetting_Provider provider;
};

} // namespace

TEST_F(Providers, ADerivedOneSaysItsOwnNameInItsOwnFile)
{
    Derived_Provider<Realizes_Family> provider;
    ASSERT_EQ(provider.load(), 0);
    words();
    EXPECT_THAT(enumerate(provider), SizeIs(1));
    settle();
    bool found = false;
    for (const auto& record : log->records())
        if (record.text == "NVRHBA_Realizes_Provider::enum_instances()") {
            found = true;
            EXPECT_EQ(record.file, "derivedObjects/NVRHBA_Realizes_Provider");
            EXPECT_EQ(record.level, 5);
        }
    EXPECT_TRUE(found);
    words();
    EXPECT_EQ(provider.unload(), 0);
    EXPECT_THAT(words(), contains_in_order({"NVRHBA_Realizes_Provider::unload()", "ProviderAgent::releaseRef[1]"}));
}

TEST_F(Providers, ADerivedOneSupportsNothingButItsEnumeration)
{
    Derived_Provider<Realizes_Family> provider;
    NVRHBA_Realizes* found = nullptr;
    EXPECT_EQ(provider.get_instance(nullptr, found), 61);
    EXPECT_EQ(provider.create_instance(nullptr), 81);
    EXPECT_EQ(provider.delete_instance(nullptr), 91);
    EXPECT_EQ(provider.modify_instance(nullptr, nullptr), 101);
    const Enum_Handler handler{collect, nullptr};
    EXPECT_EQ(provider.enum_associator_names(nullptr, nullptr, nullptr, nullptr, handler), 111);
    EXPECT_EQ(provider.enum_references(nullptr, nullptr, nullptr, handler), 121);
    EXPECT_EQ(provider.enum_associators(nullptr, nullptr, nullptr, nullptr, handler), 171);
    EXPECT_EQ(sizeof provider, 1u);
}

TEST_F(Providers, ASANOneAsksForTheSANPhase)
{
    start();
    agent().m_bRefreshSANData = false;
    Derived_Provider<StorageVolume_Family> provider;
    enumerate(provider);
    EXPECT_THAT(words(),
                contains_in_order({"PERF: Building SAN Data...", "NVRHBA_StorageVolume_Provider::enum_instances()"}));
}

TEST_F(Providers, RefusedLoadsAnswer30AndTheActiveOnesSayWhy)
{
    install({});
    NVRHBA_FCPort_Provider ports;
    NVRHBA_FCPortStatistics_Provider statistics;
    NVRHBA_DriverParams_Provider params;
    NVRHBA_DriverParamGlobal_Provider global_params;
    EXPECT_EQ(ports.load(), 30);
    EXPECT_EQ(statistics.load(), 30);
    EXPECT_EQ(params.load(), 30);
    EXPECT_EQ(global_params.load(), 30);
    words();
    EXPECT_TRUE(enumerate(ports).empty());
    EXPECT_TRUE(enumerate(statistics).empty());
    EXPECT_TRUE(enumerate(params).empty());
    EXPECT_TRUE(enumerate(global_params).empty());
    EXPECT_EQ(words(), (std::vector<std::string>{"RM Init failed for services/NVRHBA_FCPort_Provider.cpp",
                                                 "RM Init failed for agent/NVRHBA_FCPortStatistics_Provider.cpp",
                                                 "RM Init failed for services/NVRHBA_DriverParams_Provider.cpp",
                                                 "RM Init failed for services/NVRHBA_DriverParamGlobal_Provider.cpp"}));
    ports.unload();
    statistics.unload();
    params.unload();
    global_params.unload();
    EXPECT_THAT(words(), Contains("Norvane Provider Unloaded"));
}

TEST_F(Providers, PortsShowTheirLiveStatus)
{
    start();
    NVRHBA_FCPort_Provider provider;
    EXPECT_THAT(enumerate(provider), SizeIs(1));
    nvrsim_set("0", "state", 3);
    advance_clock(10 * second);
    EXPECT_EQ(value(enumerate(provider)[0].get(), "StatusDescriptions"), "{Stopped}");
    EXPECT_THAT(words(), Contains("NVRHBA_FCPort_Provider::enum_instances()"));
    EXPECT_EQ(provider.modify_instance(nullptr, nullptr), 102);
}

TEST_F(Providers, ProfilesAreThereBeforeAnyRefresh)
{
    NVRHBA_RegisteredProfile_Provider provider;
    const Instances all = enumerate(provider);
    ASSERT_THAT(all, SizeIs(13));
    const char* rows[13][3] = {{"Profile Registration", "2", "1.0.0"},
                               {"Software Inventory", "2", "1.0.0"},
                               {"Physical Package", "11", "1.3.0"},
                               {"Host Discovered Resources", "11", "1.2.0"},
                               {"FC HBA", "11", "1.2.0"},
                               {"Storage HBA", "11", "1.4.0"},
                               {"FC Initiator Ports", "11", "1.3.0"},
                               {"Software Update", "2", "1.0.0"},
                               {"Record Log", "2", "1.0.1"},
                               {"Software", "11", "1.2.0"},
                               {"Access Points", "11", "1.3.0"},
                               {"PCI Device", "2", "1.0.0"},
                               {"FCHBA Diagnostics", "2", "1.0.0"}};
    for (std::size_t i = 0; i < 13; i++) {
        const Instance* profile = all[i].get();
        EXPECT_EQ(value(profile, "RegisteredName"), rows[i][0]);
        EXPECT_EQ(value(profile, "RegisteredOrganization"), rows[i][1]);
        EXPECT_EQ(value(profile, "RegisteredVersion"), rows[i][2]);
        EXPECT_EQ(value(profile, "InstanceID"), std::string("NVR:") + rows[i][0]);
        EXPECT_EQ(value(profile, "ElementName"), std::string("Norvane Registered ") + rows[i][0]);
        EXPECT_EQ(value(profile, "Description"), std::string("Norvane ") + rows[i][0]);
        EXPECT_EQ(value(profile, "AdvertiseTypes"), "{3}");
        EXPECT_EQ(value(profile, "AdvertiseTypeDescriptions"), "{SLP}");
        EXPECT_STREQ(profile->__name_space.c_str(), "root/pg_interop");
    }
    EXPECT_EQ(words(), std::vector<std::string>{"NVRHBA_RegisteredProfile_Provider::enum_instances()"});
}

TEST_F(Providers, StartServiceDoesNothingAndSaysSo)
{
    NVRHBA_BootBIOSService_Provider provider;
    Property<uint32> result{7, 1};
    EXPECT_EQ(provider.StartService(nullptr, result), 0);
    EXPECT_EQ(result.value, 0u);
    EXPECT_EQ(result.null, 0);
    EXPECT_EQ(provider.StopService(nullptr, result), 131);
    EXPECT_EQ(provider.RequestStateChange(nullptr), 131);
}

TEST_F(Providers, AnEmptyMapGivesNothingAndLogsNoError)
{
    start();
    NVRHBA_DumpData_Provider provider;
    EXPECT_TRUE(enumerate(provider).empty());
    EXPECT_THAT(words(), Contains("NVRHBA_DumpData_Provider::enum_instances()"));
}

TEST_F(ConfigSetting, TakesATimeOutFrom1To30ThoughItSaysFrom5)
{
    EXPECT_EQ(modify("cachetimeout", 3), 0);
    EXPECT_EQ(current(0), "3");
    EXPECT_EQ(agent().m_cacheTimeout, 3u);
    EXPECT_EQ(agent().m_config.getCacheTimeout(), 3u);
    words();
    EXPECT_EQ(modify("cachetimeout", 31), 102);
    EXPECT_THAT(words(), contains_in_order({"NVRHBA_ProviderConfigSetting_Provider::modify_instance()",
                                            "PERF: ---BuildCimpleInfo BEGIN---",
                                            "The value provided for cache time-out is out of range"}));
    EXPECT_EQ(modify("cachetimeout", 0), 102);
    EXPECT_EQ(current(0), "3");
    EXPECT_EQ(words().back(), "NVRHBA_ProviderConfigSetting_Provider::enum_instances()");
}

TEST_F(ConfigSetting, TakesTheFlagsAs0Or1)
{
    EXPECT_EQ(modify("adapterrefresh", 1), 0);
    EXPECT_TRUE(agent().m_bRefreshAdapterData);
    EXPECT_EQ(modify("sanrefresh", 0), 0);
    EXPECT_FALSE(agent().m_bRefreshSANData);
    EXPECT_THAT(words(), contains_in_order(
                             {"Adapter refresh is modified successfully", "SAN refresh is modified successfully"}));
    EXPECT_EQ(modify("sanrefresh", 2), 102);
    EXPECT_EQ(modify("adapterrefresh", 2), 102);
    EXPECT_THAT(words(), contains_in_order({"The value provided for SAN refresh out is out of range",
                                            "The value provided for adapter refresh out is out of range"}));
    EXPECT_EQ(current(1), "1");
    EXPECT_EQ(current(2), "0");
}

TEST_F(ConfigSetting, AChangeSurvivesTheNextRefresh)
{
    EXPECT_EQ(modify("cachetimeout", 20), 0);
    refresh();
    plain(agent().m_NVRHBA_FCPort_map);
    EXPECT_EQ(current(0), "20");
}

TEST_F(ConfigSetting, RefusesWhatIsMissingUnknownOrForeign)
{
    const auto known = setting("sanrefresh");
    EXPECT_EQ(provider.modify_instance(nullptr, known.get()), 102);
    EXPECT_EQ(provider.modify_instance(known.get(), nullptr), 102);
    EXPECT_THAT(words(), Contains("NVRHBA_ProviderConfigSetting_Provider::modify_instance invalid parameter"));
    EXPECT_EQ(provider.modify_instance(known.get(), known.get()), 104); // `current` is null
    EXPECT_EQ(modify("unheard of", 1), 104);
    EXPECT_THAT(words(), Contains("Instance does not exist"));
    const Ref<Instance> foreign(create(&NVRHBA_PortController::meta, true));
    const auto* disguised = static_cast<const NVRHBA_ProviderConfigSetting*>(foreign.get());
    EXPECT_EQ(provider.modify_instance(disguised, disguised), 104);
    Mutex& data = agent().m_DataMutex;
    EXPECT_EQ(data.try_lock(), 0); // released on every path
    data.unlock();
}
