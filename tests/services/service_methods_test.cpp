// What only the providers' own interface shows: targets and instances of other classes, keys that are no names, maps
// that are empty, and exceptions.
#include "agent/Clock.h"
#include "agent/beacon.h"
#include "agent/instance_table.h"
#include "classes/NVRHBA_PortController.h"
#include "classes/NVRHBA_SoftwareInstallationService.h"
#include "services/NVRHBA_BootBIOSService_Provider.h"
#include "services/NVRHBA_FCHBAWWNService_Provider.h"
#include "services/NVRHBA_FCPort_Provider.h"
#include "services/NVR_MethodWrapper.h"
#include "services/service_method.h"
#include "simulator/nvrsim.h"
#include "tests/services/Service_Host.h"

using namespace cimple;
using namespace nvrtest;
using testing::Contains;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::Not;

namespace {

template <class T>
Property<T> none()
{
    return {T(), 1};
}

Property<uint16> type(uint16 value)
{
    return {value, 0};
}

Property<String> text_value(const char* value)
{
    return {value, 0};
}

constexpr char no_wwpn_port[] = "NVRHBA_FCHBAWWNService_Provider invald port ...return";

class ServiceMethods : public ServiceHost {
protected:
    ServiceMethods() : ServiceHost("[[adapter]]\n[[target]]\nluns = 2\n") {}

    const Instance* wwn_service() { return agent().m_NVRHBA_FCHBAWWNService_map[0]; }
    const Instance* boot_service() { return agent().m_NVRHBA_BootBIOSService_map[0]; }

    /// An instance of another class with the key of the first port.
    Ref<NVRHBA_PortController> namesake()
    {
        auto controller = make<NVRHBA_PortController>();
        controller->DeviceID = port()->DeviceID;
        return controller;
    }
    /// Puts a port with that key into the map, as no library's name would give it.
    NVRHBA_FCPort* publish(const char* device_id)
    {
        Ref<NVRHBA_FCPort> odd(clone_as(port()));
        set(odd->DeviceID, device_id);
        NVRHBA_FCPort* published = odd.get();
        EXPECT_GE(agent().m_NVRHBA_FCPort_map.insert(odd.release()), 0);
        return published;
    }

    uint32 read_names(const Instance* self, const Instance* target)
    {
        Property<String> wwpn = none<String>(), wwnn = none<String>();
        Property<uint16> status = none<uint16>();
        Property<uint32> value = none<uint32>();
        EXPECT_EQ(m_wwn.ReadWWN(self, target, type(2), wwpn, wwnn, status, value), INVOKE_METHOD_OK);
        EXPECT_EQ(value.null, 0);
        return value.value;
    }
    uint32 boot_status(const Instance* self, const Instance* target)
    {
        Property<uint32> status = none<uint32>(), value = none<uint32>();
        EXPECT_EQ(m_boot.GetBootBIOSStatus(self, target, status, value), INVOKE_METHOD_OK);
        EXPECT_EQ(status.null, value.value == 0 ? 0 : 1);
        return value.value;
    }
    uint32 switch_boot(bool on, const Instance* self, const Instance* target)
    {
        Property<uint32> value = none<uint32>();
        EXPECT_EQ(on ? m_boot.EnableBootBIOS(self, target, value) : m_boot.DisableBootBIOS(self, target, value),
                  INVOKE_METHOD_OK);
        return value.value;
    }
    int modify(const Instance* instance) { return NVRHBA_FCPort_Provider().modify_instance(instance, instance); }

    NVRHBA_FCHBAWWNService_Provider m_wwn;
    NVRHBA_BootBIOSService_Provider m_boot;
};

} // namespace

TEST_F(ServiceMethods, OfNamesRefuseATargetOfAnotherClass)
{
    const Ref<NVRHBA_PortController> other = namesake();
    EXPECT_EQ(read_names(wwn_service(), other.get()), 32968u);
    const auto told = words();
    EXPECT_THAT(told, Contains(no_wwpn_port));
    EXPECT_THAT(told, Not(Contains("Checking the FCPort")));
    EXPECT_EQ(read_names(wwn_service(), wwn_service()), 32968u);
    EXPECT_EQ(read_names(wwn_service(), port()), 0u);
}

