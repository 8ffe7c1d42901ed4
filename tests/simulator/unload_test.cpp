// A process that knows the libraries only by dlopen, as the module does: what remains when every face is closed.
#include "foundation/management_api.h"

#include <gtest/gtest.h>

#include <dlfcn.h>

namespace {

template <class Function>
Function* get(void* library, const char* name)
{
    return reinterpret_cast<Function*>(dlsym(library, name));
}

int lastType = 0;
void hear(void*, HBA_WWN, HBA_UINT32 type, HBA_UINT32)
{
    lastType = static_cast<int>(type);
}

} // namespace

TEST(Unload, StateEventsAndCodeOutliveEveryFace)
{
    const HBA_WWN port = {{0x10, 0, 0, 0, 0xC9, 0xA0, 0, 1}};
    ASSERT_EQ(nullptr, dlopen("libnvrsim_core.so", RTLD_NOW | RTLD_NOLOAD)) << "not linked to this program";

    void* hba = dlopen(NVRSIM_LIB "/libHBAAPI.so", RTLD_NOW | RTLD_LOCAL);
    ASSERT_NE(nullptr, hba) << dlerror();
    void* core = dlopen("libnvrsim_core.so", RTLD_NOW | RTLD_NOLOAD);
    ASSERT_NE(nullptr, core) << "brought in by the face";
    auto* load = get<int(const char*, const char*)>(core, "nvrsim_load_text");
    auto* event = get<int(const char*, uint32_t, uint32_t)>(core, "nvrsim_event");
    auto* drain = get<void()>(core, "nvrsim_drain_events");
    auto* fault = get<int(const char*)>(core, "nvrsim_fault");
    ASSERT_TRUE(load && event && drain && fault);
    dlclose(core);

    ASSERT_EQ(0, load("[[adapter]]", "test"));
    char name[256];
    ASSERT_EQ(0u, get<HBA_GetAdapterName_t>(hba, "HBA_GetAdapterName")(0, name));
    const HBA_HANDLE handle = get<HBA_OpenAdapter_t>(hba, "HBA_OpenAdapter")(name);
    HBA_CALLBACKHANDLE callback = nullptr;
    ASSERT_EQ(0u, get<HBA_RegisterForAdapterPortEvents_t>(hba, "HBA_RegisterForAdapterPortEvents")(
                      hear, nullptr, handle, port, &callback));
    void* lrm = dlopen(NVRSIM_LIB "/liblrmapi.so", RTLD_NOW | RTLD_LOCAL);
    ASSERT_NE(nullptr, lrm) << dlerror();
    ASSERT_EQ(0u, get<RM_DiagBeacon_t>(lrm, "LRM_DiagBeacon")(port, RM_BEACON_ON));
    ASSERT_EQ(0, dlclose(lrm));
    ASSERT_EQ(0, dlclose(hba));
    EXPECT_EQ(nullptr, dlopen(NVRSIM_LIB "/libHBAAPI.so", RTLD_NOW | RTLD_NOLOAD)) << "the face itself is gone";

    EXPECT_EQ(1, event("0", 514, 0));
    drain();
    EXPECT_EQ(514, lastType);

    void* rm = dlopen(NVRSIM_LIB "/librmapi.so", RTLD_NOW | RTLD_LOCAL);
    ASSERT_NE(nullptr, rm) << dlerror();
    uint32_t state = 0;
    ASSERT_EQ(0u, get<RM_DiagBeaconState_t>(rm, "RM_DiagBeaconState")(port, &state));
    EXPECT_EQ(unsigned(RM_BEACON_ON), state);
    ASSERT_GT(fault("call = 'RM_DiagBeaconState', status = 63"), 0);
    EXPECT_EQ(63u, get<RM_DiagBeaconState_t>(rm, "RM_DiagBeaconState")(port, &state));
    EXPECT_EQ(0, dlclose(rm));
}
