// The faces as a process meets them: by name, with their symbols, over one state.
#include "Sim.h"

#include <dlfcn.h>

#include <set>

namespace {

struct Library {
    explicit Library(const std::string& path) : handle(dlopen(path.c_str(), RTLD_NOW | RTLD_LOCAL)) {}
    ~Library() { close(); }
    Library(const Library&) = delete;
    Library& operator=(const Library&) = delete;
    void close()
    {
        if (handle) dlclose(handle);
        handle = nullptr;
    }
    template <class Function>
    Function* get(const char* name) const
    {
        return reinterpret_cast<Function*>(dlsym(handle, name));
    }
    bool has(const std::string& name) const { return dlsym(handle, name.c_str()) != nullptr; }
    void* handle;
};

const std::string lib = NVRSIM_LIB, variants = NVRSIM_VARIANTS;

#define NAME(result, name, missing, parameters, arguments) #name,
const char* const management[] = {NVR_MANAGEMENT_OPERATIONS(NAME)};
const char* const plain[] = {NVR_PLAIN_MANAGEMENT_OPERATIONS(NAME)};
const char* const common[] = {NVR_HBA_OPERATIONS(NAME)};
const char* const tags[] = {NVR_CPQFC_OPERATIONS(NAME)};
#undef NAME

} // namespace

TEST(Faces, EachCarriesItsFamiliesAndNoOther)
{
    const Library hba(lib + "/libHBAAPI.so"), lrm(lib + "/liblrmapi.so"), rm(lib + "/librmapi.so"),
        tssdm(lib + "/libtssdm.so");
    ASSERT_TRUE(hba.handle && lrm.handle && rm.handle && tssdm.handle);
    for (const char* name : management) {
        EXPECT_TRUE(lrm.has(std::string("L") + name)) << name;
        EXPECT_FALSE(lrm.has(name)) << name;
        EXPECT_TRUE(rm.has(name)) << name;
        EXPECT_FALSE(rm.has(std::string("L") + name)) << name;
    }
    for (const char* name : plain) {
        EXPECT_TRUE(lrm.has(name) && rm.has(name)) << name;
        EXPECT_FALSE(lrm.has(std::string("L") + name)) << name;
    }
    for (const char* name : common)
        EXPECT_TRUE(hba.has(name) && !rm.has(name)) << name;
    for (const char* name : tags)
        EXPECT_TRUE(tssdm.has(name) && !rm.has(name)) << name;
}

TEST(Faces, NamesAreTheirSonames)
{
    for (const char* name : {"libHBAAPI.so", "liblrmapi.so", "librmapi.so", "libtssdm.so"}) {
        const Library by_path(lib + "/" + name);
        void* by_name = dlopen(name, RTLD_NOW | RTLD_NOLOAD);
        EXPECT_EQ(by_path.handle, by_name) << name;
        if (by_name) dlclose(by_name);
    }
}

TEST(Faces, StateIsOneForAll)
{
    ASSERT_EQ(0, nvrsim_load_text("[[adapter]]", "test"));
    {
        const Library lrm(lib + "/liblrmapi.so");
        ASSERT_EQ(0u, lrm.get<RM_DiagBeacon_t>("LRM_DiagBeacon")(wire(port0), RM_BEACON_ON));
    }
    const Library rm(lib + "/librmapi.so");
    uint32_t state = 0;
    ASSERT_EQ(0u, rm.get<RM_DiagBeaconState_t>("RM_DiagBeaconState")(wire(port0), &state));
    EXPECT_EQ(unsigned(RM_BEACON_ON), state);
    EXPECT_EQ(1u, nvrsim_calls("RM_DiagBeacon"));
    EXPECT_EQ(1u, nvrsim_calls("RM_DiagBeaconState"));
    EXPECT_EQ(2u, nvrsim_calls(nullptr));
    EXPECT_EQ("RM_DiagBeacon 10000000C9A00001 0\nRM_DiagBeaconState 10000000C9A00001 0\n", sim_text(nvrsim_log));
    nvrsim_clear_log();
    EXPECT_EQ("", sim_text(nvrsim_log));
}

TEST(Faces, SecondChoiceAloneHasEverythingUnderPlainNames)
{
    const Library rm(variants + "/rmapi-only/librmapi.so");
    ASSERT_TRUE(rm.handle) << dlerror();
    for (const char* name : management)
        EXPECT_TRUE(rm.has(name) && !rm.has(std::string("L") + name)) << name;
    for (const char* name : common)
        EXPECT_TRUE(rm.has(name)) << name;
    for (const char* name : tags)
        EXPECT_TRUE(rm.has(name)) << name;
    for (const char* name : {"HBAAPI", "lrmapi", "tssdm"})
        EXPECT_EQ(nullptr, dlopen((variants + "/rmapi-only/lib" + name + ".so").c_str(), RTLD_NOW)) << name;
}

TEST(Faces, VariantLacksWhatItsLineSaysAndOnlyThat)
{
    const Library lrm(variants + "/lrm-without-LRM_GetVPD/liblrmapi.so");
    ASSERT_TRUE(lrm.handle) << dlerror();
    EXPECT_FALSE(lrm.has("LRM_GetVPD"));
    for (const char* name : management)
        if (std::string(name) != "RM_GetVPD") {
            EXPECT_TRUE(lrm.has(std::string("L") + name)) << name;
        }
    const Library rm(variants + "/lrm-without-LRM_GetVPD/librmapi.so");
    EXPECT_TRUE(rm.has("RM_GetVPD"));
    const Library empty(variants + "/hba-without-symbols/libHBAAPI.so");
    ASSERT_TRUE(empty.handle) << dlerror();
    for (const char* name : common)
        EXPECT_FALSE(empty.has(name)) << name;
    const Library unloaded(variants + "/hba-without-load/libHBAAPI.so");
    EXPECT_FALSE(unloaded.has("HBA_LoadLibrary"));
    EXPECT_TRUE(unloaded.has("HBA_OpenAdapter"));
}

TEST(Faces, HostWithoutLibrariesHasNone)
{
    for (const char* name : {"HBAAPI", "lrmapi", "rmapi", "tssdm"})
        EXPECT_EQ(nullptr, dlopen((variants + "/nothing/lib" + name + ".so").c_str(), RTLD_NOW)) << name;
}