TEST_F(ServiceMethods, OfBootCodeTakeATargetOfAnyClassWithAKnownKey)
{
    const Ref<NVRHBA_PortController> other = namesake();
    EXPECT_EQ(switch_boot(true, boot_service(), other.get()), 0u);
    EXPECT_EQ(boot_status(boot_service(), other.get()), 0u);
    EXPECT_EQ(switch_boot(false, boot_service(), other.get()), 0u);
    words();
    // A class without such a key, and one whose key has no value.
    EXPECT_EQ(boot_status(boot_service(), boot_service()), 32968u);
    EXPECT_THAT(words(), Contains("NVRHBA_BootBIOSService_Provider invald fc port ...return"));
    other->DeviceID.null = 1;
    EXPECT_EQ(switch_boot(true, boot_service(), other.get()), 32968u);
    EXPECT_THAT(words(), Contains("Could not find the passed FCPort in the map"));
}

TEST_F(ServiceMethods, RefuseAnInstanceOfAnotherClassEvenWithoutAService)
{
    for (const bool published : {true, false}) {
        if (!published) {
            agent().m_NVRHBA_FCHBAWWNService_map.clear();
            agent().m_NVRHBA_BootBIOSService_map.clear();
        }
        for (const Instance* self : {static_cast<const Instance*>(nullptr), static_cast<const Instance*>(port())}) {
            words();
            EXPECT_EQ(read_names(self, port()), 33068u);
            EXPECT_THAT(words(), Contains("Invalid instance of HBA WWN Management Service"));
            EXPECT_EQ(boot_status(self, port()), 33068u);
            EXPECT_EQ(switch_boot(true, self, port()), 33068u);
            EXPECT_THAT(words(), Contains("Invalid instance of Boot BIOS Service"));
        }
    }
}

// Before the first refresh nobody can know the service's keys.
TEST_F(ServiceMethods, TakeAnyInstanceOfTheirClassWhileThereIsNoService)
{
    Ref<NVRHBA_FCHBAWWNService> wwn(make<NVRHBA_FCHBAWWNService>());
    Ref<NVRHBA_BootBIOSService> boot(make<NVRHBA_BootBIOSService>());
    EXPECT_EQ(read_names(wwn.get(), port()), 33068u);
    EXPECT_EQ(boot_status(boot.get(), port()), 33068u);
    agent().m_NVRHBA_FCHBAWWNService_map.clear();
    agent().m_NVRHBA_BootBIOSService_map.clear();
    EXPECT_EQ(read_names(wwn.get(), port()), 0u);
    EXPECT_EQ(boot_status(boot.get(), port()), 0u);
}

TEST_F(ServiceMethods, RefuseAPortWhoseKeyIsNoName)
{
    const Instance* odd = publish("port one");
    EXPECT_EQ(read_names(wwn_service(), odd), 32968u);
    EXPECT_THAT(words(), Contains("NVRHBA_FCHBAWWNService_Provider::str2HBAName failed"));
    EXPECT_EQ(boot_status(boot_service(), odd), 32968u);
    EXPECT_THAT(words(), Contains("NVRHBA_BootBIOSService_Provider::str2HBAName failed"));
    EXPECT_EQ(switch_boot(true, boot_service(), odd), 32968u);
    EXPECT_EQ(nvrsim_calls("RM_ReadWWN") + nvrsim_calls("RM_SetBootBiosState"), 0u);

    Property<uint16> status = none<uint16>();
    Property<uint32> value = none<uint32>();
    m_wwn.ChangeWWN(wwn_service(), odd, none<String>(), none<String>(), type(0), status, value);
    EXPECT_EQ(value.value, 32968u);
    EXPECT_EQ(status.value, 65535);
}

TEST_F(ServiceMethods, CountANameWithoutAValueAsMissing)
{
    Property<uint16> status = none<uint16>();
    Property<uint32> value = none<uint32>();
    // The text behind a null byte is none.
    Property<String> gone = text_value("10000000C9A0F001");
    gone.null = 1;
    m_wwn.ChangeWWN(wwn_service(), port(), gone, text_value("20000000C9A0F001"), type(0), status, value);
    EXPECT_EQ(value.value, 32969u);
    EXPECT_THAT(words(), Contains("New WWPN has a null pointer"));
    m_wwn.ChangeWWN(wwn_service(), port(), text_value("10000000C9A0F001"), none<String>(), none<uint16>(), status,
                    value);
    EXPECT_EQ(value.value, 32969u);
    EXPECT_THAT(words(), Contains("New WWNN has a null pointer"));
}

