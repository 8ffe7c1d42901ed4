// A libcurl that counts and fails, and otherwise goes to the system's own. Those that lack an entry hide it at their
// link.
#include "tests/support/curl_stand_in.h"

#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <dlfcn.h>
#include <stdexcept>

#define ENTRY extern "C" __attribute__((visibility("default")))

ENTRY nvrtest::Curl_Stand_In curl_stand_in;
nvrtest::Curl_Stand_In curl_stand_in;

namespace {

// Opened with this library, before its user makes its entries global: the system's would call those then.
void* const library = ::dlopen(NVR_SYSTEM_CURL, RTLD_NOW | RTLD_LOCAL);

template <class Signature>
Signature* real(const char* name)
{
    void* const entry = library ? ::dlsym(library, name) : nullptr;
    if (!entry) std::abort();
    return reinterpret_cast<Signature*>(entry);
}

bool is_text(int option)
{
    return option == 10002 || option == 10005;
}

void note(int option, long long value, const char* text)
{
    if (curl_stand_in.options_set == curl_stand_in.most_options) return;
    auto& noted = curl_stand_in.options[curl_stand_in.options_set++];
    noted.number = option;
    noted.value = value;
    std::snprintf(noted.text, sizeof noted.text, "%s", text);
}

} // namespace

ENTRY char* curl_version()
{
    return real<char*()>("curl_version")();
}

ENTRY int curl_global_init(long features)
{
    curl_stand_in.global_inits++;
    curl_stand_in.features = features;
    if (curl_stand_in.global_init_code) return curl_stand_in.global_init_code;
    return real<int(long)>("curl_global_init")(features);
}

ENTRY void* curl_easy_init()
{
    if (curl_stand_in.refuses_handle) return nullptr;
    curl_stand_in.handles++;
    return curl_stand_in.handle = real<void*()>("curl_easy_init")();
}

ENTRY int curl_easy_setopt(void* handle, int option, ...)
{
    // The kind of the value is told by the number's thousands.
    va_list arguments;
    va_start(arguments, option);
    const bool is_pointer = option >= 10000 && option < 30000;
    void* const pointer = is_pointer ? va_arg(arguments, void*) : nullptr;
    const long long number = option >= 30000 ? va_arg(arguments, long long) : is_pointer ? 0 : va_arg(arguments, long);
    va_end(arguments);
    note(option, is_pointer ? pointer != nullptr : number, is_text(option) ? static_cast<const char*>(pointer) : "");
    if (option == curl_stand_in.failing_option && --curl_stand_in.failing_option_use == 0)
        return curl_stand_in.failing_code;
    auto* const set = real<int(void*, int, ...)>("curl_easy_setopt");
    if (option >= 30000) return set(handle, option, number);
    return is_pointer ? set(handle, option, pointer) : set(handle, option, static_cast<long>(number));
}

ENTRY int curl_easy_perform(void* handle)
{
    curl_stand_in.performed++;
    if (curl_stand_in.throws) throw std::runtime_error("the library throws");
    if (curl_stand_in.perform_code) return curl_stand_in.perform_code;
    return real<int(void*)>("curl_easy_perform")(handle);
}

ENTRY void curl_easy_cleanup(void* handle)
{
    curl_stand_in.handles_ended++;
    real<void(void*)>("curl_easy_cleanup")(handle);
}

ENTRY void curl_global_cleanup()
{
    curl_stand_in.global_cleanups++;
    real<void()>("curl_global_cleanup")();
}
