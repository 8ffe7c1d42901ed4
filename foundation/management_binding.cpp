#include "foundation/management_binding.h"

#include <cstring>
#include <dlfcn.h>
#include <string>
#include <type_traits>

#include "foundation/library_closing.h"

namespace cimple {

namespace {

std::atomic<void*> slots[number_of_slots];

std::atomic<bool> keptMapped{false};

std::atomic<bool> hbaApiMissing{false};
std::atomic<bool> lrmApiMissing{false};
std::atomic<bool> rmApiMissing{false};
std::atomic<bool> sdmMissing{false};

// A closed slot knows no symbol. (A null handle would make dlsym search the whole process, and find the functions of
// whoever else is linked against a library of these names.)
void* look_up(LibrarySlot slot, const char* symbol)
{
    void* library = slots[slot];
    return library ? ::dlsym(library, symbol) : nullptr;
}

// The vendor-neutral library finds no adapter before it is told to load its vendors' libraries. Its result, and its
// absence in a library that needs no such call, are no fault.
void call_if_there(const char* symbol)
{
    if (void* function = look_up(SLOT_HBAAPI, symbol)) reinterpret_cast<HBA_LoadLibrary_t*>(function)();
}

// Where a family's symbols are, and the flag that says that they are not.
struct Place {
    LibrarySlot library;
    const std::atomic<bool>& missing;
};

Place place_of(Family family)
{
    switch (family) {
    case Family::hba:
        return {SLOT_HBAAPI, hbaApiMissing};
    case Family::cpqfc:
        return {SLOT_TSSDM, sdmMissing};
    default:
        return {SLOT_LRMAPI, lrmApiMissing};
    }
}

} // namespace

int loadLibrary(LibrarySlot slot, const char* name)
{
    if (slots[slot]) return 1;
    const std::string file = std::string("lib") + name + ".so";
    void* library = ::dlopen(file.c_str(), RTLD_NOW);
    if (!library) return 0;
    slots[slot] = library;
    if (slot == SLOT_HBAAPI) call_if_there("HBA_LoadLibrary");
    return 1;
}

static int open_libraries()
{
    if (!loadLibrary(SLOT_HBAAPI, "HBAAPI")) hbaApiMissing = true;
    int result = 0;
    if (!loadLibrary(SLOT_TSSDM, "tssdm")) {
        sdmMissing = true;
        result = 1;
    }
    if (loadLibrary(SLOT_LRMAPI, "lrmapi")) return result;
    lrmApiMissing = true;
    if (loadLibrary(SLOT_RMAPI, "rmapi")) return 1; // all works, yet the log is to tell
    rmApiMissing = true;
    return result;
}

int loadLibraries()
{
    struct Watch {
        ~Watch() { watchExit(); } // also after a library that throws as it is loaded
    };
    const Watch watch;
    return open_libraries();
}

void* ForwardName::resolve()
{
    if (m_family == Family::cpqfc_close) {
        if (rmApiMissing) return nullptr;
        void* library = slots[SLOT_RMAPI];
        return ::dlsym(library ? library : RTLD_DEFAULT, m_name);
    }
    const Place place = place_of(m_family);
    // A management operation is known by its name with an L in front, and only in the second-choice library also
    // without.
    char long_name[64] = "L";
    std::strncat(long_name, m_name, sizeof long_name - 2);
    const char* const first_name = m_family == Family::management ? long_name : m_name;
    if (place.missing) {
        if (rmApiMissing) return nullptr;
        void* symbol = look_up(SLOT_RMAPI, first_name);
        if (!symbol && m_family == Family::management) symbol = look_up(SLOT_RMAPI, m_name);
        m_symbol = symbol; // looked up on every call: this library may lack what a later one has
        return symbol;
    }
    void* symbol = m_symbol;
    if (!symbol) m_symbol = symbol = look_up(place.library, first_name);
    return symbol;
}

#define NVR_DEFINE_FORWARD(family, result, name, missing)                                                              \
    Forward<name##_t> name{family, #name, []() -> result { return missing; }};
#define NVR_DEFINE_MANAGEMENT(result, name, missing, parameters, arguments)                                            \
    NVR_DEFINE_FORWARD(Family::management, result, name, missing)
#define NVR_DEFINE_PLAIN_MANAGEMENT(result, name, missing, parameters, arguments)                                      \
    NVR_DEFINE_FORWARD(Family::plain_management, result, name, missing)
#define NVR_DEFINE_HBA(result, name, missing, parameters, arguments)                                                   \
    NVR_DEFINE_FORWARD(Family::hba, result, name, missing)
#define NVR_DEFINE_CPQFC(result, name, missing, parameters, arguments)                                                 \
    NVR_DEFINE_FORWARD(std::is_void_v<result> ? Family::cpqfc_close : Family::cpqfc, result, name, missing)
NVR_MANAGEMENT_OPERATIONS(NVR_DEFINE_MANAGEMENT)
NVR_PLAIN_MANAGEMENT_OPERATIONS(NVR_DEFINE_PLAIN_MANAGEMENT)
NVR_HBA_OPERATIONS(NVR_DEFINE_HBA)
NVR_CPQFC_OPERATIONS(NVR_DEFINE_CPQFC)

int unloadLibraries()
{
    {
        const bool kept = keptMapped;
        const Library_Closing closing; // the common library closes its vendors' libraries when it is freed
        if (slots[SLOT_HBAAPI] && !kept && closing.allowed()) call_if_there("HBA_FreeLibrary");
        for (std::atomic<void*>& slot : slots)
            if (void* library = slot.exchange(nullptr); library && !kept) closeLibrary(library);
        forgetExit();
    }
#define NVR_FORGET(result, name, missing, parameters, arguments) name.m_symbol = nullptr;
    NVR_MANAGEMENT_OPERATIONS(NVR_FORGET)
    NVR_PLAIN_MANAGEMENT_OPERATIONS(NVR_FORGET)
    NVR_HBA_OPERATIONS(NVR_FORGET)
    NVR_CPQFC_OPERATIONS(NVR_FORGET)
#undef NVR_FORGET
    hbaApiMissing = lrmApiMissing = rmApiMissing = sdmMissing = false;
    return 0;
}

void keepLibrariesMapped(bool keep)
{
    keptMapped = keep;
}

StatusText::StatusText(uint32 status)
{
    RM_StatusString(status, m_text, RM_STATUS_TEXT_SIZE);
    m_text[RM_STATUS_TEXT_SIZE - 1] = '\0';
}

} // namespace cimple
