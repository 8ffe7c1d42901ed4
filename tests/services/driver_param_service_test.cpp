// The driver parameter service at its own interface: what no server hands over.
#include "classes/NVRHBA_FCHBADriverParamService.h"
#include "classes/NVRHBA_FCTagService.h"
#include "classes/NVRHBA_PortController.h"
#include "services/NVRHBA_FCHBADriverParamService_Provider.h"
#include "services/NVR_MethodWrapper.h"
#include "simulator/nvrsim.h"
#include "tests/services/Service_Host.h"

using namespace cimple;
using namespace nvrtest;
using testing::Contains;
using testing::ElementsAre;

namespace {

class DriverParamMethod : public ServiceHost {
protected:
    DriverParamMethod() : ServiceHost("[[adapter]]\n")
    {
        name.set("lun-queue-depth");
        value.set("64");
    }

    /// As a method of `self` with this Target, whatever their classes; the words go to `told`.
    uint32 set_parameter(const Instance* self, Instance* target)
    {
        words();
        auto* port = static_cast<NVRHBA_FCPort*>(target);
        Property<uint32> result{};
        EXPECT_EQ(provider.SetDriverParameter(static_cast<const NVRHBA_FCHBADriverParamService*>(self), port, permanent,
                                              global, name, value, result),
                  INVOKE_METHOD_OK);
        EXPECT_FALSE(result.null);
        told = words();
        return result.value;
    }
    Instance* service() { return agent().m_NVRHBA_FCHBADriverParamService_map[0]; }

    NVRHBA_FCHBADriverParamService_Provider provider;
    Property<boolean> permanent{}, global{};
    Property<String> name, value;
};

} // namespace

TEST_F(DriverParamMethod, IsForItsServiceAlone)
{
    EXPECT_EQ(set_parameter(service(), port()), 0u);
    EXPECT_EQ(set_parameter(agent().m_NVRHBA_FCTagService_map[0], port()), 33068u);
    EXPECT_EQ(told.back(), "Invalid instance of HBA Driver Parameter Service");
    EXPECT_EQ(set_parameter(port(), port()), 33068u);
    EXPECT_EQ(set_parameter(nullptr, port()), 33068u);
    // Without one that is published, any of the class will do.
    const Ref<NVRHBA_FCHBADriverParamService> nobody(create_as<NVRHBA_FCHBADriverParamService>(true));
    nobody->Name.set("nobody");
    EXPECT_EQ(set_parameter(nobody.get(), port()), 33068u);
    agent().m_NVRHBA_FCHBADriverParamService_map.clear();
    EXPECT_EQ(set_parameter(nobody.get(), port()), 0u);
    EXPECT_EQ(set_parameter(port(), port()), 33068u);
}

TEST_F(DriverParamMethod, TakesNoTargetOfAnotherClass)
{
    // It has the port's own DeviceID.
    EXPECT_EQ(set_parameter(service(), agent().m_NVRHBA_PortController_map[0]), 32968u);
    EXPECT_EQ(told.back(), "NVRHBA_FCHBADriverParamService_Provider invald fc port ...return");
    EXPECT_EQ(set_parameter(service(), service()), 32968u);
    EXPECT_EQ(set_parameter(service(), nullptr), 32968u);
    EXPECT_EQ(told.back(), "NVRHBA_FCHBADriverParamService_Provider SetDriverParameter invald fc port ...return");
    // A port without a key.
    const Ref<NVRHBA_FCPort> unnamed(create_as<NVRHBA_FCPort>(true));
    EXPECT_EQ(set_parameter(service(), unnamed.get()), 32968u);
    EXPECT_EQ(nvrsim_calls("RM_SetDriverParam"), 0u);
}

TEST_F(DriverParamMethod, NeedsAPortWithAName)
{
    EXPECT_EQ(set_parameter(service(), known_port("no name").get()), 32968u);
    EXPECT_EQ(told.back(), "NVRHBA_FCHBADriverParamService_Provider::str2HBAName failed");
    EXPECT_THAT(told, Contains("no name"));
}

TEST_F(DriverParamMethod, TextsEndAtTheirFirstZeroByte)
{
    name.set(String("lun-queue-depth\0=9", 18));
    value.set(String("65\0junk", 7));
    EXPECT_EQ(set_parameter(service(), port()), 0u);
    EXPECT_THAT(told, Contains("pParamStr:[lun-queue-depth=65], Ccw:[0]"));
}

TEST_F(DriverParamMethod, NullFlagsAreFalseWhateverTheyHold)
{
    permanent.set(true);
    permanent.null = 1;
    global.set(true);
    global.null = 1;
    EXPECT_EQ(set_parameter(service(), port()), 0u);
    EXPECT_THAT(told, Contains("pParamStr:[lun-queue-depth=64], Ccw:[0]"));
}

TEST_F(DriverParamMethod, TheOperationChecksItsArgumentsInOrder)
{
    const auto operate = [&](uint32 CW1, uint32 CW2, const char* parameter, const char* text) {
        words();
        const uint32 status =
            NVR_MethodWrapper::nvrcimSetDriverParam(first_wwpn, first_name, CW1, CW2, parameter, text);
        told = words();
        return status;
    };
    EXPECT_EQ(operate(2, 2, nullptr, nullptr), 1u);
    EXPECT_THAT(told,
                ElementsAre("NVR_MethodWrapper::nvrcimSetDriverParam()", "Entering NVR_MethodWrapper::Validatewwpn()",
                            "RM_IsLocalHBA: status=0", "INVALID CW1"));
    EXPECT_EQ(operate(1, 2, nullptr, nullptr), 1u);
    EXPECT_EQ(told.back(), "INVALID CW2");
    EXPECT_EQ(operate(1, 4294967295u, "a", "b"), 1u);
    EXPECT_EQ(told.back(), "INVALID CW2");
    EXPECT_EQ(operate(1, 1, nullptr, nullptr), 1u);
    EXPECT_EQ(told.back(), "Null pointer assignment in argument pDriverParam");
    EXPECT_EQ(operate(1, 1, "nodev-tmo", nullptr), 1u);
    EXPECT_EQ(told.back(), "Null pointer assignment in argument pVal");
    fault("call = \"RM_IsLocalHBA\", status = 5");
    EXPECT_EQ(operate(2, 2, nullptr, nullptr), 1u);
    EXPECT_EQ(told.back(), "INVALID wwpn");
    EXPECT_EQ(nvrsim_calls("RM_SetDriverParam"), 0u);
}