// An exception ends the patience, and the last status stands.
TEST_F(ServiceMethods, OfNamesSurviveAnException)
{
    fault("call = \"RM_ChangeWWN\", status = 97");
    fault("call = \"RM_RestoreWWN\", status = 97");
    agent_sleep = [](uint64) { throw 1; };
    Property<uint16> status = none<uint16>();
    Property<uint32> value = none<uint32>();
    words();
    m_wwn.ChangeWWN(wwn_service(), port(), text_value("10000000C9A0F001"), text_value("20000000C9A0F001"), type(0),
                    status, value);
    EXPECT_EQ(value.value, 40097u);
    EXPECT_EQ(status.value, 65535);
    EXPECT_THAT(words(), contains_in_order({"Validating new WWNs...", "Error in RM_ChangeWWN",
                                            "ChanngeWWN: RM_ChangeWWN call failed with error: 97"}));
    EXPECT_EQ(nvrsim_calls("RM_ChangeWWN"), 2u);
    m_wwn.RestoreWWN(wwn_service(), port(), type(0), status, value);
    EXPECT_EQ(value.value, 0u);
    EXPECT_EQ(status.value, 65535);
    EXPECT_THAT(words(), contains_in_order({"Restoring WWNs...", "Error in RestoreWWN"}));
}

TEST_F(ServiceMethods, TellTheirReasonForAKeyThatIsMissing)
{
    HBA_WWN name = {};
    EXPECT_FALSE(portName(name, nullptr, "Some_Provider"));
    EXPECT_THAT(words(), Contains("Some_Provider::Id2HBAName failed"));
    EXPECT_EQ(deviceID(nullptr), nullptr);
    EXPECT_EQ(deviceID(boot_service()), nullptr);
    EXPECT_FALSE(isOfClass(nullptr, NVRHBA_FCPort::meta));
}

TEST_F(ServiceMethods, SomeAskForAnyServiceOfSeveral)
{
    const Instance_Map& services = agent().m_NVRHBA_SoftwareInstallationService_map;
    ASSERT_FALSE(services.empty());
    Ref<NVRHBA_SoftwareInstallationService> second(
        clone_as(static_cast<const NVRHBA_SoftwareInstallationService*>(services[0])));
    set(second->Name, "second");
    Ref<Instance> same(clone(second.get()));
    EXPECT_FALSE(isAnyService(services, same.get()));
    agent().m_NVRHBA_SoftwareInstallationService_map.insert(second.release());
    EXPECT_TRUE(isAnyService(services, same.get()));
    EXPECT_FALSE(isFirstService(services, same.get()));
    EXPECT_FALSE(isAnyService(services, port()));
    EXPECT_FALSE(isAnyService(services, nullptr));
}

TEST_F(ServiceMethods, OperationsOnBootCodeTellBadArguments)
{
    HBA_WWN name = {};
    ASSERT_TRUE(portName(name, first_wwpn, "test"));
    words();
    EXPECT_EQ(NVR_MethodWrapper::nvrcimGetBootBiosState(name, nullptr), 1u);
    EXPECT_THAT(words(), Contains("Null Pointer Assignment to argument biosState"));
    EXPECT_EQ(NVR_MethodWrapper::nvrcimSetBootBiosState(name, nullptr), 1u);
    EXPECT_THAT(words(), Contains("Null Pointer Assignment to argument CtrlWord"));
    EXPECT_EQ(NVR_MethodWrapper::nvrcimSetBootBiosState(name, "x"), 1u);
    EXPECT_THAT(words(), Contains("CtrlWord is  x"));
    EXPECT_EQ(NVR_MethodWrapper::nvrcimSetBootBiosState(name, ""), 1u);
    EXPECT_EQ(nvrsim_calls("RM_SetBootBiosState"), 0u);
    EXPECT_EQ(NVR_MethodWrapper::nvrcimSetBootBiosState(name, "e"), 0u);
    EXPECT_EQ(NVR_MethodWrapper::nvrcimSetBootBiosState(name, "DE"), 0u);
    EXPECT_EQ(nvrsim_calls("RM_SetBootBiosState"), 2u);
}

