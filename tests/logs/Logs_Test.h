/// A loaded agent over one simulated adapter, and the record logs as clients steer them.
#pragma once

#include <limits>

#include "classes/CIM_ComputerSystem.h"
#include "classes/CIM_ConcreteJob.h"
#include "logs/NVRHBA_RecordLog_Provider.h"
#include "tests/agent/Simulated_Host.h"
#include "tests/support/private_host.h"
#include "tests/support/short_memory.h"

namespace nvrtest {

/// What a method answers that sets no return value.
constexpr cimple::uint32 unset = std::numeric_limits<cimple::uint32>::max();

class Logs_Test : public SimulatedHost {
protected:
    Logs_Test()
    {
        remove("/etc/norvane_fc_provider.dmp");
        EXPECT_EQ(load(), 0);
    }
    ~Logs_Test() override
    {
        cimple::CLogger::instance()->enable(); // its words tell when the last refresh ends
        settle();
        unload();
    }

    std::string host_name()
    {
        const auto& hosts = agent().m_CIM_ComputerSystem_map;
        return hosts.empty() ? "" : value(hosts[0], "Name");
    }
    std::string provider_log() { return "NVRHBA:ProviderLog:" + host_name(); }
    std::string driver_log() { return "NVR: FC Driver Record Log:" + host_name(); }

    /// The map's instance of that key, or null.
    const Instance* log_of(const std::string& id)
    {
        const auto& logs = agent().m_NVRHBA_RecordLog_map;
        for (std::size_t i = 0; i < logs.size(); i++)
            if (value(logs[i], "InstanceID") == id) return logs[i];
        return nullptr;
    }

    /// A method's return value; `unset` where it sets none, and then its own result is in m_result.
    cimple::uint32 set_params(const std::string& id, cimple::uint16 level, cimple::uint16 mode, const std::string& path)
    {
        cimple::Property<cimple::uint16> level_value, mode_value;
        cimple::Property<cimple::String> path_value;
        level_value.set(level);
        mode_value.set(mode);
        path_value.set(cimple::String(path.c_str()));
        return answered([&](cimple::Property<cimple::uint32>& value) {
            return provider.SetLogParams(target(id).get(), level_value, mode_value, path_value, value);
        });
    }
    cimple::uint32 clear(const std::string& id)
    {
        return answered(
            [&](cimple::Property<cimple::uint32>& value) { return provider.ClearLog(target(id).get(), value); });
    }
    cimple::uint32 request(const std::string& id, cimple::uint16 state)
    {
        cimple::Property<cimple::uint16> wanted;
        wanted.set(state);
        return request(target(id).get(), wanted);
    }
    cimple::uint32 request(const cimple::NVRHBA_RecordLog* self, const cimple::Property<cimple::uint16>& wanted)
    {
        cimple::CIM_ConcreteJob* job = nullptr;
        return answered([&](cimple::Property<cimple::uint32>& value) {
            return provider.RequestStateChange(self, wanted, job, {}, value);
        });
    }
    template <class Call>
    cimple::uint32 answered(Call call)
    {
        cimple::Property<cimple::uint32> value = {0, 1};
        m_result = call(value);
        settle();
        return value.null ? unset : value.value;
    }

    static Ref<cimple::NVRHBA_RecordLog> target(const std::string& id)
    {
        Ref<cimple::NVRHBA_RecordLog> self(cimple::create_as<cimple::NVRHBA_RecordLog>());
        self->InstanceID.set(cimple::String(id.c_str()));
        return self;
    }

    template <class Provider>
    Instances enumerate()
    {
        Provider one;
        Instances all;
        EXPECT_EQ(one.enum_instances(nullptr, {collect, &all}), 0);
        settle();
        return all;
    }

    /// With each allocation refused in turn: these words and nothing else, at last all.
    template <class Provider>
    void expect_all_or_nothing(const char* failure, std::size_t all)
    {
        Provider one;
        std::vector<Instance*> seen;
        const cimple::Enum_Handler handler = {[](Instance* instance, int, void* data) {
                                                  static_cast<std::vector<Instance*>*>(data)->push_back(instance);
                                                  return true;
                                              },
                                              &seen};
        seen.reserve(all); // its memory is not the module's
        words();
        const long refused = refuse_each_allocation([&] { EXPECT_EQ(one.enum_instances(nullptr, handler), 0); },
                                                    [&](bool has_thrown) {
                                                        EXPECT_FALSE(has_thrown);
                                                        EXPECT_EQ(words().back(), failure);
                                                        EXPECT_TRUE(seen.empty());
                                                    });
        EXPECT_GT(refused, 10);
        EXPECT_EQ(seen.size(), all);
        for (Instance* instance : seen)
            cimple::unref(instance);
        settle();
    }

    cimple::NVRHBA_RecordLog_Provider provider;
    int m_result = 0;
};

} // namespace nvrtest