TEST_F(ServiceMethods, OfAPortRefuseMissingAndForeignInstances)
{
    NVRHBA_FCPort_Provider provider;
    for (const auto& [model, instance] :
         {std::pair<const Instance*, const Instance*>{nullptr, nullptr}, {port(), nullptr}, {nullptr, port()}}) {
        EXPECT_EQ(provider.modify_instance(model, instance), 102);
        EXPECT_THAT(words(), testing::IsSupersetOf({"NVRHBA_FCPort_Provider::modify_instance",
                                                    "NVRHBA_FCPort_Provider::modify_instance invalid parameter"}));
    }
    const Ref<NVRHBA_PortController> other = namesake();
    for (const bool empty : {false, true}) {
        Ref<NVRHBA_FCPort> known(clone_as(port()));
        if (empty) agent().m_NVRHBA_FCPort_map.clear();
        EXPECT_EQ(provider.modify_instance(other.get(), other.get()), 102);
        EXPECT_EQ(provider.modify_instance(known.get(), other.get()), 102);
        EXPECT_EQ(provider.modify_instance(other.get(), known.get()), 102);
        EXPECT_THAT(words(), Contains("Invalid instance of NVRHBA_FCPort Data"));
        if (empty) agent().m_NVRHBA_FCPort_map.insert(known.release());
    }
    EXPECT_EQ(nvrsim_calls("RM_DiagBeacon"), 0u);
}

TEST_F(ServiceMethods, OfAPortFailWhereItsKeyIsNoName)
{
    NVRHBA_FCPort* odd = publish("port one");
    Ref<NVRHBA_FCPort> wish(clone_as(odd));
    set(wish->LocationIndicator, 2);
    EXPECT_EQ(modify(wish.get()), 104);
    EXPECT_THAT(words(), Contains("NVRHBA_FCPort_Provider::::str2HBAName failed"));
    agent().m_NVRHBA_FCPort_map.clear();
    wish->DeviceID.null = 1;
    EXPECT_EQ(modify(wish.get()), 104);
    EXPECT_THAT(words(), Contains("NVRHBA_FCPort_Provider::Id2HBAName failed"));
    EXPECT_EQ(nvrsim_calls("RM_DiagBeacon"), 0u);
}

// The beacon is switched, but there is no port that could show it.
TEST_F(ServiceMethods, OfAPortFailWhereNoneIsPublished)
{
    Ref<NVRHBA_FCPort> wish(clone_as(port()));
    set(wish->LocationIndicator, 2);
    agent().m_NVRHBA_FCPort_map.clear();
    words();
    EXPECT_EQ(modify(wish.get()), 104);
    EXPECT_EQ(nvrsim_calls("RM_DiagBeacon"), 1u);
    const auto told = words();
    EXPECT_THAT(told, Contains("Successfully set the beacon state"));
    EXPECT_THAT(told, Not(Contains("Beacon state modified successfully")));
}

TEST_F(ServiceMethods, OfAPortChangeNothingWithoutTheProperty)
{
    Ref<NVRHBA_FCPort> model(clone_as(port()));
    Ref<NVRHBA_FCPort> wish(clone_as(port()));
    set(wish->LocationIndicator, 2);
    model->LocationIndicator.null = 1;
    EXPECT_EQ(NVRHBA_FCPort_Provider().modify_instance(model.get(), wish.get()), 102);
    model->LocationIndicator.null = 0;
    wish->LocationIndicator.null = 1;
    EXPECT_EQ(NVRHBA_FCPort_Provider().modify_instance(model.get(), wish.get()), 102);
    EXPECT_EQ(nvrsim_calls("RM_DiagBeacon"), 0u);
}

TEST_F(ServiceMethods, OfABeaconTellBadArguments)
{
    words();
    EXPECT_EQ(GetBeaconState(first_wwpn, nullptr), 32968u);
    EXPECT_THAT(words(), Contains("INVALID Parameter"));
    uint16 indicator = 77;
    EXPECT_EQ(GetBeaconState("none", &indicator), 32968u);
    EXPECT_THAT(words(), Contains("str2HBAName failed"));
    EXPECT_EQ(GetBeaconState(nullptr, &indicator), 32968u);
    EXPECT_THAT(words(), Contains("Id2HBAName failed"));
    EXPECT_EQ(indicator, 77);
    HBA_WWN name = {};
    ASSERT_TRUE(portName(name, first_wwpn, "test"));
    words();
    for (uint16 value : {0, 1, 4, 65535}) {
        EXPECT_EQ(SetBeaconState(name, value), 32968u);
        EXPECT_THAT(words(), ElementsAre("NVR_DiagTestFunc::SetBeaconState"));
    }
    EXPECT_EQ(SetBeaconState(name, 2), 0u);
    indicator = 0;
    EXPECT_EQ(GetBeaconState(first_wwpn, &indicator), 0u);
    EXPECT_EQ(indicator, 2);
}
